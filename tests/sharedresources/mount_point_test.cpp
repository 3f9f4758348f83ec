// A mount point against the fake server: every "SR_" file command byte for byte, the out flags after
// failures, deeper listings, and the download's temporary file on every way a download can end.

#include "sharedresources/ZELServerMountPoint.h"

#include <filesystem>
#include <fstream>
#include <memory>
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
using zeltest::StatusPtr;

class PathDeleter {
public:
    explicit PathDeleter(IZELServerMountPoint& owner) : owner_(&owner) {}
    void operator()(IZELServerPath* path) const { owner_->releaseObject(path); }

private:
    IZELServerMountPoint* owner_;
};
using PathPtr = std::unique_ptr<IZELServerPath, PathDeleter>;

// Records the progress calls in order.
class ProgressLog final : public IZELServerProgressListener {
public:
    void totalSize(unsigned bytes) override { calls.push_back("total " + std::to_string(bytes)); }
    void start() override { calls.push_back("start"); }
    void position(unsigned bytes) override { calls.push_back("at " + std::to_string(bytes)); }
    void finish() override { calls.push_back("finish"); }
    std::vector<std::string> calls;
};

std::string fileInfoElement(const std::string& type, const std::string& size, const std::string& directory,
                            const std::string& name)
{
    const std::string absolute = directory + "/" + name;
    return R"(<FILEINFO filetype=")" + type + R"(" size=")" + size + R"(" date="2024-05-01T12:00:00Z">)" +
           R"(<PATH name=")" + name + R"(" dirpath=")" + directory + R"(" abspath=")" + absolute + R"("/></FILEINFO>)";
}

std::string nameOf(const IZELServerFileInfo& info)
{
    ZELServerString text;
    info.getPath().getAbsolutePath(text);
    return text.str();
}

