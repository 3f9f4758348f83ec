// What one user of a shared server cannot do to another: reach their jobs, read a password the
// server keeps, leave processes behind, read the server's files from a job.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <thread>

#include "auth.h"
#include "support/server_fixture.h"

namespace zeltest {
namespace {

class Isolation : public RepositoryFixture {
protected:
    void SetUp() override
    {
        RepositoryFixture::SetUp();
        ASSERT_TRUE(addItem("noop.zlw", "true\n").ok());
    }
};

TEST_F(Isolation, JobsAnswerOnlyToTheirOwnerAndAdministrators)
{
    auto ann = connectAs("ann");
    WireReply submitted = ann->command("JOB_REQUEST", {{"keyword", "zeljob"}, {"request", requestText("noop.zlw")}});
    ASSERT_TRUE(submitted.ok()) << submitted.body;
    const std::string annJob = submitted.body;
    const std::string adminJob = std::to_string(submit("noop.zlw"));
    waitForEnd(std::stol(annJob));
    waitForEnd(std::stol(adminJob));
    for (const char* keyword :
         {"GET_JOB_RESULT_STRING", "LOG_FILEEXISTS", "LOG_GET_FILEINFO", "LOG_GET_FILE", "ABORT_JOB_REQUEST"}) {
        EXPECT_EQ(ann->command(keyword, {{"jobID", adminJob}}).body,
                  "Authorization Error: user 'ann' may not reach job " + adminJob + " of user 'admin'")
            << keyword;
        if (std::string(keyword) != "LOG_GET_FILE") {
            EXPECT_NE(ann->command(keyword, {{"jobID", annJob}}).body.rfind("Authorization Error", 0), 0u) << keyword;
            EXPECT_NE(admin_->command(keyword, {{"jobID", annJob}}).body.rfind("Authorization Error", 0), 0u)
                << keyword;
        }
    }
    EXPECT_TRUE(ann->download("LOG_GET_FILE", {{"jobID", annJob}}).gotFile);
}

// Gone, or a zombie nobody has reaped yet: either way no longer running.
bool processGone(const std::string& pid)
{
    std::ifstream stat("/proc/" + pid + "/stat");
    std::string text((std::istreambuf_iterator<char>(stat)), std::istreambuf_iterator<char>());
    std::size_t paren = text.rfind(')');
    return text.empty() || (paren != std::string::npos && text.substr(paren + 2, 1) == "Z");
}

TEST_F(Isolation, EndingAJobKillsEverythingItStartedEvenInANewSession)
{
    ASSERT_TRUE(addItem("escape.zlw", "setsid sleep 300 &\necho $! > child.pid\n").ok());
    ASSERT_TRUE(addItem("hang.zlw", "setsid sleep 300 &\necho $! > child.pid\nsleep 300\n").ok());
    for (bool abort : {false, true}) {
        long id = submit(abort ? "hang.zlw" : "escape.zlw");
        const std::string pidFile = dataDir_ + "/jobs/" + std::to_string(id) + "/work/child.pid";
        std::string pid;
        ASSERT_TRUE(eventually([&] { return !(pid = readFile(pidFile)).empty() && pid.back() == '\n'; }));
        pid.pop_back();
        if (abort) {
            EXPECT_TRUE(admin_->command("ABORT_JOB_REQUEST", {{"jobID", std::to_string(id)}}).ok());
        }
        EXPECT_EQ(waitForEnd(id)["jobStatus"], abort ? "ABORTED" : "SUCCESS");
        EXPECT_TRUE(eventually([&] { return processGone(pid); })) << "left running: " << pid;
    }
}

// Run as root (as CI does), jobs run as the job account and cannot touch the data directory.
TEST_F(Isolation, JobsOfARootServerCannotReadOrWriteTheServersFiles)
{
    if (::geteuid() != 0)
        GTEST_SKIP() << "the server runs jobs with its own rights when it is not root";
    ASSERT_TRUE(addItem("peek.zlw", "# @parameter DATA | TEXT\n"
                                    "touch \"$DATA/intruder\" 2>/dev/null && exit 1\n"
                                    "cat \"$DATA/zelserverd.db\" > /dev/null 2>&1 && exit 2\n"
                                    "id -u > uid.txt\nexit 5\n")
                    .ok());
    long id = submit("peek.zlw", {{"DATA", dataDir_}});
    EXPECT_EQ(waitForEnd(id)["result"], "5:workspace exited with status 5");
    EXPECT_NE(readFile(dataDir_ + "/jobs/" + std::to_string(id) + "/work/uid.txt"), "0\n");
    EXPECT_FALSE(std::filesystem::exists(dataDir_ + "/intruder"));
}

TEST_F(Isolation, RepeatedSignInFailuresLockTheAccountAndTheAddressForAWhile)
{
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    for (int i = 0; i < 6; ++i)
        EXPECT_EQ(client.signIn("ann", "guess").body, "Authentication Error: invalid user name or password") << i;
    for (const char* user : {"ann", "vic"})
        EXPECT_EQ(client.signIn(user, std::string(user) + "pw").body,
                  "Authentication Error: too many failed sign-ins for this account or from this address; try "
                  "again in 1 seconds");
    std::this_thread::sleep_for(std::chrono::milliseconds(1100));
    EXPECT_TRUE(client.signIn("ann", "annpw").ok());
    EXPECT_TRUE(client.signIn("vic", "vicpw").ok());
}

TEST_F(Isolation, TemporariesStayInTheServersOwnFolderAndAreSweptAtStart)
{
    using namespace std::string_literals;
    writeFile(areaDir_ + "/.zelserverd-notes", "a user's own file");
    auto ann = connectAs("ann");
    ASSERT_TRUE(ann->sendFrame(requestPayload("SR_UPLOAD", {{"srName", "AREA"}, {"srDestPath", pathDocument("u")}})));
    ASSERT_EQ(splitReply(ann->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(ann->sendFrame("fileLength=100\0fileCRC=0"s));
    ASSERT_EQ(splitReply(ann->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(ann->sendRaw("partial"));
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{".zelserverd-notes"});
    EXPECT_EQ(entriesOf(dataDir_ + "/tmp").size(), 1u);
    WireReply listed = connectAs("vic")->command("SR_LIST", {{"srName", "AREA"}, {"srPath", pathDocument("")}});
    EXPECT_NE(listed.body.find("name=\".zelserverd-notes\""), std::string::npos) << listed.body;
    writeFile(dataDir_ + "/tmp/.zelserverd-crashed", "left by a crash");
    ann.reset();
    startServer();
    EXPECT_TRUE(entriesOf(dataDir_ + "/tmp").empty());
}

TEST(Passwords, HashesAreCheckedPlainTextStaysAcceptedAndNothingElseMatches)
{
    const std::string hash = zelserverd::hashPassword("s3cret");
    ASSERT_EQ(hash.rfind("$y$", 0), 0u);
    EXPECT_NE(hash, zelserverd::hashPassword("s3cret")) << "each hash has its own salt";
    struct Case {
        std::string stored;
        std::string given;
        bool matches;
    };
    for (const Case& c : {Case{hash, "s3cret", true}, Case{hash, "s3cret ", false}, Case{hash, hash, false},
                          Case{"s3cret", "s3cret", true}, Case{"s3cret", "S3cret", false}, Case{"$bogus", "", false}})
        EXPECT_EQ(zelserverd::passwordMatches(c.stored, c.given), c.matches) << c.stored << " / " << c.given;
}

TEST(Passwords, GeneratedAdministratorIsKeptAsAHash)
{
    const std::string root = makeTempDir();
    zelserverd::ServerOptions options;
    options.dataDir = root + "/data";
    options.listen = "127.0.0.1:0";
    options.quiet = true;
    std::string error;
    auto server = zelserverd::Server::create(options, error);
    ASSERT_TRUE(server) << error;
    const std::string password = server->generatedPassword();
    const std::string stored = readFile(options.dataDir + "/admin-password.hash");
    EXPECT_EQ(stored.find(password), std::string::npos);
    EXPECT_TRUE(zelserverd::passwordMatches(stored.substr(0, stored.size() - 1), password));
    ASSERT_EQ(server->state().config.users.size(), 1u);
    EXPECT_EQ(server->state().config.users[0].password + "\n", stored);
    server.reset();
    removeTree(root);
}

}  // namespace
}  // namespace zeltest
