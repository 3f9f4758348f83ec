// The example programs, run as child processes against the local development server, one after the
// other: their exit status and what they print, for working calls and for refused ones.

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <string>

#include <sys/wait.h>

#include "support/helpers.h"
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

// Runs the command line (its parts are the test's own, free of shell quoting); exit status and output.
std::pair<int, std::string> run(const std::string& command, const std::string& output)
{
    const int wait = std::system((command + " > " + output + " 2>&1").c_str());
    return {WIFEXITED(wait) ? WEXITSTATUS(wait) : -1, zeltest::slurp(output)};
}

TEST(Examples, EachProgramReportsItsOutcome)
{
    const zeltest::LocalServer server(ZEL_TEST_ZELSERVERD, kConfig);
    ASSERT_EQ(server.failure(), "");
    const std::string at = " 127.0.0.1 " + std::to_string(server.port());
    const std::string ann = at + " ann pw-ann";
    const std::string vic = at + " vic pw-vic";
    const std::string dir = server.directory();
    std::ofstream(dir + "/greet.zlw") << kWorkspace;
    zeltest::spew(dir + "/data.csv", std::string(1000, 'x'));
    const std::string publish = ZEL_EXAMPLE_PUBLISH_AND_RUN;
    const std::string publishArgs = " work " + dir + "/greet.zlw " + dir + "/job.log";
    const struct {
        std::string command;
        int status;
        std::string start;     // the output starts so
        std::string contains;  // and holds this further on
    } cases[] = {
        {ZEL_EXAMPLE_LIST_REPOSITORIES + at + " vic wrong", 1, "error 393625: invalid user name or password\n", ""},
        {publish + vic + publishArgs, 1, "error 393625: user 'vic' may not run REP_", ""},
        {publish + ann + publishArgs + " WHO=World", 0, "added repository work\nadded item greet.zlw\nsubmitted job ",
         "succeeded: 0 Translation was successful\nlog of job "},
        // A failing job still has its log fetched, and the same file replaces the item.
        {publish + ann + publishArgs + " WHO=Again CODE=3", 3, "updated item greet.zlw\nsubmitted job ", "failed: 3"},
        {ZEL_EXAMPLE_RUN_JOB + ann + " work greet.zlw CODE=3", 3, "submitted job ", "failed: 3"},
        {ZEL_EXAMPLE_RUN_JOB + ann + " work greet.zlw COLOUR=red", 1, "error ", ""},
        {ZEL_EXAMPLE_LIST_REPOSITORIES + vic, 0,
         "signed in to zelserverd as vic\n1 repositories\n  work  Made by publish_and_run\n", ""},
        {ZEL_EXAMPLE_UPLOAD_FILE + ann + " DATA " + dir + "/data.csv /in/data.csv", 0, "uploading 1000 bytes\n",
         " 100%\nDATA:/in/data.csv holds 1000 bytes ("},
    };
    for (const auto& c : cases) {
        const auto [status, output] = run(c.command, dir + "/output");
        EXPECT_EQ(status, c.status) << c.command << "\n" << output;
        EXPECT_EQ(output.rfind(c.start, 0), 0u) << c.command << "\n" << output;
        EXPECT_NE(output.find(c.contains, c.start.size()), std::string::npos) << c.command << "\n" << output;
    }
    EXPECT_NE(zeltest::slurp(dir + "/job.log").find("Hello Again"), std::string::npos);
}

}  // namespace
