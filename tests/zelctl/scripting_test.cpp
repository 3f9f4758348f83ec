// What scripts and people rely on: exit statuses, the text output, error lines that say what happened,
// settings from the environment, and time-outs.

#include <regex>

#include "support/sockets.h"
#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

class Scripting : public Zelctl {
protected:
    void SetUp() override
    {
        Zelctl::SetUp();
        std::ofstream(local("greet.zlw")) << "# @parameter WHO | TEXT | nobody | Whom to greet\necho \"Hello $WHO\"\n";
        std::ofstream(local("fail.zlw")) << "#!/bin/sh\n# @title Fails\necho failing\nexit 3\n";
        ASSERT_EQ(ann({"repo", "create", "demo", "--description", "Demo items"}).status, 0);
        ASSERT_EQ(ann({"item", "put", "demo", local("greet.zlw")}).status, 0);
        ASSERT_EQ(ann({"item", "put", "demo", local("fail.zlw")}).status, 0);
    }

    // The ID a job command printed on the first line of its standard output.
    std::string job(const std::vector<std::string>& arguments)
    {
        const Outcome run = ann(arguments);
        EXPECT_EQ(run.status, 0) << run.err;
        return run.out.substr(0, run.out.find('\n'));
    }

    std::string port() const { return std::to_string(server->port()); }
};

TEST_F(Scripting, ExitStatusesOutputAndErrorLines)
{
    const std::string failed = job({"job", "submit", "zeljob", "demo", "fail.zlw"});
    const std::string greeted =
        job({"job", "submit", "zeljob", "demo", "greet.zlw", "-p", "WHO=World", "--notify", "done=ok"});
    const std::string delayed = job({"job", "schedule", "3600", "zeljob", "demo", "greet.zlw"});
    const std::string aborted = job({"job", "schedule", "3600", "zeljob", "demo", "greet.zlw"});
    ASSERT_EQ(ann({"job", "abort", aborted}).status, 0);
    const char* any = nullptr;
    // A status from the library keeps its number; zelctl's own finding has none.
    const char* numbered = "error [1-9][0-9]*: [^\n]+\n";
    const char* usage = "[\\s\\S]*Usage[\\s\\S]*";
    struct Case {
        std::vector<std::string> arguments;
        int status;
        const char* out;  // a part of standard output; "" for none at all; null for anything
        const char* err;  // the whole of standard error as a regular expression; null for anything
    };
    const Case cases[] = {
        {{"job", "run", "zeljob", "demo", "greet.zlw", "-p", "WHO=Ann"},
         0,
         "status: SUCCESS",
         "job [0-9]+ submitted\n"},
        {{"job", "run", "zeljob", "demo", "fail.zlw"}, 3, "status: JOB_FAILURE", any},
        {{"job", "wait", failed}, 3, "status: JOB_FAILURE", ""},
        {{"job", "log", failed, "--follow"}, 3, "failing", ""},
        {{"job", "result", failed}, 0, "status: JOB_FAILURE", ""},
        {{"job", "wait", aborted}, 4, "status: ABORTED", ""},
        {{"job", "wait", delayed, "--timeout", "1"}, 5, any, any},
        {{"job", "log", greeted}, 0, "Hello World", ""},
        {{"--quiet", "job", "log", greeted, "-o", local("job.log")}, 0, "", ""},
        {{"job", "wait", "999"}, 1, "", "error: no job 999\n"},
        {{"job", "log", "999"}, 1, "", "error 393625: job 999 has no log\n"},
        {{"job", "submit", "zeljob", "demo", "greet.zlw", "-p", "NOEQUALS"},
         1,
         "",
         "error: expected NAME=VALUE, got 'NOEQUALS'\n"},
        {{"repo", "list"}, 0, "REPOSITORY  DESCRIPTION\ndemo        Demo items\n", ""},
        {{"prop", "SERVER_NAME"}, 0, "zelserverd\n", ""},
        {{"whoami"}, 0, "account: ann\n", ""},
        {{"--version"}, 0, " (zelserverapi ", ""},
        {{"repo", "show", "nope"}, 1, "", "error: no repository 'nope'\n"},
        {{"repo", "create", "demo"}, 1, "", numbered},
        {{"item", "put", "demo", local("greet.zlw")}, 1, "", numbered},
        {{"item", "rm", "demo", "nope.zlw"}, 1, "", "error: no such item or resource 'nope.zlw'\n"},
        {{"workspace", "show", "demo", "missing.zlw"}, 1, "", any},
        {{"service", "show", "svc"}, 1, "", "error: no service 'svc'\n"},
        {{"sr", "stat", "DATA", "/c.txt"}, 1, "", numbered},
        {{"sr", "ls", "NOPE"}, 1, "", "error: no shared resource 'NOPE'\n"},
        {{"token", "rm", "nobody"}, 1, "", numbered},
        {{"job", "log", failed, "--follow", "--json"}, 2, any, any},
        {{}, 2, any, usage},
        {{"job", "abort"}, 2, any, usage},
        {{"job", "abort", "not-a-number"}, 2, any, usage},
        {{"workspace", "list", "demo", "--filter", "some"}, 2, any, usage},
        {{"item", "put", "demo", "no-such-file"}, 2, any, usage},
    };
    for (const Case& c : cases) {
        const Outcome run = ann(c.arguments);
        const std::string line = c.arguments.empty() ? "" : c.arguments[0] + " " + c.arguments.back();
        EXPECT_EQ(run.status, c.status) << line << ": " << run.err;
        EXPECT_TRUE(!c.out || (*c.out ? run.out.find(c.out) != std::string::npos : run.out.empty()))
            << line << ": " << run.out;
        EXPECT_TRUE(!c.err || std::regex_match(run.err, std::regex(c.err))) << line << ": " << run.err;
    }
    EXPECT_NE(slurp(local("job.log")).find("Hello World"), std::string::npos);
    // Waiting asks the server a few times a second, not in a busy loop (the table waits some seconds).
    const std::string log = slurp(local("server.log"));
    std::size_t polls = 0;
    for (std::size_t at = log.find("command=GET_JOB_RESULT_STRING"); at != std::string::npos;
         at = log.find("command=GET_JOB_RESULT_STRING", at + 1))
        ++polls;
    EXPECT_LT(polls, 100u);
}

