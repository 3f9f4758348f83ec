// Shared resources end to end: every file operation of a mount point once with success and once
// refused, and the paths that must never leave the resource's directory.

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

    std::string onDisk(const std::string& relative) const { return local("shared/" + relative); }

    Client client;
    IZELServerSession* session = nullptr;
    IZELServerMountPoint* area = nullptr;
    std::vector<IZELServerPath*> paths;
};

TEST_F(SharedResources, TheManagerListsAndLooksUpResources)
{
    IZELServerVector<IZELServerMountPoint>* all = session->createMountPointVector();
    ASSERT_EQ(client.take(session->getMountPointManager()->getSharedResources(*all)), 0u) << client.lastMessage();
    ASSERT_EQ(all->entries(), 1u);
    IZELServerString& name = client.text();
    all->element(0)->getName(name);
    EXPECT_STREQ(name.c_str(), "DATA");
    session->destroyMountPointVector(&all);

    IZELServerMountPoint* unknown = session->createMountPoint();
    unsigned found = 1;
    EXPECT_EQ(client.take(session->getMountPointManager()->getSharedResource(client.text("NOPE"), *unknown, found)), 0u);
    EXPECT_EQ(found, 0u);
    session->destroyMountPoint(&unknown);
}

TEST_F(SharedResources, FileOperationsSucceedInsideTheResource)
{
    ASSERT_EQ(client.take(area->makeDirectory(path("/a/b"))), 0u) << client.lastMessage();
    writeFile(local("src.txt"), "twelve bytes");
    ASSERT_EQ(client.take(area->upload(client.text(local("src.txt")), path("/a/b", "f.txt"), nullptr)), 0u)
        << client.lastMessage();
    EXPECT_EQ(readAll(onDisk("a/b/f.txt")), "twelve bytes");

    unsigned present = 0;
    EXPECT_EQ(client.take(area->exists(path("/a/b/f.txt"), present)), 0u);
    EXPECT_EQ(present, 1u);
    IZELServerFileInfo* info = session->createFileInfo();
    EXPECT_EQ(client.take(area->getFileInfo(path("/a/b/f.txt"), *info)), 0u) << client.lastMessage();
    EXPECT_FALSE(info->isDirectory());
    EXPECT_EQ(info->getSize(), 12u);
    session->destroyFileInfo(&info);

    EXPECT_EQ(client.take(area->copy(path("/a/b/f.txt"), path("/a/g.txt"))), 0u) << client.lastMessage();
    EXPECT_EQ(client.take(area->move(path("/a/g.txt"), path("/h.txt"))), 0u) << client.lastMessage();
    IZELServerVector<IZELServerFileInfo>* entries = session->createFileInfoVector();
    EXPECT_EQ(client.take(area->list(path("/"), 2, *entries)), 0u) << client.lastMessage();
    std::vector<std::string> names;
    for (unsigned i = 0; i < entries->entries(); ++i) {
        IZELServerString& whole = client.text();
        entries->element(i)->getPath().getAbsolutePath(whole);
        names.push_back(whole.c_str());
    }
    // The server writes entry paths in its relative form, and the library keeps them as written.
    EXPECT_EQ(names, (std::vector<std::string>{"a", "a/b", "a/b/f.txt", "h.txt"}));
    session->destroyFileInfoVector(&entries);

    unsigned received = 0;
    EXPECT_EQ(client.take(area->download(path("/h.txt"), client.text(local("back.txt")), received, nullptr)), 0u);
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(readAll(local("back.txt")), "twelve bytes");

    unsigned removed = 0;
    EXPECT_EQ(client.take(area->remove(path("/a"), removed)), 0u);
    EXPECT_EQ(removed, 1u);
    EXPECT_FALSE(std::filesystem::exists(onDisk("a")));
}

