// Runs a server in-process on a free loopback port, with a fresh data directory and a
// configuration of known users for each test.
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "server.h"
#include "test_client.h"

namespace zeltest {

// Users of the test configuration: admin/adminpw (admin), ann/annpw (user),
// vic/vicpw (viewer), aud/audpw (the custom role "auditor": shared resources read only).
constexpr const char* kSsoSecret = "sso-shared-secret";

std::string makeTempDir();
void removeTree(const std::string& path);
std::string readFile(const std::string& path);
void writeFile(const std::string& path, const std::string& content);

class ServerFixture : public ::testing::Test {
 protected:
  void SetUp() override;
  void TearDown() override;

  // Starts (or restarts, on the same data directory) the server.
  void startServer();
  void stopServer();
  std::uint16_t port() const { return server_->port(); }
  zelserverd::ServerState& state() { return server_->state(); }
  // A connection already signed in as `user` (password: user + "pw").
  std::unique_ptr<TestClient> connectAs(const std::string& user);

  std::string root_;     // everything of this test lives below
  std::string dataDir_;
  std::string areaDir_;  // the shared resource "AREA"
  std::string configPath_;
  std::unique_ptr<zelserverd::Server> server_;
};

}  // namespace zeltest
