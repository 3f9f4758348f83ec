// Jobs: running, failing, aborting, transacting through the result port, scheduling, logs and
// the request text.
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <poll.h>
#include <pugixml.hpp>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <functional>
#include <thread>

#include "jobs.h"
#include "support/repository_fixture.h"

namespace zeltest {
namespace {

const char* kEchoWorkspace = R"ws(#!/bin/sh
# @title Echo
# @parameter GREETING | TEXT | hello | What to say
# @parameter TARGET | TEXT | world
echo "say $GREETING $TARGET"
echo "$GREETING" > out.txt
echo "job $ZEL_JOB_ID in $(pwd)" >&2
)ws";

const char* kFailingWorkspace = "# @title Fails\necho broken >&2\nexit 3\n";

const char* kSleepingWorkspace = R"(# @title Sleeps
sleep 300 &
echo $! > child.pid
echo started
wait
)";

class Jobs : public RepositoryFixture {
 protected:
  void SetUp() override {
    RepositoryFixture::SetUp();
    ASSERT_TRUE(addItem("echo.zlw", kEchoWorkspace).ok());
    ASSERT_TRUE(addItem("fail.zlw", kFailingWorkspace).ok());
    ASSERT_TRUE(addItem("sleep.zlw", kSleepingWorkspace).ok());
  }
  std::string log(long id) {
    Download down = admin_->download(
        "LOG_GET_FILE", {{"jobID", std::to_string(id)}, {"logFileCRCCheckingEnabled", "false"}});
    EXPECT_TRUE(down.gotFile);
    return down.content;
  }
  std::string jobFile(long id, const std::string& name) {
    return dataDir_ + "/jobs/" + std::to_string(id) + "/work/" + name;
  }
};

