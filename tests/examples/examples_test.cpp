// The example programs, run as child processes against the local development server: their exit
// status and what they print, for a working call and for a refused one.

#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>

#include <sys/wait.h>

#include <zelserverapi/ZELServerOwned.h>

#include "support/local_server.h"

namespace {

const char* kConfig = "[user ann]\npassword = pw-ann\nroles = admin\n"
                      "[user vic]\npassword = pw-vic\nroles = viewer\n"
                      "[sharedresource DATA]\npath = shared\n";

const char* kWorkspace = "#!/bin/sh\n"
                         "# @title Greeter\n"
                         "# @parameter WHO | TEXT | nobody | Whom to greet\n"
                         "# @parameter CODE | TEXT | 0 | Exit status\n"
                         "echo \"Hello $WHO\"\n"
                         "exit \"$CODE\"\n";

struct Outcome {
    int status = -1;
    std::string output;  // standard output and error together
};

// Runs the command line (its parts are the test's own, free of shell quoting) and collects its output.
Outcome run(const std::string& command)
{
    Outcome outcome;
    FILE* pipe = ::popen((command + " 2>&1").c_str(), "r");
    if (pipe == nullptr)
        return outcome;
    char buffer[512];
    std::size_t got = 0;
    while ((got = std::fread(buffer, 1, sizeof buffer, pipe)) > 0)
        outcome.output.append(buffer, got);
    const int wait = ::pclose(pipe);
    outcome.status = WIFEXITED(wait) ? WEXITSTATUS(wait) : -1;
    return outcome;
}

class Examples : public ::testing::Test {
protected:
    void SetUp() override
    {
        server = std::make_unique<zeltest::LocalServer>(ZEL_TEST_ZELSERVERD, kConfig);
        ASSERT_EQ(server->failure(), "");
    }

    // HOST PORT USER PASSWORD for the example's command line.
    std::string signIn(const std::string& user, const std::string& password) const
    {
        return " 127.0.0.1 " + std::to_string(server->port()) + " " + user + " " + password;
    }

    // A repository "demo" holding the greeter workspace, made through the library itself.
    void addGreeter()
    {
        const std::string file = server->directory() + "/greet.zlw";
        std::ofstream(file) << kWorkspace;
        const auto session = zelServerCreateSession();
        ASSERT_NE(session, nullptr);
        auto text = [&](const std::string& value) {
            auto s = zelServerOwn(*session, session->createString());
            s->set(value.data(), static_cast<unsigned>(value.size()));
            return s;
        };
        const auto info = zelServerOwn(
            *session, session->createConnectionInfo(*text("127.0.0.1"), server->port(), *text("ann"), *text("pw-ann")));
        const auto repository = zelServerOwn(*session, session->createRepository());
        unsigned found = 0;
        auto status = zelServerOwn(*session, session->init(*info, nullptr));
        if (!status)
            status.reset(session->getRepositoryManager()->addRepository(*text("demo"), *text("")));
        if (!status)
            status.reset(session->getRepositoryManager()->getRepository(*text("demo"), *repository, found));
        if (!status)
            status.reset(repository->addItem(*text("greet.zlw"), *text(file)));
        EXPECT_EQ(status, nullptr) << status->getMessage();
        EXPECT_EQ(found, 1u);
    }

    std::unique_ptr<zeltest::LocalServer> server;
};

TEST_F(Examples, ListRepositoriesShowsWhoSignedInAndEveryRepository)
{
    addGreeter();
    const Outcome outcome = run(ZEL_EXAMPLE_LIST_REPOSITORIES + signIn("vic", "pw-vic"));
    EXPECT_EQ(outcome.status, 0) << outcome.output;
    EXPECT_EQ(outcome.output, "signed in to zelserverd as vic\n1 repositories\n  demo  \n");
}

TEST_F(Examples, ListRepositoriesReportsARefusedSignIn)
{
    const Outcome outcome = run(ZEL_EXAMPLE_LIST_REPOSITORIES + signIn("vic", "wrong"));
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.output, "error 393625: invalid user name or password\n");
}

TEST_F(Examples, ExamplesRefuseAnIncompleteCommandLine)
{
    for (const char* program :
         {ZEL_EXAMPLE_LIST_REPOSITORIES, ZEL_EXAMPLE_PUBLISH_AND_RUN, ZEL_EXAMPLE_RUN_JOB, ZEL_EXAMPLE_UPLOAD_FILE}) {
        const Outcome outcome = run(std::string(program) + " 127.0.0.1");
        EXPECT_EQ(outcome.status, 2) << program;
        EXPECT_NE(outcome.output.find("usage: "), std::string::npos) << outcome.output;
    }
}