std::vector<std::string> namesOf(IZELServerVector<IZELServerFileInfo>& entries)
{
    std::vector<std::string> names;
    for (unsigned i = 0; i < entries.entries(); ++i) {
        names.push_back(nameOf(*entries.element(i)));
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

    PathPtr path(const char* whole) { return PathPtr(mountPoint->createPath(ZELServerString(whole)), PathDeleter(*mountPoint)); }

    // A path value as the mount point sends it: a "PATH" document named after the command (the XML
    // library writes the attributes sorted by name).
    static std::string pathDocument(const std::string& keyword, const std::string& name, const std::string& directory,
                                    const std::string& absolute)
    {
        return xmlDocument(keyword, R"(<PATH abspath=")" + absolute + R"(" dirpath=")" + directory + R"(" name=")" +
                                        name + R"("/>)");
    }
    static Bytes pathCommand(const std::string& keyword, const std::string& valueName, const std::string& name,
                             const std::string& directory, const std::string& absolute)
    {
        return command(keyword, {{"srName", "DATA"}, {valueName, pathDocument(keyword, name, directory, absolute)}});
    }
    static Bytes listCommand(const std::string& directory, const std::string& name)
    {
        return pathCommand("SR_LIST", "srPath", name, directory, directory + "/" + name);
    }
    static Bytes downloadCommand()
    {
        return command("SR_DOWNLOAD", {{"srName", "DATA"},
                                       {"srSrcPath", pathDocument("SR_DOWNLOAD", "r.csv", "out", "out/r.csv")},
                                       {"itemFileCRCCheckingEnabled", "true"}});
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

// ---- Commands with a flag ---------------------------------------------------------------------------

TEST_F(MountPointTest, ExistsSendsTheResourceNameAndThePathDocument)
{
    server.exchange(pathCommand("SR_EXISTS", "srPath", "a.csv", "in", "in/a.csv"), zeltest::reply("SUCCESS", "true"))
        .exchange(pathCommand("SR_EXISTS", "srPath", "b.csv", "", "/b.csv"), zeltest::reply("SUCCESS", "false"));
    signIn();
    unsigned present = 0;
    StatusPtr status(mountPoint->exists(*path("in/a.csv"), present));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(present, 1u);
    status.reset(mountPoint->exists(*path("b.csv"), present));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(present, 0u);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, RemoveSendsSrDeleteAndReadsTheAnswer)
{
    server.exchange(pathCommand("SR_DELETE", "srPath", "old", "in", "in/old"), zeltest::reply("SUCCESS", "true"));
    signIn();
    unsigned removed = 0;
    const StatusPtr status(mountPoint->remove(*path("in/old"), removed));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(removed, 1u);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, OutFlagsReadZeroAfterAFailureOrAnAnswerThatIsNoBoolean)
{
    server.exchange(pathCommand("SR_EXISTS", "srPath", "x", "", "/x"), zeltest::reply("ERROR", "no rights"))
        .exchange(pathCommand("SR_DELETE", "srPath", "x", "", "/x"), zeltest::reply("ERROR", "no rights"))
        .exchange(pathCommand("SR_EXISTS", "srPath", "x", "", "/x"), zeltest::reply("SUCCESS", "yes"));
    signIn();
    unsigned present = 7;
    StatusPtr status(mountPoint->exists(*path("x"), present));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(present, 0u);
    unsigned removed = 7;
    status.reset(mountPoint->remove(*path("x"), removed));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(removed, 0u);
    present = 7;
    status.reset(mountPoint->exists(*path("x"), present));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(present, 0u);
    EXPECT_TRUE(server.verify());
}

// ---- Commands with a status only --------------------------------------------------------------------

TEST_F(MountPointTest, MakeDirectorySendsSrMake)
{
    server.exchange(pathCommand("SR_MAKE", "srPath", "new", "in/2024", "in/2024/new"), zeltest::reply("SUCCESS", "true"))
        .exchange(pathCommand("SR_MAKE", "srPath", "new", "in/2024", "in/2024/new"),
                  zeltest::reply("ERROR", "cannot make directory"));
    signIn();
    StatusPtr status(mountPoint->makeDirectory(*path("in/2024/new")));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    status.reset(mountPoint->makeDirectory(*path("in/2024/new")));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_TRUE(server.verify());
}

struct TwoPathCommand {
    const char* keyword;
    IZELServerStatus* (IZELServerMountPoint::*operation)(const IZELServerPath&, const IZELServerPath&);
};

void PrintTo(const TwoPathCommand& command, std::ostream* out) { *out << command.keyword; }

class TwoPathCommandTest : public MountPointTest, public ::testing::WithParamInterface<TwoPathCommand> {};

TEST_P(TwoPathCommandTest, SendsTheSourceBeforeTheDestination)
{
    const std::string keyword = GetParam().keyword;
    server.exchange(command(keyword, {{"srName", "DATA"},
                                      {"srSrcPath", pathDocument(keyword, "a.csv", "in", "in/a.csv")},
                                      {"srDestPath", pathDocument(keyword, "b.csv", "out", "out/b.csv")}}),
                    zeltest::reply("SUCCESS", "true"));
    signIn();
    const PathPtr source = path("in/a.csv");
    const PathPtr destination = path("out/b.csv");
    const StatusPtr status(((*mountPoint).*GetParam().operation)(*source, *destination));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(server.verify());
}

INSTANTIATE_TEST_SUITE_P(Commands, TwoPathCommandTest,
                         ::testing::Values(TwoPathCommand{"SR_COPY", &IZELServerMountPoint::copy},
                                           TwoPathCommand{"SR_MOVE", &IZELServerMountPoint::move}),
                         [](const auto& info) { return std::string(info.param.keyword); });

// ---- Descriptions and listings ----------------------------------------------------------------------

TEST_F(MountPointTest, GetFileInfoSendsSrGetAndFillsTheDescription)
{
    const Bytes expected = pathCommand("SR_GET", "srPath", "a.csv", "in", "in/a.csv");
    const Bytes answer = zeltest::reply("SUCCESS", "<SR_GET>" + fileInfoElement("FILE", "2048", "in", "a.csv") + "</SR_GET>");
    server.exchange(expected, answer).exchange(expected, answer);
    signIn();
    ZELServerFileInfo info;
    StatusPtr status(mountPoint->getFileInfo(*path("in/a.csv"), info));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(info.getSize(), 2048u);
    EXPECT_EQ(nameOf(info), "in/a.csv");
    ZELServerFileInfo again;
    status.reset(mountPoint->getFileInfo(*path("in/a.csv"), 0, again));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(again.getSize(), 2048u);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, GetFileInfoWithFlagsIsRefusedBeforeAnythingIsSent)
{
    signIn();
    ZELServerFileInfo info;
    const StatusPtr status(mountPoint->getFileInfo(*path("a"), 3, info));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kInvalidArgument);
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);
}

