// Shared resources: every "SR_" command, confinement to the area, checked uploads.
#include <gtest/gtest.h>
#include <pugixml.hpp>
#include <unistd.h>

#include <filesystem>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

namespace fs = std::filesystem;

class Shared : public ServerFixture {
 protected:
  void SetUp() override {
    ServerFixture::SetUp();
    client_ = connectAs("ann");
  }
  void TearDown() override {
    client_.reset();
    ServerFixture::TearDown();
  }
  WireReply onPath(const std::string& keyword, const std::string& path) {
    return client_->command(keyword, {{"srName", "AREA"}, {"srPath", pathDocument(path)}});
  }
  WireReply twoPaths(const std::string& keyword, const std::string& from, const std::string& to) {
    return client_->command(keyword, {{"srName", "AREA"},
                                      {"srSrcPath", pathDocument(from)},
                                      {"srDestPath", pathDocument(to)}});
  }
  WireReply upload(const std::string& path, const std::string& content,
                   std::optional<std::uint32_t> crc = std::nullopt, bool check = true) {
    return client_->upload("SR_UPLOAD",
                           {{"srName", "AREA"},
                            {"srDestPath", pathDocument(path)},
                            {"itemFileCRCCheckingEnabled", check ? "true" : "false"}},
                           content, crc);
  }
  std::vector<std::string> areaNames(const std::string& sub = "") {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(areaDir_ + sub))
      names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
  }

  std::unique_ptr<TestClient> client_;
};

TEST_F(Shared, ListsAndFindsResources) {
  WireReply all = client_->command("SR_GET_SHAREDRESOURCES");
  ASSERT_TRUE(all.ok());
  pugi::xml_document doc;
  ASSERT_TRUE(doc.load_string(all.body.c_str()));
  pugi::xml_node area = doc.document_element().child("SHAREDRESOURCE");
  EXPECT_STREQ(area.attribute("name").value(), "AREA");
  EXPECT_STREQ(area.attribute("displayname").value(), "Test area");
  EXPECT_STREQ(area.attribute("description").value(), "Files of the test");
  EXPECT_FALSE(area.next_sibling("SHAREDRESOURCE"));

  WireReply one = client_->command("SR_GET_SHAREDRESOURCE", {{"srName", "AREA"}});
  ASSERT_TRUE(doc.load_string(one.body.c_str()));
  EXPECT_STREQ(doc.document_element().child("SHAREDRESOURCE").attribute("name").value(), "AREA");
  WireReply unknown = client_->command("SR_GET_SHAREDRESOURCE", {{"srName", "NOPE"}});
  ASSERT_TRUE(unknown.ok());
  ASSERT_TRUE(doc.load_string(unknown.body.c_str()));
  EXPECT_FALSE(doc.document_element().child("SHAREDRESOURCE"));
  EXPECT_EQ(onPath("SR_EXISTS", "x").body, "false");
  EXPECT_EQ(client_->command("SR_EXISTS", {{"srName", "NOPE"}, {"srPath", pathDocument("x")}}).body,
            "unknown shared resource 'NOPE'");
}