TEST_F(Examples, RunJobPassesParametersAndReportsTheOutcome)
{
    addGreeter();
    struct Case {
        const char* parameters;
        int status;
        const char* verdict;
    };
    const Case cases[] = {
        {" WHO=World", 0, "succeeded: 0 Translation was successful"},
        {" CODE=3", 3, "failed: 3"},
    };
    for (const Case& c : cases) {
        const Outcome outcome = run(ZEL_EXAMPLE_RUN_JOB + signIn("ann", "pw-ann") + " demo greet.zlw" + c.parameters);
        EXPECT_EQ(outcome.status, c.status) << outcome.output;
        EXPECT_EQ(outcome.output.rfind("submitted job ", 0), 0u) << outcome.output;
        EXPECT_NE(outcome.output.find(c.verdict), std::string::npos) << outcome.output;
    }
}

TEST_F(Examples, RunJobRefusesAParameterTheWorkspaceDoesNotDeclare)
{
    addGreeter();
    const Outcome outcome = run(ZEL_EXAMPLE_RUN_JOB + signIn("ann", "pw-ann") + " demo greet.zlw COLOUR=red");
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.output.rfind("error ", 0), 0u) << outcome.output;
    EXPECT_EQ(outcome.output.find("submitted"), std::string::npos) << outcome.output;
}

std::string contentOf(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

TEST_F(Examples, PublishAndRunAddsThenReplacesTheItemAndFetchesEachLog)
{
    const std::string workspace = server->directory() + "/greet.zlw";
    std::ofstream(workspace) << kWorkspace;
    const std::string log = server->directory() + "/job.log";
    const std::string command =
        ZEL_EXAMPLE_PUBLISH_AND_RUN + signIn("ann", "pw-ann") + " work " + workspace + " " + log;

    const Outcome first = run(command + " WHO=World");
    EXPECT_EQ(first.status, 0) << first.output;
    EXPECT_EQ(first.output.rfind("added repository work\nadded item greet.zlw\nsubmitted job ", 0), 0u) << first.output;
    EXPECT_NE(first.output.find("succeeded: 0 Translation was successful\nlog of job "), std::string::npos)
        << first.output;
    EXPECT_NE(contentOf(log).find("Hello World"), std::string::npos) << contentOf(log);

    // A failing job still has its log fetched, and the same file replaces the item.
    const Outcome second = run(command + " WHO=Again CODE=3");
    EXPECT_EQ(second.status, 3) << second.output;
    EXPECT_EQ(second.output.rfind("updated item greet.zlw\nsubmitted job ", 0), 0u) << second.output;
    EXPECT_NE(second.output.find("failed: 3"), std::string::npos) << second.output;
    EXPECT_NE(contentOf(log).find("Hello Again"), std::string::npos) << contentOf(log);
}

TEST_F(Examples, PublishAndRunStopsBeforeTheJobWhenTheUploadIsRefused)
{
    const std::string workspace = server->directory() + "/greet.zlw";
    std::ofstream(workspace) << kWorkspace;
    const std::string log = server->directory() + "/job.log";
    const Outcome outcome =
        run(ZEL_EXAMPLE_PUBLISH_AND_RUN + signIn("vic", "pw-vic") + " work " + workspace + " " + log);
    EXPECT_EQ(outcome.status, 1) << outcome.output;
    EXPECT_EQ(outcome.output.rfind("error 393625: ", 0), 0u) << outcome.output;
    EXPECT_EQ(outcome.output.find("submitted"), std::string::npos) << outcome.output;
    EXPECT_FALSE(std::ifstream(log).good());
}

TEST_F(Examples, UploadFileCreatesTheFolderAndReportsProgress)
{
    const std::string local = server->directory() + "/data.csv";
    std::ofstream(local) << std::string(1000, 'x');
    const Outcome outcome = run(ZEL_EXAMPLE_UPLOAD_FILE + signIn("ann", "pw-ann") + " DATA " + local + " /in/data.csv");
    EXPECT_EQ(outcome.status, 0) << outcome.output;
    EXPECT_EQ(outcome.output.rfind("uploading 1000 bytes\n", 0), 0u) << outcome.output;
    EXPECT_NE(outcome.output.find(" 100%\nDATA:/in/data.csv holds 1000 bytes ("), std::string::npos) << outcome.output;
    std::ifstream stored(server->directory() + "/shared/in/data.csv");
    std::string content((std::istreambuf_iterator<char>(stored)), std::istreambuf_iterator<char>());
    EXPECT_EQ(content, std::string(1000, 'x'));
}

TEST_F(Examples, UploadFileIsRefusedWithoutTheRightToWrite)
{
    const std::string local = server->directory() + "/data.csv";
    std::ofstream(local) << "a,b\n";
    const Outcome outcome = run(ZEL_EXAMPLE_UPLOAD_FILE + signIn("vic", "pw-vic") + " DATA " + local + " /data.csv");
    EXPECT_EQ(outcome.status, 1) << outcome.output;
    EXPECT_EQ(outcome.output, "error 393625: user 'vic' may not run SR_UPLOAD\n");
}

}  // namespace
