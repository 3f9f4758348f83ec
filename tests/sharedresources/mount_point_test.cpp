// Shared resources on the wire: every "SR_" command of a mount point and of the manager byte for
// byte, the out values after refusals and failures, the listing walk with its depth and its bound,
// and the download into the system's temporary folder when no target is named.

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerMountPoint.h"
#include "sharedresources/ZELServerMountPointManager.h"
#include "sharedresources/shared_resource_readers.h"
#include "sharedresources/sharedresources_factories.h"
#include "support/environment.h"
#include "support/platform.h"
#include "support/wire_table.h"

namespace zel {
namespace {

namespace fs = std::filesystem;
using namespace zeltest;
using Entries = ZELServerVector<IZELServerFileInfo, ZELServerFileInfo>;
using MountPoints = ZELServerVector<IZELServerMountPoint, ZELServerMountPoint>;

ZELServerString S(const std::string& text) { return ZELServerString(text); }

// A listing answer: one entry per (type, name) in `directory`.
Bytes listing(const std::string& directory, const std::vector<std::pair<std::string, std::string>>& entries)
{
    std::string body;
    for (const auto& [type, name] : entries) {
        body += R"(<FILEINFO filetype=")" + type + R"(" size="1"><PATH name=")" + name + R"(" dirpath=")" + directory +
                R"(" abspath=")" + directory + "/" + name + R"("/></FILEINFO>)";
    }
    return reply("SUCCESS", "<SR_LIST>" + body + "</SR_LIST>");
}

class MountPointTest : public WireTableTest {
protected:
    void SetUp() override
    {
        WireTableTest::SetUp();
        ASSERT_EQ(readMountPointReply(R"(<R><SHAREDRESOURCE name="DATA" displayname="Data" description=""/></R>)",
                                      channel.get(), area),
                  0);
    }

    // A path living as long as the test.
    const IZELServerPath& at(const char* whole)
    {
        paths.emplace_back(area.createPath(S(whole)));
        return *paths.back();
    }

    // A path value as the mount point sends it: a "PATH" document named after the command (the XML
    // library writes the attributes sorted by name).
    static std::string pathValue(const std::string& keyword, const std::string& directory, const std::string& name)
    {
        return xmlDocument(keyword, R"(<PATH abspath=")" + directory + "/" + name + R"(" dirpath=")" + directory +
                                        R"(" name=")" + name + R"("/>)");
    }
    static Bytes on(const std::string& keyword, const std::string& directory, const std::string& name,
                    const char* resource = "DATA")
    {
        return command(keyword, {{"srName", resource}, {"srPath", pathValue(keyword, directory, name)}});
    }
    static Bytes transfer(const std::string& keyword, const char* pathName, const std::string& directory,
                          const std::string& name)
    {
        return command(keyword, {{"srName", "DATA"},
                                 {pathName, pathValue(keyword, directory, name)},
                                 {"itemFileCRCCheckingEnabled", "true"}});
    }
    static std::string absolute(const IZELServerPath& path)
    {
        ZELServerString text;
        path.getAbsolutePath(text);
        return text.str();
    }
    static std::string mountPointText(const IZELServerMountPoint& mountPoint)
    {
        ZELServerString name;
        ZELServerString description;
        mountPoint.getName(name);
        mountPoint.getDescription(description);
        return name.str() + "|" + description.str();
    }
    std::string names()
    {
        return joined(entries.entries(), [&](unsigned i) { return absolute(entries.element(i)->getPath()); });
    }

    ZELServerMountPoint area{nullptr};
    ZELServerMountPointManager manager{channel.get()};
    std::vector<std::unique_ptr<IZELServerPath>> paths;
    Entries entries;
    ZELServerFileInfo info;
    MountPoints mountPoints;
    ZELServerMountPoint found{nullptr};
    ProgressLog progress;
};

