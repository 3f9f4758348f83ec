// Jobs end to end: workspaces that succeed, fail, sleep until aborted, run transacted through the
// result port, or wait for their start time; their results and logs as the library reads them.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

class Jobs : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        session = &client.session();
        jobs = session->getTransformationManager();
        IZELServerRepository* repository = client.repository("jobs");
        for (const auto& [name, content] :
             {std::pair{"greet.zlw", "# @parameter WHO | TEXT | nobody | Whom to greet\necho \"Hello $WHO\"\n"},
              {"fail.zlw", "echo giving up\nexit 3\n"},
              {"sleep.zlw", "sleep 30\n"}})
            ASSERT_EQ(addItem(client, *repository, name, content), 0u) << client.lastMessage();
        session->destroyRepository(&repository);
        result = session->createTransformationResult();
        none = session->createStringArray();
    }

    void TearDown() override
    {
        if (session == nullptr)
            return;
        session->destroyStringArray(&none);
        session->destroyTransformationResult(&result);
        for (IZELServerTransformationRequest* request : requests)
            session->destroyTransformationRequest(&request);
    }

    IZELServerTransformationRequest& request(const std::string& workspace, const std::string& keyword = "zeljob")
    {
        requests.push_back(
            session->createTransformationRequest(client.text(keyword), client.text("jobs"), client.text(workspace)));
        return *requests.back();
    }

    std::string log(unsigned id)
    {
        EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getLogFile(id, client.text(local("job.log")), f); }), 1)
            << client.lastMessage();
        return readAll(local("job.log"));
    }

    // The job's status code and status number as the last result read has them.
    std::pair<unsigned, unsigned> statusOf(unsigned id)
    {
        EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getJobResult(id, f, *result); }), 1);
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

    Client client;
    IZELServerSession* session = nullptr;
    IZELServerTransformationManager* jobs = nullptr;
    IZELServerTransformationResult* result = nullptr;
    IZELServerStringArray* none = nullptr;
    std::vector<IZELServerTransformationRequest*> requests;
};

TEST_F(Jobs, SucceedingAndFailingJobsReportTheirOutcome)
{
    IZELServerTransformationRequest& greet = request("greet.zlw");
    greet.setPublishedParameter(client.text("WHO"), client.text("Ann"));
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->submitJob(greet, id)), 0u) << client.lastMessage();
    unsigned failing = 0;
    ASSERT_EQ(client.take(jobs->submitJob(request("fail.zlw"), failing)), 0u) << client.lastMessage();

    ASSERT_EQ(client.waitForJob(id, *result), kSucceeded);
    EXPECT_EQ(result->getResultSuccess(), 1u);
    EXPECT_EQ(result->getServiceSuccess(), 1u);
    EXPECT_EQ(statusOf(id), std::make_pair(unsigned{kSucceeded}, 0u));
    EXPECT_EQ(serviceMessage(), "Translation was successful");
    EXPECT_NE(log(id).find("Hello Ann"), std::string::npos);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->logFileExists(id, f); }), 1);
    auto info = client.own(session->createLogFileInfo(), &Session::destroyLogFileInfo);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getLogFileInfo(id, *info, f); }), 1) << client.lastMessage();

    ASSERT_EQ(client.waitForJob(failing, *result), kJobFailed);
    EXPECT_EQ(result->isSuccess(), 0u);
    EXPECT_EQ(result->getResultSuccess(), 0u);
    EXPECT_EQ(result->getServiceSuccess(), 1u) << "the service ran; the workspace failed";
    EXPECT_EQ(statusOf(failing), std::make_pair(unsigned{kJobFailed}, 3u)) << "the exit status";
    EXPECT_NE(log(failing).find("giving up"), std::string::npos);
}

TEST_F(Jobs, ARunningJobIsAbortedAndCannotBeAbortedTwice)
{
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->submitJob(request("sleep.zlw"), id)), 0u) << client.lastMessage();
    for (int attempt = 0; attempt < 200 && statusOf(id).first != kInProcess; ++attempt)
        std::this_thread::sleep_for(std::chrono::milliseconds(25));
    ASSERT_EQ(statusOf(id).first, kInProcess);
    ASSERT_EQ(client.take(jobs->abortJob(id)), 0u) << client.lastMessage();
    EXPECT_EQ(statusOf(id), std::make_pair(unsigned{kAborted}, 1002u));
    EXPECT_EQ(serviceMessage(), "job aborted by ann");
    EXPECT_EQ(client.take(jobs->abortJob(id)), kRefused) << "an ended job cannot be aborted";
    EXPECT_EQ(client.take(jobs->abortJob(987654)), kRefused) << "nor an unknown one";
}