TEST_F(MountPointTest, GetFileInfoOfAReplyWithoutADescriptionIsUnreadable)
{
    server.exchange(pathCommand("SR_GET", "srPath", "a", "", "/a"), zeltest::reply("SUCCESS", "<SR_GET/>"))
        .exchange(pathCommand("SR_GET", "srPath", "a", "", "/a"), zeltest::reply("SUCCESS", "true"));
    signIn();
    ZELServerFileInfo info;
    StatusPtr status(mountPoint->getFileInfo(*path("a"), info));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kUnreadableReply);
    status.reset(mountPoint->getFileInfo(*path("a"), info));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kXmlFailure);
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ListReplacesTheEntriesWithTheServersListing)
{
    server.exchange(listCommand("", "in"),
                    zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("DIR", "0", "in", "sub") +
                                                  fileInfoElement("FILE", "5", "in", "a.csv") + "</SR_LIST>"));
    signIn();
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> entries;
    entries.append(new ZELServerFileInfo());
    const StatusPtr status(mountPoint->list(*path("in"), entries));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(namesOf(entries), (std::vector<std::string>{"in/sub", "in/a.csv"})) << "depth 0 lists one level only";
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ListWithADepthFollowsEachDirectoryRightBehindIt)
{
    server.exchange(listCommand("", "in"),
                    zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("DIR", "0", "in", "a") +
                                                  fileInfoElement("FILE", "1", "in", "b") +
                                                  fileInfoElement("DIR", "0", "in", "c") + "</SR_LIST>"))
        .exchange(listCommand("in", "a"),
                  zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("DIR", "0", "in/a", "deep") +
                                                fileInfoElement("FILE", "2", "in/a", "x") + "</SR_LIST>"))
        .exchange(listCommand("in/a", "deep"),
                  zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("FILE", "3", "in/a/deep", "y") + "</SR_LIST>"))
        .exchange(listCommand("in", "c"), zeltest::reply("SUCCESS", "<SR_LIST/>"));
    signIn();
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> entries;
    const StatusPtr status(mountPoint->list(*path("in"), 2, entries));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(namesOf(entries),
              (std::vector<std::string>{"in/a", "in/a/deep", "in/a/deep/y", "in/a/x", "in/b", "in/c"}));
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ListStopsAtTheGivenDepth)
{
    server.exchange(listCommand("", "in"),
                    zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("DIR", "0", "in", "a") + "</SR_LIST>"))
        .exchange(listCommand("in", "a"),
                  zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("DIR", "0", "in/a", "deep") + "</SR_LIST>"));
    signIn();
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> entries;
    const StatusPtr status(mountPoint->list(*path("in"), 1, entries));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(namesOf(entries), (std::vector<std::string>{"in/a", "in/a/deep"}));
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 3u) << "the directory at the last level is not listed";
}