TEST_F(SharedResources, FileOperationsOnMissingEntriesAreRefused)
{
    writeFile(local("src.txt"), "x");
    EXPECT_EQ(client.take(area->upload(client.text(local("src.txt")), path("/no/dir", "f.txt"), nullptr)), 393625u);
    EXPECT_EQ(client.take(area->copy(path("/none.txt"), path("/x.txt"))), 393625u);
    EXPECT_EQ(client.take(area->move(path("/none.txt"), path("/x.txt"))), 393625u);
    IZELServerFileInfo* info = session->createFileInfo();
    EXPECT_NE(client.take(area->getFileInfo(path("/none.txt"), *info)), 0u);
    session->destroyFileInfo(&info);
    IZELServerVector<IZELServerFileInfo>* entries = session->createFileInfoVector();
    EXPECT_NE(client.take(area->list(path("/none"), *entries)), 0u);
    session->destroyFileInfoVector(&entries);

    unsigned flag = 1;
    EXPECT_EQ(client.take(area->exists(path("/none.txt"), flag)), 0u);
    EXPECT_EQ(flag, 0u);
    flag = 1;
    EXPECT_EQ(client.take(area->remove(path("/none.txt"), flag)), 0u);
    EXPECT_EQ(flag, 0u);
    writeFile(local("kept.txt"), "kept");
    flag = 1;
    EXPECT_EQ(client.take(area->download(path("/none.txt"), client.text(local("kept.txt")), flag, nullptr)), 0u);
    EXPECT_EQ(flag, 0u);
    EXPECT_EQ(client.take(area->makeDirectory(path("/ok"))), 0u);
    EXPECT_EQ(client.take(area->copy(path("/ok"), path("/ok"))), 393625u) << "a directory copy needs a new name";
}

// Every operation that names one of these paths is refused before the server touches its disk.
TEST_F(SharedResources, PathsLeavingTheResourceAreRefused)
{
    std::filesystem::create_directories(local("outside"));
    writeFile(local("outside/secret.txt"), "secret");
    ASSERT_EQ(::symlink(local("outside").c_str(), onDisk("escape").c_str()), 0);
    writeFile(local("src.txt"), "attack");

    // Directory and name are sent as given: a whole path would be rooted at the resource ("/C:\\x"),
    // which the server rightly treats as a name inside it.
    const std::vector<std::pair<std::string, std::string>> attacks = {
        {"/..", "outside/secret.txt"}, {"/a/../..", "x"}, {"//host/share", "x"}, {"\\\\host\\share", "x"},
        {"C:", "x"}, {"C:\\", "x"}, {"/escape", "secret.txt"}};
    for (const auto& [directory, name] : attacks) {
        SCOPED_TRACE(directory + " " + name);
        const IZELServerPath& target = path(directory, name);
        unsigned flag = 7;
        EXPECT_EQ(client.take(area->exists(target, flag)), 393625u);
        EXPECT_EQ(client.take(area->upload(client.text(local("src.txt")), target, nullptr)), 393625u);
        EXPECT_EQ(client.take(area->makeDirectory(target)), 393625u);
        EXPECT_EQ(client.take(area->remove(target, flag)), 393625u);
        EXPECT_EQ(client.take(area->copy(target, path("/stolen.txt"))), 393625u);
        flag = 7;
        EXPECT_EQ(client.take(area->download(target, client.text(local("stolen.txt")), flag, nullptr)), 0u);
        EXPECT_EQ(flag, 0u);
    }
    EXPECT_EQ(readAll(local("outside/secret.txt")), "secret");
    EXPECT_EQ(readAll(local("stolen.txt")), "");
    EXPECT_FALSE(std::filesystem::exists(onDisk("stolen.txt")));

    IZELServerVector<IZELServerFileInfo>* entries = session->createFileInfoVector();
    EXPECT_EQ(client.take(area->list(path("/"), *entries)), 0u);
    EXPECT_EQ(entries->entries(), 0u) << "the link pointing outside is not listed";
    session->destroyFileInfoVector(&entries);
}

}  // namespace
}  // namespace zeltest