TEST_F(MountPointTest, EveryCommandOnTheWire)
{
    const std::string big = "id;value\n" + std::string(200004, 'z');
    const std::string target = file("r.csv", "old");
    const std::string source = file("up.csv", "a;b\n1;2\n");
    const fs::path temporaryFolder = dir / "tmp";
    fs::create_directory(temporaryFolder);
    const ScopedEnv redirected(kTemporaryFolderVariable, temporaryFolder.string());
    // What a download into no named target left in the temporary folder: the file's name and content.
    const auto leftTemporary = [&] {
        std::string left;
        for (const auto& entry : fs::directory_iterator(temporaryFolder)) {
            const std::string name = entry.path().filename().string();
            left += name.substr(0, 7) + "XXXXXX" + name.substr(13) + "=" + slurp(entry.path()) + ",";
        }
        return left;
    };
    const std::string two = "DATA,OUT, ";
    const Bytes loop = listing("d", {{"DIR", "loop"}, {"FILE", "f"}});
    const Bytes download = transfer("SR_DOWNLOAD", "srSrcPath", "out", "r.csv");
    run({
        {"exists refused", on("SR_EXISTS", "", "x"), reply("ERROR", "no rights"),
         [&] { return outcome(area.exists(at("x"), fresh()), flag); }, msg::kServerError, "0 "},
        {"file info with flags", none, none, [&] { return outcome(area.getFileInfo(at("a"), 3, info)); },
         msg::kInvalidArgument, ""},
        {"file info of nothing", on("SR_GET", "in", "a.csv"), reply("SUCCESS", "<SR_GET/>"),
         [&] { return outcome(area.getFileInfo(at("in/a.csv"), info)); }, msg::kUnreadableReply, ""},
        {"list refused empties the entries", on("SR_LIST", "", "in"), reply("ERROR", "no 'in'"),
         [&] { return outcome(area.list(at("in"), entries), [&] { return names(); }); }, msg::kServerError, " "},
        {"list two levels, each directory right behind itself, none deeper", on("SR_LIST", "", "in"),
         listing("in", {{"DIR", "a"}, {"FILE", "b"}, {"DIR", "c"}}),
         [&] { return outcome(area.list(at("in"), 2, entries), [&] { return names(); }); }, 0,
         "in/a,in/a/deep,in/a/deep/z,in/a/x,in/b,in/c, ",
         [](FakeServer& s) {
             s.exchange(on("SR_LIST", "in", "a"), listing("in/a", {{"DIR", "deep"}, {"FILE", "x"}}))
                 .exchange(on("SR_LIST", "in/a", "deep"), listing("in/a/deep", {{"DIR", "z"}}))
                 .exchange(on("SR_LIST", "in", "c"), listing("in/c", {}));
         }},
        {"deeper listing refused keeps what was met", on("SR_LIST", "", "in"),
         listing("in", {{"DIR", "a"}, {"DIR", "b"}}),
         [&] { return outcome(area.list(at("in"), 5, entries), [&] { return names(); }); }, msg::kServerError,
         "in/a,in/b, ", [](FakeServer& s) { s.exchange(on("SR_LIST", "in", "a"), reply("ERROR", "cannot")); }},
        {"a directory inside itself ends at the bound", on("SR_LIST", "", "d"), loop,
         [&] { return outcome(area.listWithin(at("d"), 1000, entries, 5), [&] { return names(); }); },
         msg::kUnexpectedReply, "d/loop,d/loop,d/f,d/f, ",
         [&](FakeServer& s) {
             s.exchange(on("SR_LIST", "d", "loop"), loop).exchange(on("SR_LIST", "d", "loop"), loop);
         }},
        {"upload", transfer("SR_UPLOAD", "srDestPath", "in", "up.csv"), readyAck(),
         [&] { return outcome(area.upload(S(source), at("in/up.csv"), &progress), progress); }, 0,
         "total 8,start,at 0,finish, ", uploadOf("a;b\n1;2\n", reply("SUCCESS", "true"))},
        {"upload of a folder", none, none, [&] { return outcome(area.upload(S(dir.string()), at("in/x"), nullptr)); },
         msg::kInvalidArgument, ""},
        {"download", download, fileHeader(big.size(), crc32(big)),
         [&] {
             progress.calls.clear();
             return outcome(area.download(at("out/r.csv"), S(target), fresh(), &progress), flag,
                            [&] { return std::to_string(slurp(target) == big) + " " + outText(progress); });
         },
         0, "1 1 total 200013,start,at 0,at 131072,finish, ", downloadOf(big, reply("SUCCESS", "true"))},
        {"download into no named target", download, fileHeader(5, crc32("hello")),
         [&] { return outcome(area.download(at("out/r.csv"), S(""), fresh(), nullptr), flag, leftTemporary); }, 0,
         "1 wb-tmp-XXXXXX.tmp=hello, ", downloadOf("hello", reply("SUCCESS", "true"))},
        // The manager's commands; the mount points it reads talk through its connection.
        {"shared resources", command("SR_GET_SHAREDRESOURCES"),
         reply("SUCCESS", R"(<L><SHAREDRESOURCE name="DATA" description="Files the jobs read"/>)"
                          R"(<SHAREDRESOURCE name="OUT" displayname="Output"/></L>)"),
         [&] { return outcome(manager.getSharedResources(mountPoints), mountPoints); }, 0, two},
        {"listed mount point", on("SR_MAKE", "", "new", "OUT"), reply("SUCCESS", "true"),
         [&] { return outcome(mountPoints.element(1)->makeDirectory(at("new"))); }, 0, ""},
        {"shared resources refused", command("SR_GET_SHAREDRESOURCES"), reply("ERROR", "Authorization Error: no"),
         [&] { return outcome(manager.getSharedResources(mountPoints), mountPoints); }, msg::kServerError, two},
        {"shared resource not XML", command("SR_GET_SHAREDRESOURCE", {{"srName", "IN"}}), reply("SUCCESS", "<unclosed"),
         [&] {
             return outcome(manager.getSharedResource(S("IN"), found, fresh()), flag,
                            [&] { return mountPointText(found); });
         },
         msg::kXmlFailure, "0 | "},
        {"shared resource", command("SR_GET_SHAREDRESOURCE", {{"srName", "IN"}}),
         reply("SUCCESS", R"(<L><SHAREDRESOURCE name="IN" description="d"/></L>)"),
         [&] {
             return outcome(manager.getSharedResource(S("IN"), found, fresh()), flag,
                            [&] { return mountPointText(found); });
         },
         0, "1 IN|d "},
        {"found mount point", on("SR_EXISTS", "", "a", "IN"), reply("SUCCESS", "true"),
         [&] { return outcome(found.exists(at("a"), fresh()), flag); }, 0, "1 "},
    });
}

