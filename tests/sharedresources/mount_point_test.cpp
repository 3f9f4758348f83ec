// A mount point against the fake server: every "SR_" file command byte for byte, the out flags after
// failures, deeper listings, and the download's temporary file on every way a download can end.

#include "sharedresources/ZELServerMountPoint.h"

#include <filesystem>
#include <functional>
#include <fstream>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/shared_resource_readers.h"
#include "sharedresources/sharedresources_factories.h"
#include "support/environment.h"
#include "support/platform.h"
#include "support/signed_in_channel.h"

namespace zel {
namespace {

namespace fs = std::filesystem;
using namespace std::string_literals;
using zeltest::Bytes;
using zeltest::describe;
using zeltest::slurp;
using zeltest::StatusPtr;
using Entries = ZELServerVector<IZELServerFileInfo, ZELServerFileInfo>;

unsigned numberOf(IZELServerStatus* raw)
{
    const StatusPtr status(raw);
    return status ? status->getMessageNumber() : 0;
}

// A path released through the mount point that made it.
using PathPtr = std::unique_ptr<IZELServerPath, std::function<void(IZELServerPath*)>>;

using zeltest::ProgressLog;

std::string fileInfoElement(const std::string& type, const std::string& size, const std::string& directory,
                            const std::string& name)
{
    return R"(<FILEINFO filetype=")" + type + R"(" size=")" + size + R"(" date="2024-05-01T12:00:00Z"><PATH name=")" +
           name + R"(" dirpath=")" + directory + R"(" abspath=")" + directory + "/" + name + R"("/></FILEINFO>)";
}

// A listing answer: one file description per (type, name) in `directory`.
Bytes listing(const std::string& directory, const std::vector<std::pair<std::string, std::string>>& entries)
{
    std::string body;
    for (const auto& [type, name] : entries) {
        body += fileInfoElement(type, type == "DIR" ? "0" : "1", directory, name);
    }
    return zeltest::reply("SUCCESS", "<SR_LIST>" + body + "</SR_LIST>");
}

std::vector<std::string> namesOf(Entries& entries)
{
    std::vector<std::string> names;
    for (unsigned i = 0; i < entries.entries(); ++i) {
        ZELServerString text;
        entries.element(i)->getPath().getAbsolutePath(text);
        names.push_back(text.str());
    }
    return names;
}

class MountPointTest : public zeltest::SignedInChannelTest {
protected:
    void SetUp() override
    {
        SignedInChannelTest::SetUp();
        ASSERT_EQ(readMountPointReply(R"(<R><SHAREDRESOURCE name="DATA" displayname="Data" description=""/></R>)",
                                      channel.get(), *mountPoint),
                  0);
    }

    PathPtr path(const char* whole)
    {
        return PathPtr(mountPoint->createPath(ZELServerString(whole)),
                       [this](IZELServerPath* p) { mountPoint->releaseObject(p); });
    }

    // A path value as the mount point sends it: a "PATH" document named after the command (the XML
    // library writes the attributes sorted by name).
    static std::string pathDocument(const std::string& keyword, const std::string& name, const std::string& directory,
                                    const std::string& absolute)
    {
        return xmlDocument(keyword, R"(<PATH abspath=")" + absolute + R"(" dirpath=")" + directory + R"(" name=")" +
                                        name + R"("/>)");
    }
    static Bytes pathCommand(const std::string& keyword, const std::string& name, const std::string& directory,
                             const std::string& absolute)
    {
        return command(keyword, {{"srName", "DATA"}, {"srPath", pathDocument(keyword, name, directory, absolute)}});
    }
    static Bytes listCommand(const std::string& directory, const std::string& name)
    {
        return pathCommand("SR_LIST", name, directory, directory + "/" + name);
    }
    static Bytes downloadCommand()
    {
        return command("SR_DOWNLOAD", {{"srName", "DATA"},
                                       {"srSrcPath", pathDocument("SR_DOWNLOAD", "r.csv", "out", "out/r.csv")},
                                       {"itemFileCRCCheckingEnabled", "true"}});
    }
    // The server's side of a download that sends `content` and then `answer`.
    void expectDownload(const std::string& content, const Bytes& answer)
    {
        server.exchange(downloadCommand(), zeltest::fileHeader(content.size(), zeltest::crc32(content)))
            .expectFrame(zeltest::readyAck())
            .sendRaw(content)
            .exchange(zeltest::readyAck(), answer);
    }

    std::string file(const std::string& name, const std::string& content) const
    {
        const fs::path target = dir / name;
        std::ofstream(target, std::ios::binary) << content;
        return target.string();
    }

    // The names of the download's temporary files left in `folder`.
    static std::vector<std::string> temporaryFiles(const fs::path& folder)
    {
        std::vector<std::string> names;
        for (const auto& entry : fs::directory_iterator(folder)) {
            const std::string name = entry.path().filename().string();
            if (name.rfind("wb-tmp-", 0) == 0) {
                names.push_back(name);
            }
        }
        return names;
    }

    std::unique_ptr<IZELServerMountPoint> mountPoint{makeMountPoint(channel.get())};
    const zeltest::TempDir scratch{"zel-mountpoint"};
    const fs::path& dir = scratch.path();
};

