// Shared resources end to end: every file operation of a mount point with success and refused, and
// the paths that must never leave the resource's directory.

#include <filesystem>

#include <unistd.h>

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

class SharedResources : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        session = &client.session();
        area = client.area("DATA");
        ASSERT_NE(area, nullptr);
        writeFile(local("src.txt"), "twelve bytes");
    }

    void TearDown() override
    {
        if (session == nullptr)
            return;
        for (IZELServerPath* path : paths)
            area->releaseObject(path);
        session->destroyMountPoint(&area);
    }

    const IZELServerPath& path(const std::string& whole)
    {
        paths.push_back(area->createPath(client.text(whole)));
        return *paths.back();
    }
    const IZELServerPath& path(const std::string& directory, const std::string& name)
    {
        paths.push_back(area->createPath(client.text(directory), client.text(name)));
        return *paths.back();
    }

    unsigned upload(const IZELServerPath& to)
    {
        return client.take(area->upload(client.text(local("src.txt")), to, nullptr));
    }
    // The "received" flag of a download to the local file `name`, -1 when it failed.
    long download(const IZELServerPath& from, const std::string& name)
    {
        return client.flag([&](unsigned& f) { return area->download(from, client.text(local(name)), f, nullptr); });
    }

    std::string onDisk(const std::string& relative) const { return local("shared/" + relative); }

    Client client;
    IZELServerSession* session = nullptr;
    IZELServerMountPoint* area = nullptr;
    std::vector<IZELServerPath*> paths;
};

TEST_F(SharedResources, TheManagerListsAndLooksUpResources)
{
    IZELServerMountPointManager* manager = session->getMountPointManager();
    auto all = client.own(session->createMountPointVector(), &Session::destroyMountPointVector);
    ASSERT_EQ(client.take(manager->getSharedResources(*all)), 0u) << client.lastMessage();
    ASSERT_EQ(all->entries(), 1u);
    IZELServerString& name = client.text();
    all->element(0)->getName(name);
    EXPECT_STREQ(name.c_str(), "DATA");
    auto unknown = client.own(session->createMountPoint(), &Session::destroyMountPoint);
    IZELServerString& nope = client.text("NOPE");
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->getSharedResource(nope, *unknown, f); }), 0);
}

TEST_F(SharedResources, FileOperationsSucceedInsideTheResource)
{
    ASSERT_EQ(client.take(area->makeDirectory(path("/a/b"))), 0u) << client.lastMessage();
    ASSERT_EQ(upload(path("/a/b", "f.txt")), 0u) << client.lastMessage();
    EXPECT_EQ(readAll(onDisk("a/b/f.txt")), "twelve bytes");
    EXPECT_EQ(client.flag([&](unsigned& f) { return area->exists(path("/a/b/f.txt"), f); }), 1);
    auto info = client.own(session->createFileInfo(), &Session::destroyFileInfo);
    EXPECT_EQ(client.take(area->getFileInfo(path("/a/b/f.txt"), *info)), 0u) << client.lastMessage();
    EXPECT_FALSE(info->isDirectory());
    EXPECT_EQ(info->getSize(), 12u);

    EXPECT_EQ(client.take(area->copy(path("/a/b/f.txt"), path("/a/g.txt"))), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(area->move(path("/a/g.txt"), path("/h.txt"))), 0u) << client.lastMessage();
    auto entries = client.own(session->createFileInfoVector(), &Session::destroyFileInfoVector);
    EXPECT_EQ(client.take(area->list(path("/"), 2, *entries)), 0u) << client.lastMessage();
    std::vector<std::string> names;
    for (unsigned i = 0; i < entries->entries(); ++i) {
        IZELServerString& whole = client.text();
        IZELServerString& name = client.text();
        entries->element(i)->getPath().getAbsolutePath(whole);
        entries->element(i)->getPath().getName(name);
        names.push_back(std::string(whole.c_str()) + " " + name.c_str());
    }
    // The server writes entry paths in its relative form, and the library keeps them as written.
    EXPECT_EQ(names, (std::vector<std::string>{"a a", "a/b b", "a/b/f.txt f.txt", "h.txt h.txt"}));

    EXPECT_EQ(download(path("/h.txt"), "back.txt"), 1);
    EXPECT_EQ(readAll(local("back.txt")), "twelve bytes");
    EXPECT_EQ(client.flag([&](unsigned& f) { return area->remove(path("/a"), f); }), 1);
    EXPECT_FALSE(std::filesystem::exists(onDisk("a")));
}