TEST_F(MountPointTest, AFailedDeeperListingKeepsWhatWasGathered)
{
    server.exchange(listCommand("", "in"),
                    zeltest::reply("SUCCESS", "<SR_LIST>" + fileInfoElement("DIR", "0", "in", "a") +
                                                  fileInfoElement("DIR", "0", "in", "b") + "</SR_LIST>"))
        .exchange(listCommand("in", "a"), zeltest::reply("ERROR", "cannot list 'in/a'"));
    signIn();
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> entries;
    const StatusPtr status(mountPoint->list(*path("in"), 5, entries));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(namesOf(entries), (std::vector<std::string>{"in/a", "in/b"}));
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, AFailedListingLeavesNoEntries)
{
    server.exchange(listCommand("", "in"), zeltest::reply("ERROR", "'in' does not exist"));
    signIn();
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> entries;
    entries.append(new ZELServerFileInfo());
    const StatusPtr status(mountPoint->list(*path("in"), entries));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(entries.entries(), 0u);
    EXPECT_TRUE(server.verify());
}

// ---- Downloads --------------------------------------------------------------------------------------

TEST_F(MountPointTest, DownloadReplacesTheTargetThroughATemporaryFile)
{
    const std::string content = "id;value\n1;2\n"s + std::string(200000, 'z');
    const std::string target = file("r.csv", "old content");
    server.exchange(downloadCommand(), zeltest::fileHeader(content.size(), zeltest::crc32(content)))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .exchange(zeltest::readyAck(), zeltest::reply("SUCCESS", "true"));
    signIn();
    unsigned received = 0;
    ProgressLog progress;
    const StatusPtr status(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, &progress));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(slurp(target), content);
    EXPECT_TRUE(temporaryFiles(dir).empty());
    EXPECT_EQ(progress.calls, (std::vector<std::string>{"total 200013", "start", "at 0", "at 131072", "finish"}));
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, AFailedDownloadDeletesTheTemporaryFileAndLeavesTheTargetAlone)
{
    const std::string target = file("r.csv", "old content");
    server.exchange(downloadCommand(), zeltest::fileHeader(4, zeltest::crc32("new!")))
        .expectFrame(zeltest::readyAck())
        .sendRaw("new!")
        .exchange(zeltest::readyAck(), zeltest::reply("ERROR", "CRC mismatch"));
    signIn();
    unsigned received = 9;
    const StatusPtr status(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(received, 0u);
    EXPECT_EQ(slurp(target), "old content");
    EXPECT_TRUE(temporaryFiles(dir).empty());
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ADownloadCutShortDeletesTheTemporaryFileAndLeavesTheTargetAlone)
{
    const std::string target = file("r.csv", "old content");
    server.exchange(downloadCommand(), zeltest::fileHeader(1000, 0))
        .expectFrame(zeltest::readyAck())
        .sendRaw(std::string(400, 'p'))
        .closeConnection();
    signIn();
    unsigned received = 0;
    const StatusPtr status(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kReceiveFailed);
    EXPECT_EQ(slurp(target), "old content");
    EXPECT_TRUE(temporaryFiles(dir).empty());
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ADownloadWithoutAFileStillReplacesTheTarget)
{
    const std::string target = file("r.csv", "old content");
    server.exchange(downloadCommand(), zeltest::reply("ERROR", "cannot open 'out/r.csv'"));
    signIn();
    unsigned received = 9;
    const StatusPtr status(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(received, 0u);
    EXPECT_EQ(slurp(target), "") << "the completed exchange moves its temporary file onto the target";
    EXPECT_TRUE(temporaryFiles(dir).empty());
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ADownloadWithAnEmptyTargetKeepsTheFileUnderItsTemporaryName)
{
    const fs::path temporaryFolder = dir / "tmp";
    fs::create_directory(temporaryFolder);
    const zeltest::ScopedTemporaryFolder redirected(temporaryFolder);
    server.exchange(downloadCommand(), zeltest::fileHeader(5, zeltest::crc32("hello")))
        .expectFrame(zeltest::readyAck())
        .sendRaw("hello")
        .exchange(zeltest::readyAck(), zeltest::reply("SUCCESS", "true"));
    signIn();
    unsigned received = 0;
    const StatusPtr status(mountPoint->download(*path("out/r.csv"), ZELServerString(""), received, nullptr));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(received, 1u);
    const std::vector<std::string> left = temporaryFiles(temporaryFolder);
    ASSERT_EQ(left.size(), 1u);
    EXPECT_EQ(left[0].size(), std::string("wb-tmp-XXXXXX.tmp").size()) << left[0];
    EXPECT_EQ(left[0].substr(13), ".tmp") << left[0];
    EXPECT_EQ(slurp(temporaryFolder / left[0]), "hello");
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, ADownloadIntoAFolderThatDoesNotExistSendsNothing)
{
    signIn();
    unsigned received = 9;
    const std::string target = (dir / "missing" / "r.csv").string();
    const StatusPtr status(mountPoint->download(*path("out/r.csv"), ZELServerString(target), received, nullptr));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kLocalFileWrite);
    EXPECT_EQ(received, 0u);
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);
}

