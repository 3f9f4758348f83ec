// Shared resources: every "SR_" command, confinement to the area, checked uploads; and the path
// resolver on its own.
#include <gtest/gtest.h>

#include <filesystem>

#include "shared_resources.h"
#include "support/server_fixture.h"

namespace zeltest {
namespace {

namespace fs = std::filesystem;

class Shared : public ServerFixture {
protected:
    void SetUp() override
    {
        ServerFixture::SetUp();
        client_ = connectAs("ann");
    }
    void TearDown() override
    {
        client_.reset();
        ServerFixture::TearDown();
    }
    WireReply onPath(const std::string& keyword, const std::string& path)
    {
        return client_->command(keyword, {{"srName", "AREA"}, {"srPath", pathDocument(path)}});
    }
    WireReply twoPaths(const std::string& keyword, const std::string& from, const std::string& to)
    {
        return client_->command(
            keyword, {{"srName", "AREA"}, {"srSrcPath", pathDocument(from)}, {"srDestPath", pathDocument(to)}});
    }
    WireReply upload(const std::string& path, const std::string& content,
                     std::optional<std::uint32_t> crc = std::nullopt, bool check = true)
    {
        return client_->upload("SR_UPLOAD",
                               {{"srName", "AREA"},
                                {"srDestPath", pathDocument(path)},
                                {"itemFileCRCCheckingEnabled", check ? "true" : "false"}},
                               content, crc);
    }
    Download download(const std::string& path)
    {
        return client_->download("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument(path)}});
    }

    std::unique_ptr<TestClient> client_;
};

// A "FILEINFO" element as the server writes it, with its time stamp made "TIME".
std::string fileInfo(const std::string& type, const std::string& size, const std::string& name, const std::string& dir)
{
    std::string path =
        "name=\"" + name + "\" dirpath=\"" + dir + "\" abspath=\"" + (dir.empty() ? name : dir + "/" + name) + "\"";
    return "<FILEINFO filetype=\"" + type + "\" size=\"" + size + "\" date=\"TIME\" " + path + "><PATH " + path +
           "/></FILEINFO>";
}

TEST_F(Shared, ListsAndFindsResources)
{
    const std::string area = R"(<SHAREDRESOURCE name="AREA" displayname="Test area" description="Files of the test"/>)";
    EXPECT_EQ(client_->command("SR_GET_SHAREDRESOURCES").body,
              document("<SR_GET_SHAREDRESOURCES>" + area + "</SR_GET_SHAREDRESOURCES>"));
    EXPECT_EQ(client_->command("SR_GET_SHAREDRESOURCE", {{"srName", "AREA"}}).body,
              document("<SR_GET_SHAREDRESOURCE>" + area + "</SR_GET_SHAREDRESOURCE>"));
    // Unknown: a document without the element, which clients read as "not found".
    EXPECT_EQ(client_->command("SR_GET_SHAREDRESOURCE", {{"srName", "NOPE"}}).body,
              document("<SR_GET_SHAREDRESOURCE/>"));
    EXPECT_EQ(client_->command("SR_EXISTS", {{"srName", "NOPE"}, {"srPath", pathDocument("x")}}).body,
              "unknown shared resource 'NOPE'");
    EXPECT_EQ(client_->command("SR_EXISTS", {{"srName", "AREA"}}).body, "missing value \"srPath\"");
}

TEST_F(Shared, UploadDownloadAndDescribe)
{
    std::string content(300000, '\0');
    for (std::size_t i = 0; i < content.size(); ++i)
        content[i] = static_cast<char>(i * 7);
    ASSERT_TRUE(onPath("SR_MAKE", "in/deep").ok());
    WireReply up = upload("in/deep/data.bin", content);
    ASSERT_TRUE(up.ok()) << up.body;
    EXPECT_TRUE(readFile(areaDir_ + "/in/deep/data.bin") == content);
    EXPECT_EQ(entriesOf(areaDir_ + "/in/deep"), std::vector<std::string>{"data.bin"});
    EXPECT_EQ(onPath("SR_EXISTS", "in/deep/data.bin").body, "true");
    EXPECT_EQ(onPath("SR_EXISTS", "in/x").body, "false");

    Download down = download("in/deep/data.bin");
    EXPECT_TRUE(down.gotFile);
    EXPECT_TRUE(down.content == content);
    EXPECT_TRUE(down.reply.ok());

    EXPECT_EQ(withoutTimes(onPath("SR_GET", "in/deep/data.bin").body),
              document("<SR_GET>" + fileInfo("FILE", "300000", "data.bin", "in/deep") + "</SR_GET>"));
    EXPECT_EQ(withoutTimes(onPath("SR_LIST", "in").body),
              document("<SR_LIST>" + fileInfo("DIR", "0", "deep", "in") + "</SR_LIST>"));
    EXPECT_EQ(onPath("SR_LIST", "in/deep/data.bin").body, "'in/deep/data.bin' is not a directory");
    EXPECT_EQ(onPath("SR_GET", "in/x").body, "'in/x' does not exist");

    // An empty upload replaces a file and downloads as empty.
    ASSERT_TRUE(upload("in/deep/data.bin", "").ok());
    EXPECT_EQ(readFile(areaDir_ + "/in/deep/data.bin"), "");
    down = download("in/deep/data.bin");
    EXPECT_TRUE(down.gotFile);
    EXPECT_EQ(down.content, "");
}

TEST_F(Shared, CrcMismatchIsRefusedWithoutAFile)
{
    ASSERT_TRUE(upload("keep.txt", "old").ok());
    WireReply bad = upload("keep.txt", "new content", crc32("new content") ^ 1);
    EXPECT_EQ(bad.status, "ERROR");
    EXPECT_EQ(bad.body.rfind("CRC mismatch", 0), 0u) << bad.body;
    EXPECT_EQ(upload("fresh.txt", "abc", 12345).status, "ERROR");
    EXPECT_EQ(readFile(areaDir_ + "/keep.txt"), "old");
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{"keep.txt"});
    // Without checking asked for, the announced CRC is not compared.
    EXPECT_TRUE(upload("unchecked.txt", "abc", 12345, false).ok());
    // The connection stays in step after a refusal.
    EXPECT_EQ(onPath("SR_EXISTS", "keep.txt").body, "true");
}

TEST_F(Shared, PathsCannotLeaveTheArea)
{
    std::string outside = root_ + "/outside";
    fs::create_directories(outside);
    writeFile(outside + "/secret.txt", "secret");
    fs::create_directory_symlink(outside, areaDir_ + "/escape");
    fs::create_symlink(outside + "/secret.txt", areaDir_ + "/secret-link");
    fs::create_symlink(root_ + "/nowhere", areaDir_ + "/dangling");
    fs::create_directories(areaDir_ + "/inner");
    fs::create_directory_symlink(areaDir_ + "/inner", areaDir_ + "/inner-link");

    const std::pair<std::string, std::string> cases[] = {
        {"../outside/secret.txt", "path '../outside/secret.txt' may not contain '..'"},
        {"inner/../../outside", "path 'inner/../../outside' may not contain '..'"},
        {"inner\\..\\..\\x", "path 'inner\\..\\..\\x' may not contain '..'"},
        {"\\\\host\\share", "absolute path '\\\\host\\share' is not allowed"},
        {"/../outside/secret.txt", "path '/../outside/secret.txt' may not contain '..'"},
        {"C:\\Windows", "absolute path 'C:\\Windows' is not allowed"},
        {"escape/secret.txt", "symbolic link 'escape' points outside shared resource 'AREA'"},
        {"secret-link", "symbolic link 'secret-link' points outside shared resource 'AREA'"},
        {"dangling", "symbolic link 'dangling' points outside shared resource 'AREA'"},
    };
    for (const auto& [path, expected] : cases) {
        for (const char* keyword : {"SR_EXISTS", "SR_GET", "SR_LIST", "SR_MAKE", "SR_DELETE"})
            EXPECT_EQ(onPath(keyword, path).body, expected) << keyword;
        EXPECT_EQ(upload(path, "x").body, expected);
        EXPECT_EQ(twoPaths("SR_COPY", "inner", path).body, expected);
        EXPECT_EQ(twoPaths("SR_MOVE", path, "inner/x").body, expected);
        Download down = download(path);
        EXPECT_FALSE(down.gotFile);
        EXPECT_EQ(down.reply.body, expected);
    }
    EXPECT_EQ(entriesOf(outside), std::vector<std::string>{"secret.txt"});
    EXPECT_EQ(readFile(outside + "/secret.txt"), "secret");
    // A link that stays inside the area is fine.
    EXPECT_TRUE(upload("inner-link/ok.txt", "ok").ok());
    EXPECT_EQ(readFile(areaDir_ + "/inner/ok.txt"), "ok");
    // The listing leaves out links that point outside.
    EXPECT_EQ(withoutTimes(onPath("SR_LIST", "").body),
              document("<SR_LIST>" + fileInfo("DIR", "0", "inner", "") + fileInfo("DIR", "0", "inner-link", "") +
                       "</SR_LIST>"));
}

TEST_F(Shared, CopyMoveMakeDelete)
{
    ASSERT_TRUE(onPath("SR_MAKE", "a/b").ok());
    EXPECT_TRUE(onPath("SR_MAKE", "a/b").ok());
    ASSERT_TRUE(upload("a/b/one.txt", "1").ok());
    ASSERT_TRUE(twoPaths("SR_COPY", "a/b/one.txt", "a/two.txt").ok());
    EXPECT_EQ(readFile(areaDir_ + "/a/two.txt"), "1");
    ASSERT_TRUE(twoPaths("SR_COPY", "a/b", "c").ok());
    EXPECT_EQ(readFile(areaDir_ + "/c/one.txt"), "1");
    EXPECT_EQ(twoPaths("SR_COPY", "a/b", "c").body, "'c' already exists");
    ASSERT_TRUE(twoPaths("SR_MOVE", "a/two.txt", "c/three.txt").ok());
    EXPECT_FALSE(fs::exists(areaDir_ + "/a/two.txt"));
    EXPECT_EQ(readFile(areaDir_ + "/c/three.txt"), "1");
    EXPECT_EQ(twoPaths("SR_MOVE", "missing", "x").body, "'missing' does not exist");
    EXPECT_EQ(twoPaths("SR_MOVE", "", "x").body, "the shared resource itself cannot be copied or moved");
    EXPECT_EQ(twoPaths("SR_COPY", "c/one.txt", "no/dir/x").body, "directory 'no/dir' does not exist");
    EXPECT_EQ(twoPaths("SR_COPY", "c/one.txt", "").body, "the shared resource itself cannot be replaced");
    EXPECT_EQ(upload("no/dir/x", "x").body, "directory 'no/dir' does not exist");
    EXPECT_EQ(upload("c", "x").body, "'c' is a directory");
    EXPECT_EQ(onPath("SR_DELETE", "c").body, "true");
    EXPECT_EQ(onPath("SR_DELETE", "c").body, "false");
    EXPECT_EQ(onPath("SR_DELETE", "").body, "the shared resource itself cannot be deleted");
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{"a"});
}

TEST_F(Shared, ViewersMayReadButNotWrite)
{
    auto vic = connectAs("vic");
    writeFile(areaDir_ + "/r.txt", "r");
    EXPECT_EQ(vic->command("SR_EXISTS", {{"srName", "AREA"}, {"srPath", pathDocument("r.txt")}}).body, "true");
    WireReply refused = vic->upload("SR_UPLOAD", {{"srName", "AREA"}, {"srDestPath", pathDocument("w.txt")}}, "w");
    EXPECT_EQ(refused.body, "Authorization Error: user 'vic' may not run SR_UPLOAD");
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{"r.txt"});
}

