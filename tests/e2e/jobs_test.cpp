// Jobs end to end: workspaces that succeed, fail, sleep until aborted, run transacted through the
// result port, or wait for their start time; their results and logs as the library reads them.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kGreeter =
    "#!/bin/sh\n"
    "# @parameter WHO | TEXT | nobody | Whom to greet\n"
    "echo \"Hello $WHO\"\n";
const char* kFailing = "#!/bin/sh\necho giving up\nexit 3\n";
const char* kSleeper = "#!/bin/sh\nsleep 30\n";

class Jobs : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        session = &client.session();
        jobs = session->getTransformationManager();
        IZELServerRepository* repository = client.repository("jobs");
        for (const auto& [name, content] : {std::pair{"greet.zlw", kGreeter}, {"fail.zlw", kFailing},
                                            {"sleep.zlw", kSleeper}}) {
            writeFile(local(name), content);
            ASSERT_EQ(client.take(repository->addItem(client.text(name), client.text(local(name)))), 0u)
                << client.lastMessage();
        }
        session->destroyRepository(&repository);
        result = session->createTransformationResult();
    }

    void TearDown() override
    {
        if (session == nullptr)
            return;
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
        unsigned success = 0;
        EXPECT_EQ(client.take(jobs->getLogFile(id, client.text(local("job.log")), success)), 0u)
            << client.lastMessage();
        EXPECT_EQ(success, 1u);
        return readAll(local("job.log"));
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
    std::vector<IZELServerTransformationRequest*> requests;
};

TEST_F(Jobs, ASucceedingJobReportsSuccessAndLogsItsOutput)
{
    IZELServerTransformationRequest& greet = request("greet.zlw");
    greet.setPublishedParameter(client.text("WHO"), client.text("Ann"));
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->submitJob(greet, id)), 0u) << client.lastMessage();
    ASSERT_EQ(client.waitForJob(id, *result), kSucceeded);
    EXPECT_EQ(result->getResultSuccess(), 1u);
    EXPECT_EQ(result->getServiceSuccess(), 1u);
    unsigned number = 99;
    EXPECT_EQ(result->getStatusNumber(number), 1u);
    EXPECT_EQ(number, 0u);
    EXPECT_EQ(serviceMessage(), "Translation was successful");
    EXPECT_NE(log(id).find("Hello Ann"), std::string::npos);

    unsigned exists = 0;
    EXPECT_EQ(client.take(jobs->logFileExists(id, exists)), 0u);
    EXPECT_EQ(exists, 1u);
    IZELServerLogFileInfo* info = session->createLogFileInfo();
    unsigned found = 0;
    EXPECT_EQ(client.take(jobs->getLogFileInfo(id, *info, found)), 0u) << client.lastMessage();
    EXPECT_EQ(found, 1u);
    session->destroyLogFileInfo(&info);
}

TEST_F(Jobs, AWorkspaceExitingNonZeroIsAJobFailureWithItsExitStatus)
{
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->submitJob(request("fail.zlw"), id)), 0u) << client.lastMessage();
    ASSERT_EQ(client.waitForJob(id, *result), kJobFailed);
    EXPECT_EQ(result->isSuccess(), 0u);
    EXPECT_EQ(result->getResultSuccess(), 0u);
    EXPECT_EQ(result->getServiceSuccess(), 1u) << "the service ran; the workspace failed";
    unsigned number = 0;
    EXPECT_EQ(result->getStatusNumber(number), 1u);
    EXPECT_EQ(number, 3u);
    EXPECT_NE(log(id).find("giving up"), std::string::npos);
}

TEST_F(Jobs, ARunningJobIsAbortedAndCannotBeAbortedTwice)
{
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->submitJob(request("sleep.zlw"), id)), 0u) << client.lastMessage();
    unsigned status = 0;
    for (int attempt = 0; attempt < 200 && status != kInProcess; ++attempt) {
        unsigned found = 0;
        ASSERT_EQ(client.take(jobs->getJobResult(id, found, *result)), 0u);
        result->getJobStatus(status);
        std::this_thread::sleep_for(std::chrono::milliseconds(25));
    }
    ASSERT_EQ(status, kInProcess);

    ASSERT_EQ(client.take(jobs->abortJob(id)), 0u) << client.lastMessage();
    unsigned found = 0;
    ASSERT_EQ(client.take(jobs->getJobResult(id, found, *result)), 0u);
    EXPECT_EQ(found, 1u);
    result->getJobStatus(status);
    EXPECT_EQ(status, kAborted);
    unsigned number = 0;
    result->getStatusNumber(number);
    EXPECT_EQ(number, 1002u);
    EXPECT_EQ(serviceMessage(), "job aborted by ann");

    EXPECT_EQ(client.take(jobs->abortJob(id)), 393625u) << "an ended job cannot be aborted";
    EXPECT_EQ(client.take(jobs->abortJob(987654)), 393625u) << "nor an unknown one";
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

    IZELServerStringArray* none = session->createStringArray();
    IZELServerString& text = client.text();
    EXPECT_EQ(client.take(jobs->transactJobString(client.text("zeljob"), client.text("jobs/fail/fail.zlw"), *none, text)),
              0u) << client.lastMessage();
    EXPECT_NE(std::string(text.c_str(), text.length()).find("jobStatus=JOB_FAILURE"), std::string::npos);
    session->destroyStringArray(&none);
}