// ---- Uploads ----------------------------------------------------------------------------------------

TEST_F(MountPointTest, UploadSendsTheCommandThenTheFile)
{
    const std::string content = "a;b\n1;2\n";
    const std::string source = file("up.csv", content);
    server.exchange(command("SR_UPLOAD", {{"srName", "DATA"},
                                          {"srDestPath", pathDocument("SR_UPLOAD", "up.csv", "in", "in/up.csv")},
                                          {"itemFileCRCCheckingEnabled", "true"}}),
                    zeltest::readyAck())
        .exchange(zeltest::fileHeader(content.size(), zeltest::crc32(content)), zeltest::readyAck())
        .expectRawBytes(content)
        .sendFrame(zeltest::reply("SUCCESS", "true"));
    signIn();
    ProgressLog progress;
    const StatusPtr status(mountPoint->upload(ZELServerString(source), *path("in/up.csv"), &progress));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(progress.calls, (std::vector<std::string>{"total 8", "start", "at 0", "finish"}));
    EXPECT_TRUE(server.verify());
}

TEST_F(MountPointTest, UploadOfALocalFileThatCannotBeReadSendsNothing)
{
    signIn();
    for (const std::string& source : {(dir / "missing.csv").string(), dir.string(), std::string()}) {
        SCOPED_TRACE(source);
        const StatusPtr status(mountPoint->upload(ZELServerString(source), *path("in/x.csv"), nullptr));
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), msg::kInvalidArgument);
    }
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u) << "only the sign-in went out";
}

// ---- Without a connection ---------------------------------------------------------------------------

TEST(MountPointWithoutChannel, EveryCommandAnswersNotConnectedAndSetsTheFlagsToZero)
{
    const std::unique_ptr<IZELServerMountPoint> mountPoint(makeMountPoint(nullptr));
    IZELServerPath* path = mountPoint->createPath(ZELServerString("a/b"));
    ZELServerFileInfo info;
    ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> entries;
    unsigned present = 5;
    unsigned removed = 5;
    unsigned received = 5;
    const StatusPtr statuses[] = {
        StatusPtr(mountPoint->exists(*path, present)),
        StatusPtr(mountPoint->remove(*path, removed)),
        StatusPtr(mountPoint->download(*path, ZELServerString(""), received, nullptr)),
        StatusPtr(mountPoint->copy(*path, *path)),
        StatusPtr(mountPoint->move(*path, *path)),
        StatusPtr(mountPoint->getFileInfo(*path, info)),
        StatusPtr(mountPoint->list(*path, entries)),
        StatusPtr(mountPoint->makeDirectory(*path)),
    };
    for (const StatusPtr& status : statuses) {
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), msg::kNotConnected);
    }
    EXPECT_EQ(present, 0u);
    EXPECT_EQ(removed, 0u);
    EXPECT_EQ(received, 0u);
    mountPoint->releaseObject(path);
}

}  // namespace
}  // namespace zel
