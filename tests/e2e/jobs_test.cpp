// Jobs end to end: workspaces that succeed, fail, sleep until aborted, run transacted through the
// result port, or wait for their start time; their results and logs as the library reads them, and
// what the server refuses.

#include <algorithm>

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

class Jobs : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        jobs = client.session().getTransformationManager();
        auto repository = client.repository("jobs");
        for (const auto& [name, content] :
             {std::pair{"greet.zlw", "# @parameter WHO | TEXT | nobody | Whom to greet\necho \"Hello $WHO\"\n"},
              {"fail.zlw", "echo giving up\nexit 3\n"},
              {"sleep.zlw", "sleep 30\n"}})
            ASSERT_EQ(addItem(client, *repository, name, content), 0u) << client.lastMessage();
        result = client.own(client.session().createTransformationResult());
        none = client.own(client.session().createStringArray());
    }

    IZELServerTransformationRequest& request(const std::string& workspace, const std::string& keyword = "zeljob")
    {
        requests.push_back(client.own(client.session().createTransformationRequest(
            client.text(keyword), client.text("jobs"), client.text(workspace))));
        return *requests.back();
    }

    std::string log(unsigned id)
    {
        EXPECT_EQ(client.outcome([&](unsigned& f) { return jobs->getLogFile(id, client.text(local("job.log")), f); }),
                  1);
        return slurp(local("job.log"));
    }

    // The job's status code and status number as its result has them now.
    std::pair<unsigned, unsigned> statusOf(unsigned id)
    {
        EXPECT_EQ(client.outcome([&](unsigned& f) { return jobs->getJobResult(id, f, *result); }), 1);
        unsigned status = 0;
        unsigned number = 0;
        result->getJobStatus(status);
        result->getStatusNumber(number);
        return {status, number};
    }

    std::string serviceMessage()
    {
        IZELServerString& message = client.text();
        result->getServiceMessage(message);
        return message.c_str();
    }

    std::string resultText(unsigned id)
    {
        IZELServerString& text = client.text();
        EXPECT_EQ(client.outcome([&](unsigned& f) { return jobs->getJobResultString(id, f, text); }), 1);
        return std::string(text.c_str(), text.length());
    }

    Client client;
    IZELServerTransformationManager* jobs = nullptr;
    ZELServerOwned<IZELServerTransformationResult> result;
    ZELServerOwned<IZELServerStringArray> none;
    std::vector<ZELServerOwned<IZELServerTransformationRequest>> requests;
};