TEST_F(Shared, UploadDownloadAndDescribe) {
  std::string content(300000, '\0');
  for (std::size_t i = 0; i < content.size(); ++i) content[i] = static_cast<char>(i * 7);
  ASSERT_TRUE(onPath("SR_MAKE", "in/deep").ok());
  WireReply up = upload("in/deep/data.bin", content);
  ASSERT_TRUE(up.ok()) << up.body;
  EXPECT_TRUE(readFile(areaDir_ + "/in/deep/data.bin") == content);
  EXPECT_EQ(areaNames("/in/deep"), std::vector<std::string>{"data.bin"});
  EXPECT_EQ(onPath("SR_EXISTS", "in/deep/data.bin").body, "true");

  Download down = client_->download(
      "SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("in/deep/data.bin")}});
  EXPECT_TRUE(down.gotFile);
  EXPECT_EQ(down.content.size(), content.size());
  EXPECT_TRUE(down.content == content);
  EXPECT_TRUE(down.reply.ok());

  WireReply info = onPath("SR_GET", "in/deep/data.bin");
  pugi::xml_document doc;
  ASSERT_TRUE(doc.load_string(info.body.c_str())) << info.body;
  pugi::xml_node file = doc.document_element().child("FILEINFO");
  EXPECT_STREQ(file.attribute("filetype").value(), "FILE");
  EXPECT_STREQ(file.attribute("size").value(), "300000");
  EXPECT_EQ(std::string(file.attribute("date").value()).size(), 20u);
  EXPECT_STREQ(file.child("PATH").attribute("name").value(), "data.bin");
  EXPECT_STREQ(file.child("PATH").attribute("dirpath").value(), "in/deep");
  EXPECT_STREQ(file.child("PATH").attribute("abspath").value(), "in/deep/data.bin");

  WireReply listing = onPath("SR_LIST", "in");
  ASSERT_TRUE(doc.load_string(listing.body.c_str()));
  pugi::xml_node entry = doc.document_element().child("FILEINFO");
  EXPECT_STREQ(entry.attribute("filetype").value(), "DIR");
  EXPECT_STREQ(entry.attribute("abspath").value(), "in/deep");
  EXPECT_FALSE(entry.next_sibling("FILEINFO"));
  EXPECT_EQ(onPath("SR_LIST", "in/deep/data.bin").body, "'in/deep/data.bin' is not a directory");
}

TEST_F(Shared, EmptyFileAndReplacingUpload) {
  ASSERT_TRUE(upload("f.txt", "first version").ok());
  ASSERT_TRUE(upload("f.txt", "").ok());
  EXPECT_EQ(readFile(areaDir_ + "/f.txt"), "");
  Download down =
      client_->download("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("f.txt")}});
  EXPECT_TRUE(down.gotFile);
  EXPECT_EQ(down.content, "");
}

TEST_F(Shared, CrcMismatchIsRefusedWithoutAFile) {
  ASSERT_TRUE(upload("keep.txt", "old").ok());
  WireReply bad = upload("keep.txt", "new content", crc32("new content") ^ 1);
  EXPECT_EQ(bad.status, "ERROR");
  EXPECT_EQ(bad.body.rfind("CRC mismatch", 0), 0u) << bad.body;
  WireReply fresh = upload("fresh.txt", "abc", 12345);
  EXPECT_EQ(fresh.status, "ERROR");
  EXPECT_EQ(readFile(areaDir_ + "/keep.txt"), "old");
  EXPECT_EQ(areaNames(), std::vector<std::string>{"keep.txt"});
  // Without checking asked for, the announced CRC is not compared.
  EXPECT_TRUE(upload("unchecked.txt", "abc", 12345, false).ok());
  // The connection stays in step after a refusal.
  EXPECT_EQ(onPath("SR_EXISTS", "keep.txt").body, "true");
}

TEST_F(Shared, PathsCannotLeaveTheArea) {
  std::string outside = root_ + "/outside";
  fs::create_directories(outside);
  writeFile(outside + "/secret.txt", "secret");
  fs::create_directory_symlink(outside, areaDir_ + "/escape");
  fs::create_symlink(outside + "/secret.txt", areaDir_ + "/secret-link");
  fs::create_symlink(root_ + "/nowhere", areaDir_ + "/dangling");
  fs::create_directories(areaDir_ + "/inner");
  fs::create_directory_symlink(areaDir_ + "/inner", areaDir_ + "/inner-link");

  struct Case {
    std::string path;
    std::string expected;
  };
  const Case cases[] = {
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
  for (const Case& c : cases) {
    for (const char* keyword : {"SR_EXISTS", "SR_GET", "SR_LIST", "SR_MAKE", "SR_DELETE"}) {
      WireReply reply = onPath(keyword, c.path);
      EXPECT_EQ(reply.status, "ERROR") << keyword << " " << c.path;
      EXPECT_EQ(reply.body, c.expected) << keyword;
    }
    EXPECT_EQ(upload(c.path, "x").body, c.expected);
    EXPECT_EQ(twoPaths("SR_COPY", "inner", c.path).body, c.expected);
    EXPECT_EQ(twoPaths("SR_MOVE", c.path, "inner/x").body, c.expected);
    Download down =
        client_->download("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument(c.path)}});
    EXPECT_FALSE(down.gotFile);
    EXPECT_EQ(down.reply.body, c.expected);
  }
  EXPECT_EQ(readFile(outside + "/secret.txt"), "secret");
  EXPECT_EQ(fs::directory_iterator(outside) != fs::directory_iterator(), true);
  // A link that stays inside the area is fine.
  EXPECT_TRUE(upload("inner-link/ok.txt", "ok").ok());
  EXPECT_EQ(readFile(areaDir_ + "/inner/ok.txt"), "ok");
  // The listing leaves out links that point outside.
  pugi::xml_document doc;
  ASSERT_TRUE(doc.load_string(onPath("SR_LIST", "").body.c_str()));
  std::vector<std::string> listed;
  for (pugi::xml_node e : doc.document_element().children("FILEINFO"))
    listed.push_back(e.attribute("name").value());
  EXPECT_EQ(listed, (std::vector<std::string>{"inner", "inner-link"}));
}

TEST_F(Shared, CopyMoveMakeDelete) {
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
  EXPECT_EQ(twoPaths("SR_COPY", "c/one.txt", "no/dir/x").body, "directory 'no/dir' does not exist");
  EXPECT_EQ(upload("no/dir/x", "x").body, "directory 'no/dir' does not exist");
  EXPECT_EQ(upload("c", "x").body, "'c' is a directory");
  EXPECT_EQ(onPath("SR_DELETE", "c").body, "true");
  EXPECT_EQ(onPath("SR_DELETE", "c").body, "false");
  EXPECT_EQ(onPath("SR_DELETE", "").body, "the shared resource itself cannot be deleted");
  EXPECT_EQ(areaNames(), std::vector<std::string>{"a"});
}

TEST_F(Shared, ViewersMayReadButNotWrite) {
  auto vic = connectAs("vic");
  writeFile(areaDir_ + "/r.txt", "r");
  EXPECT_EQ(vic->command("SR_EXISTS", {{"srName", "AREA"}, {"srPath", pathDocument("r.txt")}}).body,
            "true");
  WireReply refused = vic->upload(
      "SR_UPLOAD", {{"srName", "AREA"}, {"srDestPath", pathDocument("w.txt")}}, "w");
  EXPECT_EQ(refused.body, "Authorization Error: user 'vic' may not run SR_UPLOAD");
  EXPECT_FALSE(fs::exists(areaDir_ + "/w.txt"));
}

TEST_F(Shared, PathValueMustBeAPathDocument) {
  WireReply plain = client_->command("SR_EXISTS", {{"srName", "AREA"}, {"srPath", "r.txt"}});
  EXPECT_EQ(plain.body.rfind("path value is not a PATH document", 0), 0u) << plain.body;
  WireReply other = client_->command(
      "SR_EXISTS", {{"srName", "AREA"}, {"srPath", "<?xml version=\"1.0\"?><X><FILE/></X>"}});
  EXPECT_EQ(other.body, "path value holds no PATH element");
  writeFile(areaDir_ + "/n.txt", "n");
  WireReply byParts = client_->command(
      "SR_EXISTS", {{"srName", "AREA"},
                    {"srPath", "<?xml version=\"1.0\"?><X><PATH name=\"n.txt\" dirpath=\"\" abspath=\"\"/></X>"}});
  EXPECT_EQ(byParts.body, "true");
}

}  // namespace
}  // namespace zeltest