// ---- Commands with a flag or a status only ----------------------------------------------------------

TEST_F(MountPointTest, FlagsFollowTheAnswerAndReadZeroAfterAFailureOrAnAnswerThatIsNoBoolean)
{
    server.exchange(pathCommand("SR_EXISTS", "a.csv", "in", "in/a.csv"), zeltest::reply("SUCCESS", "true"))
        .exchange(pathCommand("SR_EXISTS", "b.csv", "", "/b.csv"), zeltest::reply("SUCCESS", "false"))
        .exchange(pathCommand("SR_DELETE", "old", "in", "in/old"), zeltest::reply("SUCCESS", "true"))
        .exchange(pathCommand("SR_EXISTS", "x", "", "/x"), zeltest::reply("ERROR", "no rights"))
        .exchange(pathCommand("SR_DELETE", "x", "", "/x"), zeltest::reply("ERROR", "no rights"))
        .exchange(pathCommand("SR_EXISTS", "x", "", "/x"), zeltest::reply("SUCCESS", "yes"));
    signIn();
    struct Case {
        const char* what;
        bool exists;  // false: remove
        const char* path;
        unsigned number;
        unsigned flag;
    };
    const Case cases[] = {
        {"exists true", true, "in/a.csv", 0, 1},
        {"exists false", true, "b.csv", 0, 0},
        {"remove", false, "in/old", 0, 1},
        {"exists failing", true, "x", msg::kServerError, 0},
        {"remove failing", false, "x", msg::kServerError, 0},
        {"exists not boolean", true, "x", 0, 0},
    };
    for (const Case& c : cases) {
        unsigned flag = 7;
        const unsigned number =
            numberOf(c.exists ? mountPoint->exists(*path(c.path), flag) : mountPoint->remove(*path(c.path), flag));
        EXPECT_EQ(number, c.number) << c.what;
        EXPECT_EQ(flag, c.flag) << c.what;
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, MakeDirectoryCopyAndMoveSendTheirPathsSourceFirst)
{
    const auto twoPaths = [](const std::string& keyword) {
        return command(keyword, {{"srName", "DATA"},
                                 {"srSrcPath", pathDocument(keyword, "a.csv", "in", "in/a.csv")},
                                 {"srDestPath", pathDocument(keyword, "b.csv", "out", "out/b.csv")}});
    };
    server.exchange(pathCommand("SR_MAKE", "new", "in/2024", "in/2024/new"), zeltest::reply("SUCCESS", "true"))
        .exchange(pathCommand("SR_MAKE", "new", "in/2024", "in/2024/new"), zeltest::reply("ERROR", "cannot make it"))
        .exchange(twoPaths("SR_COPY"), zeltest::reply("SUCCESS", "true"))
        .exchange(twoPaths("SR_MOVE"), zeltest::reply("SUCCESS", "true"));
    signIn();
    EXPECT_EQ(numberOf(mountPoint->makeDirectory(*path("in/2024/new"))), 0u);
    EXPECT_EQ(numberOf(mountPoint->makeDirectory(*path("in/2024/new"))), msg::kServerError);
    EXPECT_EQ(numberOf(mountPoint->copy(*path("in/a.csv"), *path("out/b.csv"))), 0u);
    EXPECT_EQ(numberOf(mountPoint->move(*path("in/a.csv"), *path("out/b.csv"))), 0u);
    EXPECT_TRUE(server.verify());
}

// ---- Descriptions and listings ----------------------------------------------------------------------

TEST_F(MountPointTest, GetFileInfoSendsSrGetAndFillsTheDescriptionOrFails)
{
    const Bytes expected = pathCommand("SR_GET", "a.csv", "in", "in/a.csv");
    const Bytes answer =
        zeltest::reply("SUCCESS", "<SR_GET>" + fileInfoElement("FILE", "2048", "in", "a.csv") + "</SR_GET>");
    server.exchange(expected, answer)
        .exchange(expected, answer)
        .exchange(expected, zeltest::reply("SUCCESS", "<SR_GET/>"))
        .exchange(expected, zeltest::reply("SUCCESS", "true"));
    signIn();
    ZELServerFileInfo info;
    EXPECT_EQ(numberOf(mountPoint->getFileInfo(*path("in/a.csv"), info)), 0u);
    EXPECT_EQ(info.getSize(), 2048u);
    ZELServerString absolute;
    info.getPath().getAbsolutePath(absolute);
    EXPECT_EQ(absolute.str(), "in/a.csv");
    ZELServerFileInfo again;
    EXPECT_EQ(numberOf(mountPoint->getFileInfo(*path("in/a.csv"), 0, again)), 0u);
    EXPECT_EQ(again.getSize(), 2048u);
    EXPECT_EQ(numberOf(mountPoint->getFileInfo(*path("in/a.csv"), info)), msg::kUnreadableReply);
    EXPECT_EQ(numberOf(mountPoint->getFileInfo(*path("in/a.csv"), info)), msg::kXmlFailure);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ListReplacesTheEntriesAndFollowsEachDirectoryRightBehindItUpToTheDepth)
{
    server.exchange(listCommand("", "in"), listing("in", {{"DIR", "sub"}, {"FILE", "a.csv"}}))
        .exchange(listCommand("", "in"), zeltest::reply("ERROR", "no 'in'"))
        .exchange(listCommand("", "in"), listing("in", {{"DIR", "a"}, {"FILE", "b"}, {"DIR", "c"}}))
        .exchange(listCommand("in", "a"), listing("in/a", {{"DIR", "deep"}, {"FILE", "x"}}))
        .exchange(listCommand("in/a", "deep"), listing("in/a/deep", {{"FILE", "y"}}))
        .exchange(listCommand("in", "c"), listing("in/c", {}))
        // Depth 1: the directory at the last level is not listed.
        .exchange(listCommand("", "in"), listing("in", {{"DIR", "a"}}))
        .exchange(listCommand("in", "a"), listing("in/a", {{"DIR", "deep"}}))
        // A failed deeper listing keeps what was gathered.
        .exchange(listCommand("", "in"), listing("in", {{"DIR", "a"}, {"DIR", "b"}}))
        .exchange(listCommand("in", "a"), zeltest::reply("ERROR", "cannot list 'in/a'"));
    signIn();
    Entries entries;
    entries.append(new ZELServerFileInfo());
    EXPECT_EQ(numberOf(mountPoint->list(*path("in"), entries)), 0u);
    EXPECT_EQ(namesOf(entries), (std::vector<std::string>{"in/sub", "in/a.csv"})) << "depth 0 lists one level only";
    EXPECT_EQ(numberOf(mountPoint->list(*path("in"), entries)), msg::kServerError);
    EXPECT_EQ(entries.entries(), 0u) << "a failed listing leaves no entries";
    EXPECT_EQ(numberOf(mountPoint->list(*path("in"), 2, entries)), 0u);
    EXPECT_EQ(namesOf(entries),
              (std::vector<std::string>{"in/a", "in/a/deep", "in/a/deep/y", "in/a/x", "in/b", "in/c"}));
    EXPECT_EQ(numberOf(mountPoint->list(*path("in"), 1, entries)), 0u);
    EXPECT_EQ(namesOf(entries), (std::vector<std::string>{"in/a", "in/a/deep"}));
    EXPECT_EQ(numberOf(mountPoint->list(*path("in"), 5, entries)), msg::kServerError);
    EXPECT_EQ(namesOf(entries), (std::vector<std::string>{"in/a", "in/b"}));
    EXPECT_TRUE(server.verify());
}

// ---- Downloads --------------------------------------------------------------------------------------

TEST_F(MountPointTest, DownloadReplacesTheTargetOnlyWhenTheExchangeCompletes)
{
    const std::string content = "id;value\n1;2\n"s + std::string(200000, 'z');
    expectDownload(content, zeltest::reply("SUCCESS", "true"));
    expectDownload("new!", zeltest::reply("ERROR", "CRC mismatch"));
    // The server's refusal in place of the file is a failed download like any other.
    server.exchange(downloadCommand(), zeltest::reply("ERROR", "cannot open 'out/r.csv'"));
    signIn();
    const std::string target = file("r.csv", "old content");
    unsigned received = 0;
    ProgressLog progress;
    EXPECT_EQ(numberOf(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, &progress)), 0u);
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(slurp(target), content);
    EXPECT_EQ(progress.calls, (std::vector<std::string>{"total 200013", "start", "at 0", "at 131072", "finish"}));

    file("r.csv", "old content");
    received = 9;
    EXPECT_EQ(numberOf(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr)),
              msg::kServerError);
    EXPECT_EQ(received, 0u);
    EXPECT_EQ(slurp(target), "old content");

    received = 9;
    EXPECT_EQ(numberOf(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr)),
              msg::kServerError);
    EXPECT_EQ(received, 0u);
    EXPECT_EQ(slurp(target), "old content");
    EXPECT_TRUE(temporaryFiles(dir).empty());
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, EmptyTargetKeepsTheFileUnderItsTemporaryNameAndACutShortDownloadLeavesNone)
{
    const fs::path temporaryFolder = dir / "tmp";
    fs::create_directory(temporaryFolder);
    const zeltest::ScopedTemporaryFolder redirected(temporaryFolder);
    expectDownload("hello", zeltest::reply("SUCCESS", "true"));
    server.exchange(downloadCommand(), zeltest::fileHeader(1000, 0))
        .expectFrame(zeltest::readyAck())
        .sendRaw(std::string(400, 'p'))
        .closeConnection();
    signIn();
    unsigned received = 0;
    EXPECT_EQ(numberOf(mountPoint->download(*path("out/r.csv"), ZELServerString(""), received, nullptr)), 0u);
    EXPECT_EQ(received, 1u);
    const std::vector<std::string> left = temporaryFiles(temporaryFolder);
    ASSERT_EQ(left.size(), 1u);
    EXPECT_EQ(left[0].size(), std::string("wb-tmp-XXXXXX.tmp").size()) << left[0];
    EXPECT_EQ(left[0].substr(13), ".tmp") << left[0];
    EXPECT_EQ(slurp(temporaryFolder / left[0]), "hello");

    const std::string target = file("r.csv", "old content");
    EXPECT_EQ(numberOf(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr)),
              msg::kReceiveFailed);
    EXPECT_EQ(slurp(target), "old content");
    EXPECT_TRUE(temporaryFiles(dir).empty());
    EXPECT_EQ(temporaryFiles(temporaryFolder).size(), 1u);
    EXPECT_TRUE(server.verify());
}

