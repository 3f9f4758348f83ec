#include "server_fixture.h"

#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace zeltest {

std::string makeTempDir() {
  std::string pattern = (std::filesystem::temp_directory_path() / "zelserverd-test-XXXXXX").string();
  if (!::mkdtemp(pattern.data())) return {};
  return pattern;
}

void removeTree(const std::string& path) {
  std::error_code ec;
  std::filesystem::remove_all(path, ec);
}

std::string readFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::stringstream text;
  text << in.rdbuf();
  return text.str();
}

void writeFile(const std::string& path, const std::string& content) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out << content;
}

void ServerFixture::SetUp() {
  root_ = makeTempDir();
  ASSERT_FALSE(root_.empty());
  dataDir_ = root_ + "/data";
  areaDir_ = root_ + "/area";
  configPath_ = root_ + "/zelserverd.conf";
  std::filesystem::create_directories(areaDir_);
  writeFile(configPath_, std::string(R"(
# test configuration
[server]
workers = 2
max_request_bytes = 65536
sso_secret = )") + kSsoSecret + R"(

[role auditor]
rights = sharedresources.read

[user admin]
password = adminpw
roles = admin

[user ann]
password = annpw
roles = user

[user vic]
password = vicpw
roles = viewer

[user aud]
password = audpw
roles = auditor

[sharedresource AREA]
path = area
display_name = Test area
description = Files of the test

[jobservice zeljob]
)");
  startServer();
}

void ServerFixture::TearDown() {
  stopServer();
  removeTree(root_);
}

void ServerFixture::startServer() {
  stopServer();
  zelserverd::ServerOptions options;
  options.dataDir = dataDir_;
  options.configFile = configPath_;
  options.listen = "127.0.0.1:0";
  options.quiet = true;
  std::string error;
  server_ = zelserverd::Server::create(options, error);
  ASSERT_TRUE(server_) << error;
  server_->start();
}

void ServerFixture::stopServer() {
  if (server_) server_->stop();
  server_.reset();
}

std::unique_ptr<TestClient> ServerFixture::connectAs(const std::string& user) {
  auto client = std::make_unique<TestClient>();
  EXPECT_TRUE(client->connect(port()));
  WireReply reply = client->signIn(user, user + "pw");
  EXPECT_TRUE(reply.ok()) << reply.body;
  return client;
}

}  // namespace zeltest