TEST_F(Shared, PathValueMustBeAPathDocument)
{
    auto exists = [&](const std::string& value) {
        return client_->command("SR_EXISTS", {{"srName", "AREA"}, {"srPath", value}}).body;
    };
    EXPECT_EQ(exists("r.txt").rfind("path value is not a PATH document", 0), 0u);
    EXPECT_EQ(exists("<?xml version=\"1.0\"?><X><FILE/></X>"), "path value holds no PATH element");
    writeFile(areaDir_ + "/n.txt", "n");
    EXPECT_EQ(exists("<X><PATH name=\"n.txt\" dirpath=\"\" abspath=\"\"/></X>"), "true");
}

class Paths : public ::testing::Test {
protected:
    void SetUp() override
    {
        root_ = makeTempDir();
        fs::create_directories(root_ + "/area/sub");
        std::string error;
        area_ = std::make_unique<zelserverd::SharedArea>(
            zelserverd::SharedResourceConfig{"A", root_ + "/area", "A", ""}, error);
        ASSERT_EQ(error, "");
        real_ = fs::canonical(root_ + "/area").string();
    }
    void TearDown() override { removeTree(root_); }

    std::string root_;
    std::string real_;
    std::unique_ptr<zelserverd::SharedArea> area_;
};

TEST_F(Paths, NormalisesAndMapsEveryComponent)
{
    struct Case {
        const char* client;
        const char* relative;
    };
    const Case cases[] = {
        {"", ""},
        {".", ""},
        {"sub", "sub"},
        {"sub//./file.txt", "sub/file.txt"},
        {"sub\\x\\y", "sub/x/y"},
        {"missing/deeper/still", "missing/deeper/still"},
        {"a..b/..c", "a..b/..c"},
        {"/sub/file.txt", "sub/file.txt"},
        {"/", ""},
    };
    for (const Case& c : cases) {
        zelserverd::AreaPath path;
        ASSERT_EQ(area_->resolve(c.client, path), "") << c.client;
        EXPECT_EQ(path.relative, c.relative);
        EXPECT_EQ(path.full, std::string(c.relative).empty() ? real_ : real_ + "/" + c.relative);
    }
}

TEST_F(Paths, LinkTargetsAreCheckedWhereverTheLinkStands)
{
    fs::create_directories(root_ + "/out");
    fs::create_directory_symlink(root_ + "/out", root_ + "/area/sub/out");
    fs::create_directory_symlink("..", root_ + "/area/sub/up");
    fs::create_directory_symlink(".", root_ + "/area/sub/self");
    zelserverd::AreaPath path;
    EXPECT_EQ(area_->resolve("sub/out/new/file", path), "symbolic link 'sub/out' points outside shared resource 'A'");
    EXPECT_EQ(area_->resolve("sub/up/sub", path), "");
    EXPECT_EQ(area_->resolve("sub/up/sub/up/up", path), "");
    EXPECT_EQ(area_->resolve("sub/self/self/x", path), "");
}

}  // namespace
}  // namespace zeltest
