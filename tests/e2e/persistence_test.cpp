// Persistence end to end: what one run of the server acknowledged is there after a clean stop and a
// new start on the same directory.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kWorkspace = "#!/bin/sh\n# @title Kept\necho kept run\n";

TEST_F(EndToEnd, AcknowledgedStateSurvivesARestart)
{
    unsigned jobId = 0;
    {
        Client client;
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        IZELServerRepository* repository = client.repository("durable");
        writeFile(local("kept.zlw"), kWorkspace);
        ASSERT_EQ(client.take(repository->addItem(client.text("kept.zlw"), client.text(local("kept.zlw")))), 0u)
            << client.lastMessage();
        writeFile(local("res.bin"), std::string("res\0bytes", 9));
        ASSERT_EQ(client.take(repository->addItemResource(client.text("kept.zlw"), client.text("res.bin"),
                                                          client.text(local("res.bin")))),
                  0u) << client.lastMessage();
        client.session().destroyRepository(&repository);

        IZELServerService* service = client.session().createService(client.text("svc"), client.text("Service"),
                                                                     client.text("kept"), client.text("http://x"));
        ASSERT_EQ(client.take(client.session().getRepositoryManager()->addService(*service)), 0u) << client.lastMessage();
        client.session().destroyService(&service);

        IZELServerUserToken* token =
            client.session().getSecurityManager()->createUserToken(client.text("kept-token"), client.text(""), 0);
        ASSERT_EQ(client.take(client.session().getSecurityManager()->addUserToken(client.text("bob"), *token)), 0u);
        client.session().getSecurityManager()->destroyUserToken(&token);

        IZELServerTransformationRequest* request = client.session().createTransformationRequest(
            client.text("zeljob"), client.text("durable"), client.text("kept.zlw"));
        IZELServerTransformationResult* result = client.session().createTransformationResult();
        ASSERT_EQ(client.take(client.session().getTransformationManager()->submitJob(*request, jobId)), 0u);
        EXPECT_EQ(client.waitForJob(jobId, *result), kSucceeded);
        client.session().destroyTransformationResult(&result);
        client.session().destroyTransformationRequest(&request);

        IZELServerMountPoint* area = client.area("DATA");
        ASSERT_NE(area, nullptr);
        IZELServerPath* file = area->createPath(client.text("/kept.txt"));
        writeFile(local("shared.txt"), "shared kept");
        EXPECT_EQ(client.take(area->upload(client.text(local("shared.txt")), *file, nullptr)), 0u);
        area->releaseObject(file);
        client.session().destroyMountPoint(&area);
    }
    ASSERT_EQ(server->stop(), 0) << "a clean stop";

    LocalServer again(ZEL_TEST_ZELSERVERD, LocalServer::ReuseDirectory{server->directory()});
    ASSERT_EQ(again.failure(), "");

    Client bob;
    ASSERT_EQ(bob.signInWith(again.port(), {"USER_TOKEN", "kept-token"}), 0u) << "the token was kept";
    Client client;
    ASSERT_EQ(client.signIn(again.port(), "ann", "pw-ann"), 0u) << client.lastMessage();
    IZELServerRepositoryManager* manager = client.session().getRepositoryManager();
    IZELServerRepository* repository = client.session().createRepository();
    unsigned found = 0;
    ASSERT_EQ(client.take(manager->getRepository(client.text("durable"), *repository, found)), 0u);
    ASSERT_EQ(found, 1u);
    unsigned received = 0;
    EXPECT_EQ(client.take(repository->getItem(client.text("kept.zlw"), client.text(local("back.zlw")), received)), 0u);
    EXPECT_EQ(readAll(local("back.zlw")), kWorkspace);
    EXPECT_EQ(client.take(repository->getItemResource(client.text("kept.zlw"), client.text("res.bin"),
                                                      client.text(local("back.bin")), received)),
              0u);
    EXPECT_EQ(readAll(local("back.bin")), std::string("res\0bytes", 9));
    client.session().destroyRepository(&repository);

    IZELServerService* service = client.session().createService();
    found = 0;
    EXPECT_EQ(client.take(manager->getService(client.text("svc"), *service, found)), 0u);
    EXPECT_EQ(found, 1u);
    IZELServerString& description = client.text();
    service->getDescription(description);
    EXPECT_STREQ(description.c_str(), "kept");
    client.session().destroyService(&service);

    IZELServerTransformationResult* result = client.session().createTransformationResult();
    found = 0;
    EXPECT_EQ(client.take(client.session().getTransformationManager()->getJobResult(jobId, found, *result)), 0u);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(result->isSuccess(), 1u) << "the job's result was kept";
    client.session().destroyTransformationResult(&result);
    unsigned success = 0;
    EXPECT_EQ(client.take(client.session().getTransformationManager()->getLogFile(jobId, client.text(local("kept.log")),
                                                                                  success)),
              0u);
    EXPECT_NE(readAll(local("kept.log")).find("kept run"), std::string::npos);

    IZELServerMountPoint* area = client.area("DATA");
    ASSERT_NE(area, nullptr);
    IZELServerPath* file = area->createPath(client.text("/kept.txt"));
    EXPECT_EQ(client.take(area->download(*file, client.text(local("shared-back.txt")), received, nullptr)), 0u);
    EXPECT_EQ(readAll(local("shared-back.txt")), "shared kept");
    area->releaseObject(file);
    client.session().destroyMountPoint(&area);
}

TEST_F(EndToEnd, AJobStillRunningAtAStopIsAbortedAfterIt)
{
    unsigned jobId = 0;
    {
        Client client;
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        IZELServerRepository* repository = client.repository("durable");
        writeFile(local("sleep.zlw"), "#!/bin/sh\nsleep 30\n");
        ASSERT_EQ(client.take(repository->addItem(client.text("sleep.zlw"), client.text(local("sleep.zlw")))), 0u);
        client.session().destroyRepository(&repository);
        IZELServerTransformationRequest* request = client.session().createTransformationRequest(
            client.text("zeljob"), client.text("durable"), client.text("sleep.zlw"));
        ASSERT_EQ(client.take(client.session().getTransformationManager()->submitJob(*request, jobId)), 0u);
        client.session().destroyTransformationRequest(&request);
    }
    ASSERT_EQ(server->stop(), 0);

    LocalServer again(ZEL_TEST_ZELSERVERD, LocalServer::ReuseDirectory{server->directory()});
    ASSERT_EQ(again.failure(), "");
    Client client;
    ASSERT_EQ(client.signIn(again.port(), "ann", "pw-ann"), 0u) << client.lastMessage();
    IZELServerTransformationResult* result = client.session().createTransformationResult();
    unsigned found = 0;
    EXPECT_EQ(client.take(client.session().getTransformationManager()->getJobResult(jobId, found, *result)), 0u);
    unsigned status = 0;
    result->getJobStatus(status);
    EXPECT_EQ(status, kAborted);
    unsigned number = 0;
    result->getStatusNumber(number);
    EXPECT_EQ(number, 1005u);
    client.session().destroyTransformationResult(&result);
}

}  // namespace
}  // namespace zeltest
