// Shared resources end to end: every file operation of a mount point with its success and its
// refusal. Paths that must never leave the resource's directory are the server suite's to check.

#include <filesystem>

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

class SharedResources : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        area = client.area("DATA");
        ASSERT_NE(area, nullptr);
        spew(local("src.txt"), "twelve bytes");
        spew(local("kept.txt"), "kept");
    }

    void TearDown() override
    {
        for (IZELServerPath* path : paths)
            area->releaseObject(path);
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

    Operation upload(const IZELServerPath& to)
    {
        return [this, &to](unsigned&) { return area->upload(client.text(local("src.txt")), to, nullptr); };
    }
    // A download to the local file `name`, which must then hold `content`.
    Operation download(const IZELServerPath& from, const std::string& name, const std::string& content)
    {
        return checking(
            [this, &from, name](unsigned& f) { return area->download(from, client.text(local(name)), f, nullptr); },
            [this, name, content] { return slurp(local(name)) == content; });
    }

    Client client;
    ZELServerOwned<IZELServerMountPoint> area;
    std::vector<IZELServerPath*> paths;
};

TEST_F(SharedResources, EveryFileOperationSucceedsAndIsRefused)
{
    IZELServerSession& s = client.session();
    IZELServerMountPointManager* manager = s.getMountPointManager();
    auto all = client.own(s.createMountPointVector());
    auto unknown = client.own(s.createMountPoint());
    auto info = client.own(s.createFileInfo());
    auto entries = client.own(s.createFileInfoVector());
    // The whole path and the name of each entry listed.
    auto listed = [&] {
        std::vector<std::string> names;
        for (unsigned i = 0; i < entries->entries(); ++i) {
            IZELServerString& whole = client.text();
            IZELServerString& name = client.text();
            entries->element(i)->getPath().getAbsolutePath(whole);
            entries->element(i)->getPath().getName(name);
            names.push_back(std::string(whole.c_str()) + " " + name.c_str());
        }
        return names;
    };
    client.run({
        {"list the resources", counting(*all, [&] { return manager->getSharedResources(*all); }), 1},
        {"an unknown resource",
         [&](unsigned& f) { return manager->getSharedResource(client.text("NOPE"), *unknown, f); }, 0},
        {"make a directory", [&](unsigned&) { return area->makeDirectory(path("/a/b")); }, kUntouched},
        {"upload", upload(path("/a/b", "f.txt")), kUntouched},
        {"upload into a missing directory", upload(path("/no/dir", "f.txt")), kDenied},
        {"exists", [&](unsigned& f) { return area->exists(path("/a/b/f.txt"), f); }, 1},
        {"does not exist", [&](unsigned& f) { return area->exists(path("/none.txt"), f); }, 0},
        {"describe",
         checking([&](unsigned&) { return area->getFileInfo(path("/a/b/f.txt"), *info); },
                  [&] { return !info->isDirectory() && info->getSize() == 12; }),
         kUntouched},
        {"describe a missing file", [&](unsigned&) { return area->getFileInfo(path("/none.txt"), *info); }, kDenied},
        {"copy", [&](unsigned&) { return area->copy(path("/a/b/f.txt"), path("/a/g.txt")); }, kUntouched},
        {"copy a missing file", [&](unsigned&) { return area->copy(path("/none.txt"), path("/x.txt")); }, kDenied},
        {"copy a directory onto itself", [&](unsigned&) { return area->copy(path("/a"), path("/a")); }, kDenied},
        {"move", [&](unsigned&) { return area->move(path("/a/g.txt"), path("/h.txt")); }, kUntouched},
        {"move a missing file", [&](unsigned&) { return area->move(path("/none.txt"), path("/x.txt")); }, kDenied},
        // The server writes entry paths in its relative form, and the library keeps them as written.
        {"list two levels",
         checking([&](unsigned&) { return area->list(path("/"), 2, *entries); },
                  [&] {
                      return listed() == std::vector<std::string>{"a a", "a/b b", "a/b/f.txt f.txt", "h.txt h.txt"};
                  }),
         kUntouched},
        {"list a missing directory", [&](unsigned&) { return area->list(path("/none"), *entries); }, kDenied},
        {"download", download(path("/h.txt"), "back.txt", "twelve bytes"), 1},
        {"download a missing file, keeping the destination", download(path("/none.txt"), "kept.txt", "kept"), kDenied},
        {"remove", [&](unsigned& f) { return area->remove(path("/a"), f); }, 1},
        {"remove a missing entry", [&](unsigned& f) { return area->remove(path("/a"), f); }, 0},
    });
    EXPECT_FALSE(std::filesystem::exists(local("shared/a")));
}

}  // namespace
}  // namespace zeltest
