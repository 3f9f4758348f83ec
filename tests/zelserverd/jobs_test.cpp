// Jobs: running, failing, aborting, transacting through the result port, scheduling, logs and
// the request text.
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include "jobs.h"
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

class Jobs : public RepositoryFixture {
protected:
    void SetUp() override
    {
        RepositoryFixture::SetUp();
        ASSERT_TRUE(addItem("echo.zlw", kEchoWorkspace).ok());
        ASSERT_TRUE(addItem("fail.zlw", "# @title Fails\necho broken >&2\nexit 3\n").ok());
        ASSERT_TRUE(addItem("sleep.zlw", "sleep 300 &\necho $! > child.pid\nwait\n").ok());
    }
    std::string log(long id)
    {
        Download down =
            admin_->download("LOG_GET_FILE", {{"jobID", std::to_string(id)}, {"logFileCRCCheckingEnabled", "false"}});
        EXPECT_TRUE(down.gotFile);
        return down.content;
    }
    WireReply onJob(const char* keyword, long id) { return admin_->command(keyword, {{"jobID", std::to_string(id)}}); }
    std::string jobFile(long id, const std::string& name)
    {
        return dataDir_ + "/jobs/" + std::to_string(id) + "/work/" + name;
    }
};

bool contains(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

// Gone, or a zombie nobody has reaped yet: either way no longer running.
bool processGone(pid_t pid)
{
    std::ifstream stat("/proc/" + std::to_string(pid) + "/stat");
    std::string text((std::istreambuf_iterator<char>(stat)), std::istreambuf_iterator<char>());
    std::size_t paren = text.rfind(')');
    return text.empty() || (paren != std::string::npos && text.substr(paren + 2, 1) == "Z");
}

TEST_F(Jobs, FinishedJobsReportTheirOutcomeAndLeaveALog)
{
    long id = submit("echo.zlw", {{"TARGET", "moon"}});
    ASSERT_GT(id, 0) << lastReply_.body;
    long failing = submit("fail.zlw");
    ASSERT_EQ(waitForEnd(id)["jobStatus"], "SUCCESS");
    EXPECT_EQ(withoutTimes(onJob("GET_JOB_RESULT_STRING", id).body),
              "id=" + std::to_string(id) + "\0jobStatus=SUCCESS\0requestKeyword=zeljob\0request="s +
                  requestText("echo.zlw", {{"TARGET", "moon"}}) +
                  "\0timeRequested=TIME\0timeStarted=TIME\0timeFinished=TIME"
                  "\0result=0:Translation was successful\0resultSuccess=true\0serviceSuccess=true"
                  "\0serviceMsg=Translation was successful"s);
    // The default of GREETING, the given TARGET, and the job's own directory.
    EXPECT_EQ(readFile(jobFile(id, "out.txt")), "hello\n");
    std::string text = log(id);
    std::string dir = std::filesystem::canonical(dataDir_).string() + "/jobs/" + std::to_string(id);
    EXPECT_TRUE(contains(text, "say hello moon\n")) << text;
    EXPECT_TRUE(contains(text, "job " + std::to_string(id) + " in " + dir + "/work\n")) << text;
    EXPECT_TRUE(contains(text, "zelserverd: job " + std::to_string(id) + " submitted by admin"));
    EXPECT_TRUE(contains(text, "zelserverd: finished at "));
    EXPECT_EQ(onJob("LOG_FILEEXISTS", id).body, "true");
    EXPECT_EQ(onJob("LOG_GET_FILEINFO", id).body, document("<LOG_GET_FILEINFO><LOGFILEINFO size=\"" +
                                                           std::to_string(text.size()) + "\"/></LOG_GET_FILEINFO>"));

    auto r = waitForEnd(failing);
    EXPECT_EQ(r["jobStatus"], "JOB_FAILURE");
    EXPECT_EQ(r["result"], "3:workspace exited with status 3");
    EXPECT_EQ(r["serviceSuccess"], "true");
    EXPECT_EQ(r["resultSuccess"], "false");
    EXPECT_TRUE(contains(log(failing), "broken\n"));
}

TEST_F(Jobs, AbortEndsTheWholeProcessGroup)
{
    long id = submit("sleep.zlw");
    ASSERT_GT(id, 0);
    std::string pidFile = jobFile(id, "child.pid");
    ASSERT_TRUE(eventually([&] { return contains(readFile(pidFile), "\n"); }));
    pid_t child = std::stoi(readFile(pidFile));
    ASSERT_FALSE(processGone(child));
    ASSERT_EQ(onJob("ABORT_JOB_REQUEST", id).body, "true");
    // The abort answers once the job is recorded as ended.
    auto r = result(id);
    EXPECT_EQ(r["jobStatus"], "ABORTED");
    EXPECT_EQ(r["result"], "1002:job aborted by admin");
    EXPECT_TRUE(eventually([&] { return processGone(child); }));
    EXPECT_EQ(onJob("ABORT_JOB_REQUEST", id).body, "job " + std::to_string(id) + " has already ended");
}

TEST_F(Jobs, TransactDeliversTheResultToTheResultPort)
{
    int listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in addr{};
    addr.sin_family = AF_INET;
    addr.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t len = sizeof addr;
    ASSERT_EQ(::bind(listener, reinterpret_cast<sockaddr*>(&addr), len), 0);
    ASSERT_EQ(::listen(listener, 1), 0);
    ::getsockname(listener, reinterpret_cast<sockaddr*>(&addr), &len);
    std::string port = std::to_string(ntohs(addr.sin_port));
    // The bound port comes first; a caller's own directive of the same name follows and must
    // not be the one used.
    long id = submit("echo.zlw", {},
                     {{"requesterResultPort", port},
                      {"requesterHost", "127.0.0.1"},
                      {"requesterResultPort", "1"},
                      {"notificationMsg", "topic:message"}});
    ASSERT_GT(id, 0) << lastReply_.body;
    pollfd p{listener, POLLIN, 0};
    ASSERT_EQ(::poll(&p, 1, 20000), 1);
    int fd = ::accept(listener, nullptr, nullptr);
    ::close(listener);
    ASSERT_GE(fd, 0);
    unsigned char prefix[4];
    ASSERT_EQ(::recv(fd, prefix, 4, MSG_WAITALL), 4);
    std::size_t n = (std::size_t{prefix[0]} << 24) | (prefix[1] << 16) | (prefix[2] << 8) | prefix[3];
    std::string payload(n, '\0');
    ASSERT_EQ(::recv(fd, payload.data(), n, MSG_WAITALL), static_cast<ssize_t>(n));
    ::close(fd);
    auto r = parseResult(payload);
    EXPECT_EQ(r["id"], std::to_string(id));
    EXPECT_EQ(r["jobStatus"], "SUCCESS");
    EXPECT_EQ(r["requesterResultPort"], port);
    EXPECT_EQ(r["requesterHost"], "127.0.0.1");
    EXPECT_TRUE(contains(log(id), "notification 'topic:message' not sent"));
    EXPECT_TRUE(eventually([&] { return contains(log(id), "result sent to 127.0.0.1:" + port); }));
}

TEST_F(Jobs, ScheduledJobWaitsAndCanBeAbortedBeforeItRuns)
{
    long soon = submit("echo.zlw", {}, {{"secondsFromNow", "1"}});
    long later = submit("echo.zlw", {}, {{"secondsFromNow", "3600"}});
    ASSERT_GT(soon, 0);
    ASSERT_GT(later, 0);
    EXPECT_EQ(result(later)["jobStatus"], "DELAYED");
    EXPECT_EQ(waitForEnd(soon)["jobStatus"], "SUCCESS");
    EXPECT_EQ(result(later)["jobStatus"], "DELAYED");
    ASSERT_TRUE(onJob("ABORT_JOB_REQUEST", later).ok());
    EXPECT_EQ(result(later)["jobStatus"], "ABORTED");
    std::string text = log(later);
    EXPECT_TRUE(contains(text, "delayed by 3600 seconds"));
    EXPECT_FALSE(contains(text, "started at"));
}

TEST_F(Jobs, RefusedSubmissions)
{
    const std::pair<Values, std::string> cases[] = {
        {{{"keyword", "nope"}, {"request", requestText("echo.zlw")}},
         "unknown job service 'nope' (this server has: zeljob)"},
        {{{"keyword", "zeljob"}, {"request", requestText("missing.zlw")}},
         "workspace 'REPO/missing/missing.zlw' not found"},
        {{{"keyword", "zeljob"}, {"request", requestText("echo.zlw", {{"COLOUR", "red"}})}},
         "workspace 'echo.zlw' has no published parameter 'COLOUR'"},
        {{{"keyword", "zeljob"}, {"request", "REPO/echo.zlw"}},
         "workspace path 'REPO/echo.zlw' is not REPOSITORY/NAME/NAME.zlw (NAME being the workspace "
         "name less its extension)"},
        {{{"keyword", "zeljob"}, {"request", "REPO/echo/echo.zlw -XML_PARAMETER <A>"}},
         "request parameters: malformed XML: Start-end tags mismatch"},
        {{{"keyword", "zeljob"}}, "missing value \"request\""},
        {{{"keyword", "zeljob"}, {"request", requestText("echo.zlw")}, {"requesterHost", "x"}},
         "requesterResultPort and requesterHost go together"},
        {{{"keyword", "zeljob"}, {"request", requestText("echo.zlw")}, {"secondsFromNow", "-5"}},
         "bad secondsFromNow '-5'"},
    };
    for (const auto& [values, error] : cases) {
        WireReply reply = admin_->command("JOB_REQUEST", values);
        EXPECT_EQ(reply.status, "ERROR");
        EXPECT_EQ(reply.body, error);
    }
    // The keyword is looked up without the blanks that submissions keep around it.
    WireReply spaced = admin_->command("JOB_REQUEST", {{"keyword", " zeljob "}, {"request", requestText("echo.zlw")}});
    ASSERT_TRUE(spaced.ok()) << spaced.body;
    EXPECT_EQ(waitForEnd(std::stol(spaced.body))["jobStatus"], "SUCCESS");
    auto vic = connectAs("vic");
    EXPECT_EQ(vic->command("JOB_REQUEST", {{"keyword", "zeljob"}, {"request", "x"}}).body,
              "Authorization Error: user 'vic' may not run JOB_REQUEST");
}

TEST_F(Jobs, UnknownJobs)
{
    EXPECT_EQ(onJob("GET_JOB_RESULT_STRING", 999).body, "null");
    // 4294967295 travels as -1.
    EXPECT_EQ(onJob("GET_JOB_RESULT_STRING", -1).body, "null");
    EXPECT_EQ(onJob("LOG_FILEEXISTS", 999).body, "false");
    EXPECT_EQ(onJob("LOG_GET_FILEINFO", 999).body, "job 999 has no log");
    EXPECT_EQ(onJob("ABORT_JOB_REQUEST", 999).body, "unknown job 999");
    EXPECT_EQ(admin_->command("ABORT_JOB_REQUEST", {{"jobID", "x"}}).body, "bad job id 'x'");
    EXPECT_EQ(admin_->command("ABORT_JOB_REQUEST", {{"jobID", "4294967296"}}).body, "bad job id '4294967296'");
    Download down = admin_->download("LOG_GET_FILE", {{"jobID", "999"}});
    EXPECT_FALSE(down.gotFile);
    EXPECT_EQ(down.reply.body, "job 999 has no log");
    // The connection is still in step after the refused download.
    EXPECT_EQ(onJob("LOG_FILEEXISTS", 999).body, "false");
}

TEST_F(Jobs, ResultsSurviveARestartAndUnfinishedJobsEndAborted)
{
    long done = submit("echo.zlw");
    ASSERT_EQ(waitForEnd(done)["jobStatus"], "SUCCESS");
    long pending = submit("echo.zlw", {}, {{"secondsFromNow", "3600"}});
    ASSERT_GT(pending, 0);
    restart();
    EXPECT_EQ(result(done)["jobStatus"], "SUCCESS");
    auto r = result(pending);
    EXPECT_EQ(r["jobStatus"], "ABORTED");
    EXPECT_EQ(r["result"].substr(0, 5), "1005:");
    EXPECT_GT(submit("echo.zlw"), pending);
}

}  // namespace
}  // namespace zeltest