// Paths and file descriptions as objects: how paths are made, and what the "FILEINFO" reader makes of
// reply bodies, including after a failure.
std::string textsOf(const IZELServerPath& path)
{
    ZELServerString name("stale");
    ZELServerString directory("stale");
    ZELServerString absolute("stale");
    path.getName(name);
    path.getDirectoryPath(directory);
    path.getAbsolutePath(absolute);
    return name.str() + "|" + directory.str() + "|" + absolute.str();
}

std::string textsOf(const IZELServerFileInfo& info)
{
    return (info.isDirectory() ? "dir " : "file ") + std::to_string(info.getSize()) + " " + textsOf(info.getPath());
}

TEST(Path, AWholePathSplitsAtTheLastSlashAndPartsJoinWithOneSlash)
{
    ZELServerMountPoint area(nullptr);
    const std::pair<const char*, const char*> wholes[] = {
        {"a//b", "b|a/|a/b"},
        {"in\\data.csv", "in\\data.csv||/in\\data.csv"},
    };
    for (const auto& [whole, expected] : wholes) {
        const std::unique_ptr<IZELServerPath> path(area.createPath(ZELServerString(whole)));
        EXPECT_EQ(textsOf(*path), expected) << whole;
    }
    const std::pair<std::pair<const char*, const char*>, const char*> parts[] = {
        {{"in//", "//data.csv"}, "//data.csv|in//|in/data.csv"},
        {{"in", ""}, "|in|in/"},
    };
    for (const auto& [given, expected] : parts) {
        const std::unique_ptr<IZELServerPath> path(
            area.createPath(ZELServerString(given.first), ZELServerString(given.second)));
        EXPECT_EQ(textsOf(*path), expected) << given.first << " + " << given.second;
    }
}

TEST(FileInfoReader, ReadsTheFirstDescriptionAndAFailureLeavesTheLastOneRead)
{
    const struct {
        std::string body;
        int result;
        std::string after;
    } rows[] = {
        {R"(<SR_GET><FILEINFO filetype="DIR" size="0" name="wrong" dirpath="wrong" abspath="wrong">)"
         R"(<PATH name="out" dirpath="jobs/7" abspath="jobs/7/out"/></FILEINFO></SR_GET>)",
         0, "dir 0 out|jobs/7|jobs/7/out"},
        {R"(<R><FILEINFO filetype="DIR" size="9" name="a" dirpath="in" abspath="in/a"/></R>)", 0, "dir 9 a|in|in/a"},
        {"true", static_cast<int>(msg::kXmlFailure), "dir 9 a|in|in/a"},
        // Only the exact text "DIR" is a directory; the size is an unsigned number or zero.
        {R"(<R><FILEINFO filetype="dir" size="0x10"/></R>)", 0, "file 16 ||"},
        {R"(<R><FILEINFO filetype="DIR" size="4294967296"/></R>)", 0, "dir 0 ||"},
        {R"(<R><FILEINFO filetype="FILE" size="12abc"/></R>)", 0, "file 0 ||"},
    };
    ZELServerFileInfo info;
    for (const auto& row : rows) {
        EXPECT_EQ(readFileInfoReply(row.body, info), row.result) << row.body;
        EXPECT_EQ(textsOf(info), row.after) << row.body;
    }
}

}  // namespace
}  // namespace zel
