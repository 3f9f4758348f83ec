// Runs a server in-process on a free loopback port, with a fresh data directory, a configuration of
// known users, one repository "REPO" and an administrator's connection for each test; and what the
// suites share around it.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "server.h"
#include "support/environment.h"
#include "support/helpers.h"
#include "test_client.h"

namespace zeltest {

// Users of the test configuration: admin/adminpw (admin), ann/annpw (user),
// vic/vicpw (viewer), aud/audpw (the custom role "auditor": shared resources read only).
constexpr const char* kSsoSecret = "sso-shared-secret";

// The names in a directory, temporary files included, sorted.
std::vector<std::string> entriesOf(const std::string& dir);
// Polls `condition` for up to twenty seconds; for what a server thread does after the test's last
// exchange with it (a partial file discarded once a vanished client is noticed, a job ending).
bool eventually(const std::function<bool()>& condition);
// A reply document as the server writes it: the declaration, then `elements` as they are.
std::string document(const std::string& elements);
// `text` with every time stamp of the server's form replaced by "TIME".
std::string withoutTimes(const std::string& text);
// A "TRANSFORMATION_REQUEST" request text for REPO/NAME/NAME.zlw with published parameters.
std::string requestText(const std::string& workspace, const Values& parameters = {});

class ServerFixture : public ::testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    // Starts (or restarts, on the same data directory) the server, and signs the administrator in.
    void startServer();
    void stopServer();
    // Restarts the server with `settings` added to its [server] section.
    void restartWith(const std::string& settings);
    std::uint16_t port() const { return server_->port(); }
    zelserverd::ServerState& state() { return server_->state(); }
    // A connection already signed in as `user` (password: user + "pw").
    std::unique_ptr<TestClient> connectAs(const std::string& user);
    // The user the server has `client` signed in as: proof that the connection is in step.
    static std::string userOf(TestClient& client);

    WireReply addItem(const std::string& name, const std::string& content, const std::string& keyword = "REP_ADD_ITEM");
    // Submits a job as the administrator; its id, or 0 (the reply is kept in lastReply_).
    long submit(const std::string& workspace, const Values& parameters = {}, const Values& extra = {});
    // Polls until the job has ended (or `eventually` gives up); the last result seen.
    std::map<std::string, std::string> waitForEnd(long id);
    std::map<std::string, std::string> result(long id);
    std::string jobFile(long id, const std::string& name) const;
    std::size_t storedFiles() { return entriesOf(dataDir_ + "/store").size(); }

    const TempDir dir_{"zelserverd-test"};
    const std::string root_ = dir_.string();  // everything of this test lives below
    std::string dataDir_;
    std::string areaDir_;  // the shared resource "AREA"
    std::string configPath_;
    std::unique_ptr<zelserverd::Server> server_;
    std::unique_ptr<TestClient> admin_;
    WireReply lastReply_;
};

}  // namespace zeltest
