#pragma once
// zelctl run as a child process against zelserverd on a free port, with its standard output and
// standard error caught in files (so standard error is never a terminal here).

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <cstdlib>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include <sys/wait.h>

#include "support/helpers.h"
#include "support/local_server.h"

namespace zeltest {

inline const char* kZelctlConfig = "[user ann]\npassword = pw-ann\nroles = admin\n"
                                   "[user bob]\npassword = pw-bob\nroles = viewer\n"
                                   "[sharedresource DATA]\npath = shared\n";

struct Outcome {
    int status = -1;
    std::string out;
    std::string err;
};

inline std::string quoted(const std::string& text)
{
    std::string result = "'";
    for (char c : text)
        result += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return result + "'";
}

class Zelctl : public ::testing::Test {
protected:
    void SetUp() override
    {
        server = std::make_unique<LocalServer>(ZEL_TEST_ZELSERVERD, kZelctlConfig);
        ASSERT_EQ(server->failure(), "");
    }

    std::string local(const std::string& name) const { return server->directory() + "/" + name; }

    // zelctl with the given arguments, pointed at the server's port unless `toServer` is false;
    // `environment` is put before the command for the child alone.
    Outcome raw(const std::vector<std::string>& arguments, const std::string& environment = "", bool toServer = true)
    {
        std::string command =
            "cd " + quoted(server->directory()) + " && " + environment + " " + quoted(ZEL_TEST_ZELCTL);
        if (toServer)
            command += " --port " + std::to_string(server->port());
        for (const std::string& argument : arguments)
            command += " " + quoted(argument);
        command += " > " + quoted(local("zelctl.out")) + " 2> " + quoted(local("zelctl.err")) + " < /dev/null";
        const int wait = std::system(command.c_str());
        Outcome run;
        run.status = WIFEXITED(wait) ? WEXITSTATUS(wait) : -1;
        run.out = slurp(local("zelctl.out"));
        run.err = slurp(local("zelctl.err"));
        return run;
    }

    Outcome ann(std::vector<std::string> arguments)
    {
        arguments.insert(arguments.begin(), {"--user", "ann", "--password", "pw-ann"});
        return raw(arguments);
    }

    std::unique_ptr<LocalServer> server;
};

}  // namespace zeltest
