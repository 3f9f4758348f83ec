// Jobs: the result text and log of finished jobs, refused submissions, processes that must not
// outlive their job, owners, the job account of a root server, and a restart.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

const char* kEchoWorkspace = R"ws(#!/bin/sh
# @title Echo
# @parameter GREETING | TEXT | hello | What to say
# @parameter TARGET | TEXT | world
echo "say $GREETING $TARGET"
echo "$GREETING" > out.txt
echo "job $ZEL_JOB_ID in $(pwd)" >&2
)ws";

class Jobs : public ServerFixture {
protected:
    void SetUp() override
    {
        ServerFixture::SetUp();
        ASSERT_TRUE(addItem("echo.zlw", kEchoWorkspace).ok());
    }
    std::string log(long id)
    {
        Download down =
            admin_->download("LOG_GET_FILE", {{"jobID", std::to_string(id)}, {"logFileCRCCheckingEnabled", "false"}});
        EXPECT_TRUE(down.gotFile);
        return down.content;
    }
    WireReply onJob(const char* keyword, const std::string& id) { return admin_->command(keyword, {{"jobID", id}}); }
};

bool contains(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

// Gone, or a zombie nobody has reaped yet: either way no longer running.
bool processGone(const std::string& pid)
{
    const std::string text = slurp("/proc/" + pid + "/stat");
    std::size_t paren = text.rfind(')');
    return text.empty() || (paren != std::string::npos && text.substr(paren + 2, 1) == "Z");
}

TEST_F(Jobs, FinishedJobsReportTheirOutcomeAndLeaveALog)
{
    long id = submit("echo.zlw", {{"TARGET", "moon"}});
    ASSERT_GT(id, 0) << lastReply_.body;
    const std::string job = std::to_string(id);
    ASSERT_EQ(waitForEnd(id)["jobStatus"], "SUCCESS");
    EXPECT_EQ(withoutTimes(onJob("GET_JOB_RESULT_STRING", job).body),
              "id=" + job + "\0jobStatus=SUCCESS\0requestKeyword=zeljob\0request="s +
                  requestText("echo.zlw", {{"TARGET", "moon"}}) +
                  "\0timeRequested=TIME\0timeStarted=TIME\0timeFinished=TIME"
                  "\0result=0:Translation was successful\0resultSuccess=true\0serviceSuccess=true"
                  "\0serviceMsg=Translation was successful"s);
    // The default of GREETING, the given TARGET, and the job's own directory.
    EXPECT_EQ(slurp(jobFile(id, "out.txt")), "hello\n");
    std::string text = log(id);
    std::string dir = std::filesystem::canonical(dataDir_).string() + "/jobs/" + job;
    for (const std::string& line : {"say hello moon\n"s, "job " + job + " in " + dir + "/work\n",
                                    "zelserverd: job " + job + " submitted by admin", "zelserverd: finished at "s})
        EXPECT_TRUE(contains(text, line)) << text;
    EXPECT_EQ(onJob("LOG_GET_FILEINFO", job).body, document("<LOG_GET_FILEINFO><LOGFILEINFO size=\"" +
                                                            std::to_string(text.size()) + "\"/></LOG_GET_FILEINFO>"));

    // A result port nobody listens on: the job still ends, and its log says where the result went.
    long lost = submit("echo.zlw", {}, {{"requesterResultPort", "1"}, {"requesterHost", "127.0.0.1"}});
    ASSERT_EQ(waitForEnd(lost)["jobStatus"], "SUCCESS");
    EXPECT_TRUE(eventually([&] { return contains(log(lost), "result not delivered"); }));
}

// Whether the job ends by itself or is aborted, nothing it started keeps running, not even a process
// in a session of its own.
TEST_F(Jobs, EndingAJobKillsEverythingItStarted)
{
    ASSERT_TRUE(addItem("escape.zlw", "setsid sleep 300 &\necho $! > child.pid\n").ok());
    ASSERT_TRUE(addItem("hang.zlw", "sleep 300 &\necho $! > child.pid\nsetsid sleep 300 &\nwait\n").ok());
    for (bool abort : {false, true}) {
        long id = submit(abort ? "hang.zlw" : "escape.zlw");
        const std::string job = std::to_string(id);
        std::string pid;
        ASSERT_TRUE(eventually([&] { return !(pid = slurp(jobFile(id, "child.pid"))).empty() && pid.back() == '\n'; }));
        pid.pop_back();
        if (abort) {
            ASSERT_EQ(onJob("ABORT_JOB_REQUEST", job).body, "true");
            // The abort answers once the job is recorded as ended.
            EXPECT_EQ(result(id)["result"], "1002:job aborted by admin");
            EXPECT_EQ(onJob("ABORT_JOB_REQUEST", job).body, "job " + job + " has already ended");
        }
        EXPECT_EQ(waitForEnd(id)["jobStatus"], abort ? "ABORTED" : "SUCCESS");
        EXPECT_TRUE(eventually([&] { return processGone(pid); })) << "left running: " << pid;
    }
}

TEST_F(Jobs, JobsAnswerOnlyToTheirOwnerAndAdministrators)
{
    auto ann = connectAs("ann");
    WireReply submitted = ann->command("JOB_REQUEST", {{"keyword", "zeljob"}, {"request", requestText("echo.zlw")}});
    ASSERT_TRUE(submitted.ok()) << submitted.body;
    const std::string annJob = submitted.body;
    const std::string adminJob = std::to_string(submit("echo.zlw"));
    waitForEnd(std::stol(annJob));
    waitForEnd(std::stol(adminJob));
    for (const char* keyword :
         {"GET_JOB_RESULT_STRING", "LOG_FILEEXISTS", "LOG_GET_FILEINFO", "LOG_GET_FILE", "ABORT_JOB_REQUEST"}) {
        EXPECT_EQ(ann->command(keyword, {{"jobID", adminJob}}).body,
                  "Authorization Error: user 'ann' may not reach job " + adminJob + " of user 'admin'")
            << keyword;
        if (std::string(keyword) != "LOG_GET_FILE") {
            EXPECT_NE(ann->command(keyword, {{"jobID", annJob}}).body.rfind("Authorization Error", 0), 0u) << keyword;
            EXPECT_NE(onJob(keyword, annJob).body.rfind("Authorization Error", 0), 0u) << keyword;
        }
    }
    EXPECT_TRUE(ann->download("LOG_GET_FILE", {{"jobID", annJob}}).gotFile);
}

// Run as root (as CI does), jobs run as the job account and cannot touch the data directory.
TEST_F(Jobs, JobsOfARootServerCannotReadOrWriteTheServersFiles)
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
    EXPECT_NE(slurp(jobFile(id, "uid.txt")), "0\n");
    EXPECT_FALSE(std::filesystem::exists(dataDir_ + "/intruder"));
}

TEST_F(Jobs, ResultsSurviveARestartAndUnfinishedJobsEndAborted)
{
    long done = submit("echo.zlw");
    ASSERT_EQ(waitForEnd(done)["jobStatus"], "SUCCESS");
    long pending = submit("echo.zlw", {}, {{"secondsFromNow", "3600"}});
    ASSERT_GT(pending, 0);
    EXPECT_EQ(result(pending)["jobStatus"], "DELAYED");
    startServer();
    EXPECT_EQ(result(done)["jobStatus"], "SUCCESS");
    EXPECT_EQ(result(pending)["result"].substr(0, 5), "1005:");
    EXPECT_GT(submit("echo.zlw"), pending);
}

}  // namespace
}  // namespace zeltest
