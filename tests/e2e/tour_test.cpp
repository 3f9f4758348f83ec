// One pass over every manager against the local server: a repository with a workspace that runs as
// a job (transacted through the result port and submitted), its log, and a file in a shared area.

#include <chrono>
#include <fstream>
#include <sstream>
#include <thread>

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

const char* kWorkspace =
    "#!/bin/sh\n"
    "# @title Greeter\n"
    "# @description Says hello\n"
    "# @parameter WHO | TEXT | nobody | Whom to greet\n"
    "echo \"Hello $WHO\"\n";

class Tour : public EndToEnd {
protected:
    void SetUp() override
    {
        EndToEnd::SetUp();
        ASSERT_EQ(client.signIn(server->port(), "ann", "pw-ann"), 0u) << client.lastMessage();
        session = &client.session();
    }

    Client client;
    IZELServerSession* session = nullptr;
};

TEST_F(Tour, RepositoryItemAndItsWorkspaceView)
{
    IZELServerRepositoryManager* manager = session->getRepositoryManager();
    ASSERT_EQ(client.take(manager->addRepository(client.text("demo"), client.text("Demo items"))), 0u)
        << client.lastMessage();

    IZELServerRepository* repository = session->createRepository();
    unsigned found = 0;
    ASSERT_EQ(client.take(manager->getRepository(client.text("demo"), *repository, found)), 0u);
    ASSERT_EQ(found, 1u);

    std::ofstream(local("greet.zlw")) << kWorkspace;
    EXPECT_EQ(client.take(repository->addItem(client.text("greet.zlw"), client.text(local("greet.zlw")))), 0u)
        << client.lastMessage();
    unsigned exists = 0;
    EXPECT_EQ(client.take(repository->itemExists(client.text("greet.zlw"), exists)), 0u);
    EXPECT_EQ(exists, 1u);

    IZELServerWorkspace* workspace = session->createWorkspace();
    found = 0;
    EXPECT_EQ(client.take(repository->getWorkspaceView(client.text("greet.zlw"), *workspace, found)), 0u)
        << client.lastMessage();
    EXPECT_EQ(found, 1u);
    IZELServerString& title = client.text();
    workspace->getTitle(title);
    EXPECT_STREQ(title.c_str(), "Greeter");

    unsigned received = 0;
    EXPECT_EQ(client.take(repository->getItem(client.text("greet.zlw"), client.text(local("copy.zlw")), received)), 0u);
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(readAll(local("copy.zlw")), kWorkspace);

    session->destroyWorkspace(&workspace);
    session->destroyRepository(&repository);
}

TEST_F(Tour, JobsRunTheWorkspaceAndLeaveALog)
{
    IZELServerRepositoryManager* manager = session->getRepositoryManager();
    ASSERT_EQ(client.take(manager->addRepository(client.text("demo"), client.text(""))), 0u) << client.lastMessage();
    IZELServerRepository* repository = session->createRepository();
    unsigned found = 0;
    ASSERT_EQ(client.take(manager->getRepository(client.text("demo"), *repository, found)), 0u);
    std::ofstream(local("greet.zlw")) << kWorkspace;
    ASSERT_EQ(client.take(repository->addItem(client.text("greet.zlw"), client.text(local("greet.zlw")))), 0u)
        << client.lastMessage();
    session->destroyRepository(&repository);

    IZELServerTransformationManager* jobs = session->getTransformationManager();
    IZELServerTransformationRequest* request =
        session->createTransformationRequest(client.text("zeljob"), client.text("demo"), client.text("greet.zlw"));
    request->setPublishedParameter(client.text("WHO"), client.text("World"));

    IZELServerTransformationResult* result = session->createTransformationResult();
    ASSERT_EQ(client.take(jobs->transactJob(*request, *result)), 0u) << client.lastMessage();
    EXPECT_EQ(result->isSuccess(), 1u);
    unsigned transacted = 0;
    EXPECT_EQ(result->getID(transacted), 1u);

    unsigned submitted = 0;
    ASSERT_EQ(client.take(jobs->submitJob(*request, submitted)), 0u) << client.lastMessage();
    EXPECT_NE(submitted, transacted);

    // Wait for the submitted job to end: queued and running jobs answer with their status so far.
    const unsigned kQueued = 1, kInProcess = 4, kDelayed = 2;
    unsigned finished = 0;
    unsigned status = kQueued;
    for (int attempt = 0; attempt < 200; ++attempt) {
        ASSERT_EQ(client.take(jobs->getJobResult(submitted, finished, *result)), 0u) << client.lastMessage();
        result->getJobStatus(status);
        if (finished && status != kQueued && status != kInProcess && status != kDelayed)
            break;
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
    ASSERT_EQ(finished, 1u);
    EXPECT_EQ(result->isSuccess(), 1u);

    unsigned hasLog = 0;
    EXPECT_EQ(client.take(jobs->logFileExists(submitted, hasLog)), 0u);
    EXPECT_EQ(hasLog, 1u);
    unsigned success = 0;
    EXPECT_EQ(client.take(jobs->getLogFile(submitted, client.text(local("job.log")), success)), 0u)
        << client.lastMessage();
    EXPECT_EQ(success, 1u);
    EXPECT_NE(readAll(local("job.log")).find("Hello World"), std::string::npos) << readAll(local("job.log"));

    session->destroyTransformationResult(&result);
    session->destroyTransformationRequest(&request);
}

TEST_F(Tour, FilesGoInAndOutOfASharedArea)
{
    IZELServerMountPointManager* areas = session->getMountPointManager();
    ASSERT_NE(areas, nullptr);
    IZELServerMountPoint* area = session->createMountPoint();
    unsigned found = 0;
    ASSERT_EQ(client.take(areas->getSharedResource(client.text("DATA"), *area, found)), 0u) << client.lastMessage();
    ASSERT_EQ(found, 1u);

    IZELServerPath* folder = area->createPath(client.text("/in"));
    IZELServerPath* file = area->createPath(client.text("/in"), client.text("a.txt"));
    EXPECT_EQ(client.take(area->makeDirectory(*folder)), 0u) << client.lastMessage();
    std::ofstream(local("a.txt")) << "shared content";
    EXPECT_EQ(client.take(area->upload(client.text(local("a.txt")), *file, nullptr)), 0u) << client.lastMessage();

    IZELServerVector<IZELServerFileInfo>* entries = session->createFileInfoVector();
    EXPECT_EQ(client.take(area->list(*folder, *entries)), 0u) << client.lastMessage();
    ASSERT_EQ(entries->entries(), 1u);
    IZELServerString& name = client.text();
    entries->element(0)->getPath().getName(name);
    EXPECT_STREQ(name.c_str(), "a.txt");

    unsigned received = 0;
    EXPECT_EQ(client.take(area->download(*file, client.text(local("back.txt")), received, nullptr)), 0u)
        << client.lastMessage();
    EXPECT_EQ(received, 1u);
    EXPECT_EQ(readAll(local("back.txt")), "shared content");

    session->destroyFileInfoVector(&entries);
    area->releaseObject(folder);
    area->releaseObject(file);
    session->destroyMountPoint(&area);
}

}  // namespace
}  // namespace zeltest