TEST_F(Scripting, SettingsComeFromTheEnvironmentAndFlagsWin)
{
    ASSERT_EQ(ann({"token", "set", "bob", "token-of-bob"}).status, 0);
    const std::string server = "ZEL_HOST=127.0.0.1 ZEL_PORT=" + port();
    struct Case {
        std::string environment;
        std::vector<std::string> arguments;
        const char* account;
    };
    const Case cases[] = {
        {server + " ZEL_USER=ann ZEL_PASSWORD=pw-ann", {"whoami", "--json"}, "ann"},
        {server + " ZEL_TOKEN=token-of-bob", {"--json", "whoami"}, "bob"},
        {server + " ZEL_USER=bob ZEL_PASSWORD=pw-bob",
         {"whoami", "--user", "ann", "--json", "--password", "pw-ann", "--client-id", "zelctl-test"},
         "ann"},
        {"", {"--port", port(), "--json", "--token", "token-of-bob", "whoami"}, "bob"},
    };
    for (const Case& c : cases) {
        const Outcome run = raw(c.arguments, c.environment, false);
        ASSERT_EQ(run.status, 0) << c.environment << ": " << run.err;
        EXPECT_EQ(nlohmann::json::parse(run.out)["account"], c.account) << c.environment;
    }
}

// A server that never answers (the system accepts connections into the backlog of a socket nobody
// reads) ends the wait after the global --timeout with exit status 5.
TEST_F(Scripting, FailuresToConnectOrSignInSayWhy)
{
    const ClosedPort closed;
    const std::string refused = "error 393601: connection refused by 127.0.0.1:" + std::to_string(closed.port()) + "\n";
    const Socket silent = listenOnLoopback(8);
    const std::string mute = std::to_string(localPort(silent).value_or(0));
    const std::string timedOut = "error [0-9]+: timed out after 1 second waiting for 127.0.0.1:" + mute + "\n";
    struct Case {
        std::vector<std::string> arguments;
        int status;
        std::string err;
    };
    const Case cases[] = {
        {{"--port", std::to_string(closed.port()), "--user", "ann", "whoami"}, 1, refused},
        {{"--port", std::to_string(closed.port()), "ping"}, 1, refused},
        {{"--host", "no-such-host.invalid", "--user", "ann", "whoami"},
         1,
         "error 393601: host not found: no-such-host.invalid\n"},
        {{"--port", port(), "whoami"}, 2, "error: no user given: use --user or ZEL_USER, or --token or ZEL_TOKEN\n"},
        {{"--port", port(), "--user", "ann", "--password", "wrong", "whoami"},
         1,
         "error 393625: invalid user name or password\n"},
        {{"--port", mute, "--timeout", "1", "ping"}, 5, timedOut},
        {{"--port", mute, "--user", "ann", "--timeout", "1", "whoami"}, 5, timedOut},
    };
    for (const Case& c : cases) {
        const Outcome run = raw(c.arguments, "", false);
        EXPECT_EQ(run.status, c.status) << run.err;
        EXPECT_TRUE(std::regex_match(run.err, std::regex(c.err))) << run.err;
        EXPECT_EQ(run.out, "");
    }
}

// On a terminal (here the one `script` makes) an upload draws its progress in units that grow with
// the size, whole bytes and tenths of the larger units; --quiet draws none.
TEST_F(Scripting, TransfersDrawProgressOnATerminal)
{
    spew(local("big.bin"), std::string(300000, 'x'));
    auto onTerminal = [&](const std::string& flag) {
        const std::string zelctl = quoted(ZEL_TEST_ZELCTL) + " --port " + port() + " --user ann --password pw-ann " +
                                   flag + " sr put DATA " + quoted(local("big.bin")) + " /big.bin";
        const std::string command = "script -qec " + quoted(zelctl) + " /dev/null > " + quoted(local("tty.out"));
        EXPECT_EQ(std::system(command.c_str()), 0) << command;
        return slurp(local("tty.out"));
    };
    const std::string drawn = onTerminal("--json");
    EXPECT_NE(drawn.find("0 B of 293.0 KiB"), std::string::npos) << drawn;
    EXPECT_NE(drawn.find("100% 293.0 KiB of 293.0 KiB"), std::string::npos) << drawn;
    EXPECT_EQ(onTerminal("--quiet").find("KiB"), std::string::npos);
}

}  // namespace
}  // namespace zeltest