TEST_F(SharedResources, FileOperationsOnMissingEntriesAreRefused)
{
    EXPECT_EQ(upload(path("/no/dir", "f.txt")), kRefused);
    EXPECT_EQ(client.take(area->copy(path("/none.txt"), path("/x.txt"))), kRefused);
    EXPECT_EQ(client.take(area->move(path("/none.txt"), path("/x.txt"))), kRefused);
    auto info = client.own(session->createFileInfo(), &Session::destroyFileInfo);
    EXPECT_NE(client.take(area->getFileInfo(path("/none.txt"), *info)), 0u);
    auto entries = client.own(session->createFileInfoVector(), &Session::destroyFileInfoVector);
    EXPECT_NE(client.take(area->list(path("/none"), *entries)), 0u);

    EXPECT_EQ(client.flag([&](unsigned& f) { return area->exists(path("/none.txt"), f); }), 0);
    EXPECT_EQ(client.flag([&](unsigned& f) { return area->remove(path("/none.txt"), f); }), 0);
    writeFile(local("kept.txt"), "kept");
    EXPECT_EQ(download(path("/none.txt"), "kept.txt"), -1);
    EXPECT_EQ(readAll(local("kept.txt")), "kept") << "a failed download leaves the target alone";
    EXPECT_EQ(client.take(area->makeDirectory(path("/ok"))), 0u);
    EXPECT_EQ(client.take(area->copy(path("/ok"), path("/ok"))), kRefused) << "a directory copy needs a new name";
}

// Every operation that names one of these paths is refused before the server touches its disk.
TEST_F(SharedResources, PathsLeavingTheResourceAreRefused)
{
    std::filesystem::create_directories(local("outside"));
    writeFile(local("outside/secret.txt"), "secret");
    ASSERT_EQ(::symlink(local("outside").c_str(), onDisk("escape").c_str()), 0);

    // Directory and name are sent as given: a whole path would be rooted at the resource ("/C:\\x"),
    // which the server rightly treats as a name inside it.
    const std::vector<std::pair<std::string, std::string>> attacks = {
        {"/..", "outside/secret.txt"}, {"/a/../..", "x"}, {"//host/share", "x"},
        {"\\\\host\\share", "x"},      {"C:", "x"},       {"C:\\", "x"},
        {"/escape", "secret.txt"}};
    for (const auto& [directory, name] : attacks) {
        SCOPED_TRACE(directory + " " + name);
        const IZELServerPath& target = path(directory, name);
        unsigned flag = 7;
        EXPECT_EQ(client.take(area->exists(target, flag)), kRefused);
        EXPECT_EQ(upload(target), kRefused);
        EXPECT_EQ(client.take(area->makeDirectory(target)), kRefused);
        EXPECT_EQ(client.take(area->remove(target, flag)), kRefused);
        EXPECT_EQ(client.take(area->copy(target, path("/stolen.txt"))), kRefused);
        EXPECT_EQ(download(target, "stolen.txt"), -1);
    }
    EXPECT_EQ(readAll(local("outside/secret.txt")), "secret");
    EXPECT_EQ(readAll(local("stolen.txt")), "");
    EXPECT_FALSE(std::filesystem::exists(onDisk("stolen.txt")));

    auto entries = client.own(session->createFileInfoVector(), &Session::destroyFileInfoVector);
    EXPECT_EQ(client.take(area->list(path("/"), *entries)), 0u);
    EXPECT_EQ(entries->entries(), 0u) << "the link pointing outside is not listed";
}

}  // namespace
}  // namespace zeltest