// ---- Uploads ----------------------------------------------------------------------------------------

TEST_F(MountPointTest, UploadSendsTheCommandThenTheFile)
{
    const std::string content = "a;b\n1;2\n";
    const std::string source = file("up.csv", content);
    server
        .exchange(command("SR_UPLOAD", {{"srName", "DATA"},
                                        {"srDestPath", pathDocument("SR_UPLOAD", "up.csv", "in", "in/up.csv")},
                                        {"itemFileCRCCheckingEnabled", "true"}}),
                  zeltest::readyAck())
        .exchange(zeltest::fileHeader(content.size(), zeltest::crc32(content)), zeltest::readyAck())
        .expectRawBytes(content)
        .sendFrame(zeltest::reply("SUCCESS", "true"));
    signIn();
    ProgressLog progress;
    EXPECT_EQ(numberOf(mountPoint->upload(ZELServerString(source), *path("in/up.csv"), &progress)), 0u);
    EXPECT_EQ(progress.calls, (std::vector<std::string>{"total 8", "start", "at 0", "finish"}));
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, RefusedArgumentsAndUnusableLocalFilesSendNothing)
{
    signIn();
    ZELServerFileInfo info;
    EXPECT_EQ(numberOf(mountPoint->getFileInfo(*path("a"), 3, info)), msg::kInvalidArgument) << "flags other than 0";
    for (const std::string& source : {(dir / "missing.csv").string(), dir.string(), std::string()}) {
        EXPECT_EQ(numberOf(mountPoint->upload(ZELServerString(source), *path("in/x.csv"), nullptr)),
                  msg::kInvalidArgument)
            << "upload of \"" << source << '"';
    }
    unsigned received = 9;
    const std::string target = (dir / "missing" / "r.csv").string();
    EXPECT_EQ(numberOf(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr)),
              msg::kLocalFileWrite);
    EXPECT_EQ(received, 0u);
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u) << "only the sign-in went out";
}

// ---- Without a connection ---------------------------------------------------------------------------

TEST(MountPointWithoutChannel, EveryCommandAnswersNotConnectedAndSetsTheFlagsToZero)
{
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    const PathPtr owned(mountPoint->createPath(ZELServerString("a/b")),
                        [&mountPoint](IZELServerPath* p) { mountPoint->releaseObject(p); });
    const IZELServerPath& path = *owned;
    ZELServerFileInfo info;
    Entries entries;
    unsigned present = 5;
    unsigned removed = 5;
    unsigned received = 5;
    for (IZELServerStatus* status :
         {mountPoint->exists(path, present), mountPoint->remove(path, removed),
          mountPoint->download(path, ZELServerString(""), received, nullptr), mountPoint->copy(path, path),
          mountPoint->move(path, path), mountPoint->getFileInfo(path, info), mountPoint->list(path, entries),
          mountPoint->makeDirectory(path)}) {
        EXPECT_EQ(numberOf(status), msg::kNotConnected);
    }
    EXPECT_EQ((std::vector<unsigned>{present, removed, received}), (std::vector<unsigned>{0, 0, 0}));
}

}  // namespace
}  // namespace zel