bool waitFor(const std::function<bool()>& condition) {
  auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
  while (std::chrono::steady_clock::now() < deadline) {
    if (condition()) return true;
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  return condition();
}

// Gone, or a zombie nobody has reaped yet: either way no longer running.
bool processGone(pid_t pid) {
  std::ifstream stat("/proc/" + std::to_string(pid) + "/stat");
  std::string text((std::istreambuf_iterator<char>(stat)), std::istreambuf_iterator<char>());
  std::size_t paren = text.rfind(')');
  return text.empty() || (paren != std::string::npos && text.substr(paren + 2, 1) == "Z");
}

TEST_F(Jobs, SucceedsWithParametersAndLeavesALog) {
  long id = submit("echo.zlw", {{"TARGET", "moon"}});
  ASSERT_GT(id, 0) << lastReply_.body;
  auto r = waitForEnd(id);
  EXPECT_EQ(r["jobStatus"], "SUCCESS");
  EXPECT_EQ(r["id"], std::to_string(id));
  EXPECT_EQ(r["result"], "0:Translation was successful");
  EXPECT_EQ(r["resultSuccess"], "true");
  EXPECT_EQ(r["requestKeyword"], "zeljob");
  EXPECT_EQ(r["timeRequested"].size(), 20u);
  EXPECT_EQ(r["timeFinished"].size(), 20u);
  EXPECT_EQ(r["request"], requestText("echo.zlw", {{"TARGET", "moon"}}));
  // The default of the undeclared-by-request GREETING, the given TARGET, and its own directory.
  EXPECT_EQ(readFile(jobFile(id, "out.txt")), "hello\n");
  std::string text = log(id);
  EXPECT_NE(text.find("say hello moon\n"), std::string::npos) << text;
  EXPECT_NE(text.find("job " + std::to_string(id) + " in " +
                      std::filesystem::canonical(dataDir_).string() + "/jobs/" +
                      std::to_string(id) + "/work\n"),
            std::string::npos)
      << text;
  EXPECT_NE(text.find("zelserverd: job " + std::to_string(id) + " submitted by admin"),
            std::string::npos);
  EXPECT_NE(text.find("zelserverd: finished at "), std::string::npos);

  EXPECT_EQ(admin_->command("LOG_FILEEXISTS", {{"jobID", std::to_string(id)}}).body, "true");
  WireReply info = admin_->command("LOG_GET_FILEINFO", {{"jobID", std::to_string(id)}});
  pugi::xml_document doc;
  ASSERT_TRUE(doc.load_string(info.body.c_str())) << info.body;
  EXPECT_EQ(std::string(doc.document_element().child("LOGFILEINFO").attribute("size").value()),
            std::to_string(text.size()));
}

TEST_F(Jobs, FailingWorkspaceReportsItsExitStatus) {
  long id = submit("fail.zlw");
  ASSERT_GT(id, 0);
  auto r = waitForEnd(id);
  EXPECT_EQ(r["jobStatus"], "JOB_FAILURE");
  EXPECT_EQ(r["result"], "3:workspace exited with status 3");
  EXPECT_EQ(r["resultSuccess"], "false");
  EXPECT_NE(log(id).find("broken\n"), std::string::npos);
}

TEST_F(Jobs, AbortEndsTheWholeProcessGroup) {
  long id = submit("sleep.zlw");
  ASSERT_GT(id, 0);
  std::string pidFile = jobFile(id, "child.pid");
  ASSERT_TRUE(waitFor([&] { return readFile(pidFile).find('\n') != std::string::npos; }));
  pid_t child = std::stoi(readFile(pidFile));
  ASSERT_FALSE(processGone(child));
  WireReply aborted = admin_->command("ABORT_JOB_REQUEST", {{"jobID", std::to_string(id)}});
  ASSERT_TRUE(aborted.ok()) << aborted.body;
  // The abort answers once the job is recorded as ended.
  auto r = result(id);
  EXPECT_EQ(r["jobStatus"], "ABORTED");
  EXPECT_EQ(r["result"], "1002:job aborted by admin");
  EXPECT_TRUE(waitFor([&] { return processGone(child); }));
  WireReply again = admin_->command("ABORT_JOB_REQUEST", {{"jobID", std::to_string(id)}});
  EXPECT_EQ(again.status, "ERROR");
  EXPECT_EQ(again.body, "job " + std::to_string(id) + " has already ended");
}

TEST_F(Jobs, TransactDeliversTheResultToTheResultPort) {
  int listener = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_in addr{};
  addr.sin_family = AF_INET;
  addr.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  ASSERT_EQ(::bind(listener, reinterpret_cast<sockaddr*>(&addr), sizeof addr), 0);
  ASSERT_EQ(::listen(listener, 1), 0);
  socklen_t len = sizeof addr;
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
  std::string text = log(id);
  EXPECT_NE(text.find("notification 'topic:message' not sent"), std::string::npos);
  EXPECT_TRUE(waitFor([&] { return log(id).find("result sent to 127.0.0.1:" + port) !=
                                   std::string::npos; }));
}

TEST_F(Jobs, ScheduledJobWaitsAndCanBeAbortedBeforeItRuns) {
  long soon = submit("echo.zlw", {}, {{"secondsFromNow", "1"}});
  long later = submit("echo.zlw", {}, {{"secondsFromNow", "3600"}});
  ASSERT_GT(soon, 0);
  ASSERT_GT(later, 0);
  EXPECT_EQ(result(later)["jobStatus"], "DELAYED");
  EXPECT_EQ(waitForEnd(soon)["jobStatus"], "SUCCESS");
  EXPECT_EQ(result(later)["jobStatus"], "DELAYED");
  ASSERT_TRUE(admin_->command("ABORT_JOB_REQUEST", {{"jobID", std::to_string(later)}}).ok());
  EXPECT_EQ(result(later)["jobStatus"], "ABORTED");
  std::string text = log(later);
  EXPECT_NE(text.find("delayed by 3600 seconds"), std::string::npos);
  EXPECT_EQ(text.find("started at"), std::string::npos);
  EXPECT_EQ(admin_->command("JOB_REQUEST", {{"keyword", "zeljob"},
                                            {"request", requestText("echo.zlw")},
                                            {"secondsFromNow", "-5"}})
                .body,
            "bad secondsFromNow '-5'");
}

TEST_F(Jobs, RefusedSubmissions) {
  struct Case {
    Values values;
    std::string error;
  };
  std::vector<Case> cases = {
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
  };
  for (const auto& c : cases) {
    WireReply reply = admin_->command("JOB_REQUEST", c.values);
    EXPECT_EQ(reply.status, "ERROR");
    EXPECT_EQ(reply.body, c.error);
  }
  // The keyword is looked up without the blanks that submissions keep around it.
  long id = 0;
  WireReply spaced = admin_->command(
      "JOB_REQUEST", {{"keyword", " zeljob "}, {"request", requestText("echo.zlw")}});
  ASSERT_TRUE(spaced.ok()) << spaced.body;
  id = std::stol(spaced.body);
  EXPECT_EQ(waitForEnd(id)["jobStatus"], "SUCCESS");
  auto vic = connectAs("vic");
  EXPECT_EQ(vic->command("JOB_REQUEST", {{"keyword", "zeljob"}, {"request", "x"}}).body,
            "Authorization Error: user 'vic' may not run JOB_REQUEST");
}

TEST_F(Jobs, UnknownJobs) {
  EXPECT_EQ(admin_->command("GET_JOB_RESULT_STRING", {{"jobID", "999"}}).body, "null");
  // 4294967295 travels as -1.
  EXPECT_EQ(admin_->command("GET_JOB_RESULT_STRING", {{"jobID", "-1"}}).body, "null");
  EXPECT_EQ(admin_->command("LOG_FILEEXISTS", {{"jobID", "999"}}).body, "false");
  EXPECT_EQ(admin_->command("LOG_GET_FILEINFO", {{"jobID", "999"}}).body, "job 999 has no log");
  EXPECT_EQ(admin_->command("ABORT_JOB_REQUEST", {{"jobID", "999"}}).body, "unknown job 999");
  EXPECT_EQ(admin_->command("ABORT_JOB_REQUEST", {{"jobID", "x"}}).body, "bad job id 'x'");
  Download down = admin_->download("LOG_GET_FILE", {{"jobID", "999"}});
  EXPECT_FALSE(down.gotFile);
  EXPECT_EQ(down.reply.status, "ERROR");
  // The connection is still in step after the refused download.
  EXPECT_EQ(admin_->command("LOG_FILEEXISTS", {{"jobID", "999"}}).body, "false");
}

TEST_F(Jobs, ResultsSurviveARestartAndUnfinishedJobsEndAborted) {
  long done = submit("echo.zlw");
  ASSERT_EQ(waitForEnd(done)["jobStatus"], "SUCCESS");
  long pending = submit("echo.zlw", {}, {{"secondsFromNow", "3600"}});
  ASSERT_GT(pending, 0);
  admin_.reset();
  startServer();
  admin_ = connectAs("admin");
  EXPECT_EQ(result(done)["jobStatus"], "SUCCESS");
  auto r = result(pending);
  EXPECT_EQ(r["jobStatus"], "ABORTED");
  EXPECT_EQ(r["result"].substr(0, 5), "1005:");
  long next = submit("echo.zlw");
  EXPECT_GT(next, pending);
}

TEST(JobRequestText, ParsesPathParametersAndDirectives) {
  zelserverd::JobRequestText out;
  ASSERT_EQ(zelserverd::parseJobRequestText(
                "R/w/w.zlw -XML_PARAMETER <?xml version=\"1.0\"?><TRANSFORMATION_REQUEST>"
                "<PUBLISHED_PARAMETER name=\"A\">1 &amp; 2</PUBLISHED_PARAMETER>"
                "<PUBLISHED_PARAMETER name=\"B\"></PUBLISHED_PARAMETER>"
                "<ZEL_DIRECTIVE name=\"D\">x</ZEL_DIRECTIVE></TRANSFORMATION_REQUEST>",
                out),
            "");
  EXPECT_EQ(out.repository, "R");
  EXPECT_EQ(out.itemName, "w.zlw");
  ASSERT_EQ(out.parameters.size(), 2u);
  EXPECT_EQ(out.parameters[0], std::make_pair(std::string("A"), std::string("1 & 2")));
  EXPECT_EQ(out.parameters[1].second, "");
  ASSERT_EQ(out.directives.size(), 1u);
  EXPECT_EQ(out.directives[0].first, "D");
  EXPECT_EQ(zelserverd::parseJobRequestText("R/w/w.zlw", out), "");
  for (const char* bad : {"", "R/x/w.zlw", "/w/w.zlw", "R/w/w.zlw/x", "R//.zlw"})
    EXPECT_NE(zelserverd::parseJobRequestText(bad, out), "") << bad;
  EXPECT_EQ(zelserverd::parseJobRequestText("R/w/w.zlw -XML_PARAMETER <OTHER/>", out),
            "request parameters: expected a TRANSFORMATION_REQUEST document, not 'OTHER'");
}

TEST(JobResultText, FormatsFinishedAndPendingJobs) {
  zelserverd::JobRecord r;
  r.id = 7;
  r.keyword = "zeljob";
  r.request = "R/w/w.zlw";
  r.status = "QUEUED";
  r.timeRequested = "2024-05-01T12:00:00Z";
  std::string pending = zelserverd::formatResult(r);
  using namespace std::string_literals;
  EXPECT_EQ(pending, "id=7\0jobStatus=QUEUED\0requestKeyword=zeljob\0request=R/w/w.zlw"
                     "\0timeRequested=2024-05-01T12:00:00Z"s);
  r.status = "ZEL_FAILURE";
  r.resultNumber = 1004;
  r.resultMessage = "cannot start";
  auto entries = parseResult(zelserverd::formatResult(r));
  EXPECT_EQ(entries["result"], "1004:cannot start");
  EXPECT_EQ(entries["serviceSuccess"], "false");
  EXPECT_EQ(entries["resultSuccess"], "false");
  EXPECT_EQ(entries.count("requesterHost"), 0u);
}

}  // namespace
}  // namespace zeltest