// A job that succeeds, one that fails, one transacted through the result port, one that waits for its
// start and one aborted while it runs: their results and logs as the library reads them.
TEST_F(Jobs, JobsRunFailWaitAndAreAborted)
{
    IZELServerTransformationRequest& greet = request("greet.zlw");
    greet.setPublishedParameter(client.text("WHO"), client.text("Ann"));
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->submitJob(greet, id)), 0u) << client.lastMessage();
    unsigned failing = 0;
    IZELServerString& zeljob = client.text("zeljob");
    ASSERT_EQ(client.take(jobs->submitJobString(zeljob, client.text("jobs/fail/fail.zlw"), *none, failing)), 0u);
    unsigned sleeping = 0;
    ASSERT_EQ(client.take(jobs->submitJob(request("sleep.zlw"), sleeping)), 0u) << client.lastMessage();
    unsigned later = 0;
    ASSERT_EQ(client.take(jobs->scheduleJobString(zeljob, client.text("jobs/greet/greet.zlw"), 3600, *none, later)),
              0u);
    unsigned soon = 0;
    ASSERT_EQ(client.take(jobs->scheduleJob(greet, 1, soon)), 0u) << client.lastMessage();
    EXPECT_EQ(statusOf(soon).first, kDelayed);
    EXPECT_NE(resultText(later).find("jobStatus=DELAYED"), std::string::npos);

    ASSERT_EQ(client.waitForJob(id, *result), kSucceeded);
    EXPECT_EQ(result->getResultSuccess() + result->getServiceSuccess(), 2u);
    EXPECT_EQ(statusOf(id), std::make_pair(unsigned{kSucceeded}, 0u));
    EXPECT_EQ(serviceMessage(), "Translation was successful");
    EXPECT_NE(log(id).find("Hello Ann"), std::string::npos);
    auto info = client.own(client.session().createLogFileInfo());
    client.run({
        {"log exists", [&](unsigned& f) { return jobs->logFileExists(id, f); }, 1},
        {"log info", [&](unsigned& f) { return jobs->getLogFileInfo(id, *info, f); }, 1},
    });
    ASSERT_EQ(client.waitForJob(failing, *result), kJobFailed);
    EXPECT_EQ(result->getResultSuccess(), 0u);
    EXPECT_EQ(result->getServiceSuccess(), 1u) << "the service ran; the workspace failed";
    EXPECT_EQ(statusOf(failing), std::make_pair(unsigned{kJobFailed}, 3u)) << "the exit status";
    EXPECT_EQ(client.waitForJob(soon, *result), kSucceeded);

    ASSERT_EQ(statusOf(sleeping).first, kInProcess);
    ASSERT_EQ(client.take(jobs->abortJob(sleeping)), 0u) << client.lastMessage();
    EXPECT_EQ(statusOf(sleeping), std::make_pair(unsigned{kAborted}, 1002u));
    EXPECT_EQ(serviceMessage(), "job aborted by ann");
    EXPECT_EQ(client.take(jobs->abortJob(sleeping)), kRefused) << "an ended job cannot be aborted";
    ASSERT_EQ(client.take(jobs->abortJob(later)), 0u) << "a job that has not started yet";
    EXPECT_NE(resultText(later).find("jobStatus=ABORTED"), std::string::npos);

    // A result port directive of 0 lets the call listen on any port; the bound port goes out first and
    // the caller's directive behind it, which the server must not take.
    greet.setPublishedParameter(client.text("WHO"), client.text("Port"));
    greet.setDirective(client.text("requesterResultPort"), client.text("0"));
    greet.setNotification(client.text("topic"), client.text("message"));
    ASSERT_EQ(client.take(jobs->transactJob(greet, *result)), 0u) << client.lastMessage();
    unsigned port = 0;
    EXPECT_EQ(result->getRequesterResultPort(port), 1u) << "the result came back through the port";
    EXPECT_NE(port, 0u);
    ASSERT_EQ(result->getID(id), 1u);
    // The server finishes the log after it has sent the result.
    std::string text;
    auto logged = [&](const std::string& line) { return text.find(line) != std::string::npos; };
    const std::string lines[] = {"Hello Port", "notification 'topic:message' not sent",
                                 "result sent to 127.0.0.1:" + std::to_string(port)};
    for (int attempt = 0; attempt < 100 && !std::all_of(std::begin(lines), std::end(lines), logged); ++attempt) {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        text = log(id);
    }
    EXPECT_TRUE(std::all_of(std::begin(lines), std::end(lines), logged)) << text;
    IZELServerString& failed = client.text();
    EXPECT_EQ(client.take(jobs->transactJobString(zeljob, client.text("jobs/fail/fail.zlw"), *none, failed)), 0u);
    EXPECT_NE(std::string(failed.c_str(), failed.length()).find("jobStatus=JOB_FAILURE"), std::string::npos);
}

TEST_F(Jobs, EveryOperationCanBeRefused)
{
    IZELServerTransformationRequest& unknownService = request("greet.zlw", "nojob");
    IZELServerTransformationRequest& missing = request("absent.zlw");
    IZELServerTransformationRequest& undeclared = request("greet.zlw");
    undeclared.setPublishedParameter(client.text("NOT_DECLARED"), client.text("x"));
    IZELServerString& text = client.text("untouched");
    auto info = client.own(client.session().createLogFileInfo());
    spew(local("kept.log"), "kept");
    client.run({
        {"an unknown service", [&](unsigned& f) { return jobs->submitJob(unknownService, f); }, kDenied},
        {"a missing workspace", [&](unsigned& f) { return jobs->submitJob(missing, f); }, kDenied},
        {"an undeclared parameter", [&](unsigned& f) { return jobs->submitJob(undeclared, f); }, kDenied},
        {"abort an unknown job", [&](unsigned&) { return jobs->abortJob(987654); }, kDenied},
        {"the result of an unknown job", [&](unsigned& f) { return jobs->getJobResult(987654, f, *result); }, 0},
        {"its result text", [&](unsigned& f) { return jobs->getJobResultString(987654, f, text); }, 0},
        {"its log exists", [&](unsigned& f) { return jobs->logFileExists(987654, f); }, 0},
        {"its log info", [&](unsigned& f) { return jobs->getLogFileInfo(987654, *info, f); }, kDenied},
        {"its log, keeping the destination",
         checking([&](unsigned& f) { return jobs->getLogFile(987654, client.text(local("kept.log")), f); },
                  [&] { return slurp(local("kept.log")) == "kept"; }),
         kDenied},
    });
}

}  // namespace
}  // namespace zeltest
