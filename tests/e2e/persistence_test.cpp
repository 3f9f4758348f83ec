// Persistence end to end: what one run of the server acknowledged is there after a clean stop and a
// new start on the same directory, and a job still running at the stop ends aborted.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kWorkspace = "#!/bin/sh\n# @title Kept\necho kept run\n";

TEST_F(EndToEnd, AcknowledgedStateSurvivesARestart)
{
    unsigned done = 0;
    unsigned running = 0;
    {
        Client client;
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        Session& session = client.session();
        auto repository = client.own(client.repository("durable"), &Session::destroyRepository);
        ASSERT_EQ(addItem(client, *repository, "kept.zlw", kWorkspace), 0u) << client.lastMessage();
        ASSERT_EQ(addItem(client, *repository, "sleep.zlw", "sleep 30\n"), 0u) << client.lastMessage();
        writeFile(local("res.bin"), std::string("res\0bytes", 9));
        IZELServerString& resource = client.text("res.bin");
        IZELServerString& source = client.text(local("res.bin"));
        ASSERT_EQ(client.take(repository->addItemResource(client.text("kept.zlw"), resource, source)), 0u)
            << client.lastMessage();
        auto service = client.own(
            session.createService(client.text("svc"), client.text("Service"), client.text("kept"), client.text("")),
            &Session::destroyService);
        ASSERT_EQ(client.take(session.getRepositoryManager()->addService(*service)), 0u) << client.lastMessage();
        IZELServerSecurityManager* security = session.getSecurityManager();
        IZELServerUserToken* token = security->createUserToken(client.text("kept-token"), client.text(""), 0);
        ASSERT_EQ(client.take(security->addUserToken(client.text("bob"), *token)), 0u);
        security->destroyUserToken(&token);

        IZELServerTransformationManager* jobs = session.getTransformationManager();
        for (auto [name, id] : {std::pair{"kept.zlw", &done}, {"sleep.zlw", &running}}) {
            auto request = client.own(
                session.createTransformationRequest(client.text("zeljob"), client.text("durable"), client.text(name)),
                &Session::destroyTransformationRequest);
            ASSERT_EQ(client.take(jobs->submitJob(*request, *id)), 0u);
        }
        auto result = client.own(session.createTransformationResult(), &Session::destroyTransformationResult);
        EXPECT_EQ(client.waitForJob(done, *result), kSucceeded);

        auto area = client.own(client.area("DATA"), &Session::destroyMountPoint);
        ASSERT_NE(area, nullptr);
        IZELServerPath* file = area->createPath(client.text("/kept.txt"));
        writeFile(local("shared.txt"), "shared kept");
        EXPECT_EQ(client.take(area->upload(client.text(local("shared.txt")), *file, nullptr)), 0u);
        area->releaseObject(file);
    }
    ASSERT_EQ(server->stop(), 0) << "a clean stop";

    LocalServer again(ZEL_TEST_ZELSERVERD, LocalServer::ReuseDirectory{server->directory()});
    ASSERT_EQ(again.failure(), "");
    Client bob;
    ASSERT_EQ(bob.signInWith(again.port(), {"USER_TOKEN", "kept-token"}), 0u) << "the token was kept";
    Client client;
    ASSERT_EQ(client.signIn(again.port(), "ann", "pw-ann"), 0u) << client.lastMessage();
    Session& session = client.session();
    IZELServerRepositoryManager* manager = session.getRepositoryManager();
    auto repository = client.own(session.createRepository(), &Session::destroyRepository);
    IZELServerString& durable = client.text("durable");
    ASSERT_EQ(client.flag([&](unsigned& f) { return manager->getRepository(durable, *repository, f); }), 1);
    IZELServerString& kept = client.text("kept.zlw");
    IZELServerString& copy = client.text(local("back.zlw"));
    EXPECT_EQ(client.flag([&](unsigned& f) { return repository->getItem(kept, copy, f); }), 1);
    EXPECT_EQ(readAll(local("back.zlw")), kWorkspace);
    IZELServerString& resource = client.text("res.bin");
    IZELServerString& back = client.text(local("back.bin"));
    EXPECT_EQ(client.flag([&](unsigned& f) { return repository->getItemResource(kept, resource, back, f); }), 1);
    EXPECT_EQ(readAll(local("back.bin")), std::string("res\0bytes", 9));

    auto service = client.own(session.createService(), &Session::destroyService);
    EXPECT_EQ(client.flag([&](unsigned& f) { return manager->getService(client.text("svc"), *service, f); }), 1);
    IZELServerString& description = client.text();
    service->getDescription(description);
    EXPECT_STREQ(description.c_str(), "kept");

    IZELServerTransformationManager* jobs = session.getTransformationManager();
    auto result = client.own(session.createTransformationResult(), &Session::destroyTransformationResult);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getJobResult(done, f, *result); }), 1);
    EXPECT_EQ(result->isSuccess(), 1u) << "the job's result was kept";
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getLogFile(done, client.text(local("kept.log")), f); }), 1);
    EXPECT_NE(readAll(local("kept.log")).find("kept run"), std::string::npos);
    EXPECT_EQ(client.flag([&](unsigned& f) { return jobs->getJobResult(running, f, *result); }), 1);
    unsigned status = 0;
    unsigned number = 0;
    result->getJobStatus(status);
    result->getStatusNumber(number);
    EXPECT_EQ(status, kAborted) << "the job running at the stop";
    EXPECT_EQ(number, 1005u);

    auto area = client.own(client.area("DATA"), &Session::destroyMountPoint);
    ASSERT_NE(area, nullptr);
    IZELServerPath* file = area->createPath(client.text("/kept.txt"));
    IZELServerString& shared = client.text(local("back.txt"));
    EXPECT_EQ(client.flag([&](unsigned& f) { return area->download(*file, shared, f, nullptr); }), 1);
    EXPECT_EQ(readAll(local("back.txt")), "shared kept");
    area->releaseObject(file);
}

}  // namespace
}  // namespace zeltest