TEST_F(Jobs, ATransactedJobDeliversItsResultThroughTheResultPort)
{
    IZELServerTransformationRequest& greet = request("greet.zlw");
    greet.setPublishedParameter(client.text("WHO"), client.text("Port"));
    ASSERT_EQ(client.take(jobs->transactJob(greet, *result)), 0u) << client.lastMessage();
    EXPECT_EQ(result->isSuccess(), 1u);
    unsigned port = 0;
    EXPECT_EQ(result->getRequesterResultPort(port), 1u) << "the result came back through the port";
    EXPECT_NE(port, 0u);
    unsigned id = 0;
    ASSERT_EQ(result->getID(id), 1u);
    EXPECT_NE(log(id).find("Hello Port"), std::string::npos);
    unsigned submitted = 0;
    ASSERT_EQ(client.take(jobs->submitJob(greet, submitted)), 0u) << "the same request again";
    EXPECT_NE(submitted, id);

    IZELServerString& text = client.text();
    IZELServerString& failing = client.text("jobs/fail/fail.zlw");
    EXPECT_EQ(client.take(jobs->transactJobString(client.text("zeljob"), failing, *none, text)), 0u)
        << client.lastMessage();
    EXPECT_NE(std::string(text.c_str(), text.length()).find("jobStatus=JOB_FAILURE"), std::string::npos);
}

TEST_F(Jobs, AScheduledJobWaitsDelayedThenRuns)
{
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->scheduleJob(request("greet.zlw"), 1, id)), 0u) << client.lastMessage();
    EXPECT_EQ(statusOf(id).first, kDelayed);
    EXPECT_EQ(client.waitForJob(id, *result), kSucceeded);

    unsigned later = 0;
    IZELServerString& greet = client.text("jobs/greet/greet.zlw");
    ASSERT_EQ(client.take(jobs->scheduleJobString(client.text("zeljob"), greet, 1, *none, later)), 0u)
        << client.lastMessage();
    IZELServerString& text = client.text();
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getJobResultString(later, f, text); }), 1);
    EXPECT_NE(std::string(text.c_str(), text.length()).find("jobStatus=DELAYED"), std::string::npos);
    IZELServerString& missing = client.text("jobs/none/none.zlw");
    EXPECT_EQ(client.take(jobs->scheduleJobString(client.text("zeljob"), missing, 1, *none, later)), kRefused);
}

TEST_F(Jobs, RequestsTheServerRefusesAreErrors)
{
    unsigned id = 12345;
    EXPECT_EQ(client.take(jobs->submitJob(request("greet.zlw", "nojob"), id)), kRefused);
    IZELServerTransformationRequest& missing = request("absent.zlw");
    EXPECT_EQ(client.take(jobs->submitJob(missing, id)), kRefused);
    IZELServerTransformationRequest& undeclared = request("greet.zlw");
    undeclared.setPublishedParameter(client.text("NOT_DECLARED"), client.text("x"));
    EXPECT_EQ(client.take(jobs->submitJob(undeclared, id)), kRefused);
    IZELServerString& zeljob = client.text("zeljob");
    EXPECT_EQ(client.take(jobs->submitJobString(zeljob, client.text("jobs/none/none.zlw"), *none, id)), kRefused);
    EXPECT_EQ(client.take(jobs->transactJob(missing, *result)), kRefused);
    EXPECT_EQ(id, 12345u) << "no job was queued";
    EXPECT_EQ(client.take(jobs->submitJobString(zeljob, client.text("jobs/fail/fail.zlw"), *none, id)), 0u);
    EXPECT_NE(id, 12345u);

    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getJobResult(424242, f, *result); }), 0)
        << "an unknown job has no result";
    auto info = client.own(session->createLogFileInfo(), &Session::destroyLogFileInfo);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getLogFileInfo(424242, *info, f); }), -1);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getLogFile(424242, client.text(local("no.log")), f); }), -1);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->logFileExists(424242, f); }), 0);
}

}  // namespace
}  // namespace zeltest