TEST_F(Jobs, AScheduledJobWaitsDelayedThenRuns)
{
    unsigned id = 0;
    ASSERT_EQ(client.take(jobs->scheduleJob(request("greet.zlw"), 1, id)), 0u) << client.lastMessage();
    unsigned found = 0;
    ASSERT_EQ(client.take(jobs->getJobResult(id, found, *result)), 0u);
    unsigned status = 0;
    result->getJobStatus(status);
    EXPECT_EQ(status, kDelayed);
    EXPECT_EQ(client.waitForJob(id, *result), kSucceeded);

    IZELServerStringArray* none = session->createStringArray();
    unsigned later = 0;
    ASSERT_EQ(client.take(jobs->scheduleJobString(client.text("zeljob"), client.text("jobs/greet/greet.zlw"), 1, *none,
                                                  later)),
              0u) << client.lastMessage();
    found = 0;
    IZELServerString& text = client.text();
    ASSERT_EQ(client.take(jobs->getJobResultString(later, found, text)), 0u);
    EXPECT_EQ(found, 1u);
    EXPECT_NE(std::string(text.c_str(), text.length()).find("jobStatus=DELAYED"), std::string::npos);
    EXPECT_EQ(client.take(jobs->scheduleJobString(client.text("zeljob"), client.text("jobs/none/none.zlw"), 1, *none,
                                                  later)),
              393625u);
    session->destroyStringArray(&none);
}

TEST_F(Jobs, RequestsTheServerRefusesAreErrors)
{
    unsigned id = 12345;
    IZELServerTransformationRequest& unknownService = request("greet.zlw", "nojob");
    EXPECT_EQ(client.take(jobs->submitJob(unknownService, id)), 393625u);
    IZELServerTransformationRequest& missing = request("absent.zlw");
    EXPECT_EQ(client.take(jobs->submitJob(missing, id)), 393625u);
    IZELServerTransformationRequest& undeclared = request("greet.zlw");
    undeclared.setPublishedParameter(client.text("NOT_DECLARED"), client.text("x"));
    EXPECT_EQ(client.take(jobs->submitJob(undeclared, id)), 393625u);
    IZELServerStringArray* none = session->createStringArray();
    EXPECT_EQ(client.take(jobs->submitJobString(client.text("zeljob"), client.text("jobs/none/none.zlw"), *none, id)),
              393625u);
    EXPECT_EQ(client.take(jobs->transactJob(missing, *result)), 393625u);
    EXPECT_EQ(id, 12345u) << "no job was queued";
    EXPECT_EQ(client.take(jobs->submitJobString(client.text("zeljob"), client.text("jobs/fail/fail.zlw"), *none, id)), 0u);
    EXPECT_NE(id, 12345u);
    session->destroyStringArray(&none);

    unsigned found = 7;
    EXPECT_EQ(client.take(jobs->getJobResult(424242, found, *result)), 0u);
    EXPECT_EQ(found, 0u) << "an unknown job has no result";
    IZELServerLogFileInfo* info = session->createLogFileInfo();
    EXPECT_NE(client.take(jobs->getLogFileInfo(424242, *info, found)), 0u);
    session->destroyLogFileInfo(&info);
    unsigned success = 1;
    EXPECT_EQ(client.take(jobs->getLogFile(424242, client.text(local("none.log")), success)), 0u);
    EXPECT_EQ(success, 0u);
    unsigned exists = 1;
    EXPECT_EQ(client.take(jobs->logFileExists(424242, exists)), 0u);
    EXPECT_EQ(exists, 0u);
}

}  // namespace
}  // namespace zeltest
