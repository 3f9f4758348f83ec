// What scripts rely on: exit statuses, settings from the environment, error lines that say what
// happened, and ping and --version without signing in.

#include <regex>

#include "support/ports.h"
#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

class Scripting : public Zelctl {
protected:
    void SetUp() override
    {
        Zelctl::SetUp();
        std::ofstream(local("fail.zlw")) << "#!/bin/sh\n# @title Fails\necho failing\nexit 3\n";
        ASSERT_EQ(ann({"repo", "create", "demo"}).status, 0);
        ASSERT_EQ(ann({"item", "put", "demo", local("greet.zlw")}).status, 0);
        ASSERT_EQ(ann({"item", "put", "demo", local("fail.zlw")}).status, 0);
    }

    std::string scheduled()
    {
        const Outcome run = ann({"job", "schedule", "3600", "zeljob", "demo", "greet.zlw"});
        EXPECT_EQ(run.status, 0) << run.err;
        return run.out.substr(0, run.out.find('\n'));
    }

    std::string port() const { return std::to_string(server->port()); }
};

TEST_F(Scripting, ExitStatusesTellHowTheCommandAndTheJobEnded)
{
    const Outcome submitted = ann({"job", "submit", "zeljob", "demo", "fail.zlw"});
    const std::string failed = submitted.out.substr(0, submitted.out.find('\n'));
    const std::string delayed = scheduled();
    const std::string aborted = scheduled();
    ASSERT_EQ(ann({"job", "abort", aborted}).status, 0);

    struct Case {
        std::vector<std::string> arguments;
        int status;
        const char* out;  // a part of standard output
    };
    const Case cases[] = {
        {{"job", "run", "zeljob", "demo", "greet.zlw", "-p", "WHO=Ann"}, 0, "status: SUCCESS"},
        {{"job", "run", "zeljob", "demo", "fail.zlw"}, 3, "status: JOB_FAILURE"},
        {{"job", "wait", failed}, 3, "status: JOB_FAILURE"},
        {{"job", "log", failed, "--follow"}, 3, "failing"},
        {{"job", "result", failed}, 0, "status: JOB_FAILURE"},
        {{"job", "wait", aborted}, 4, "status: ABORTED"},
        {{"job", "wait", delayed, "--timeout", "1"}, 5, ""},
        {{"job", "log", failed, "--follow", "--json"}, 2, ""},
        {{"repo", "show", "nope"}, 1, ""},
        {{"bogus"}, 2, ""},
    };
    for (const Case& c : cases) {
        const Outcome run = ann(c.arguments);
        EXPECT_EQ(run.status, c.status) << c.arguments[1] << run.err;
        EXPECT_NE(run.out.find(c.out), std::string::npos) << run.out;
    }
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
         {"whoami", "--user", "ann", "--json", "--password", "pw-ann"},
         "ann"},
        {"ZEL_PORT=1 ZEL_USER=bob ZEL_PASSWORD=pw-bob", {"--port", port(), "--json", "whoami"}, "bob"},
    };
    for (const Case& c : cases) {
        const Outcome run = raw(c.arguments, c.environment, false);
        ASSERT_EQ(run.status, 0) << c.environment << ": " << run.err;
        EXPECT_EQ(run.json()["account"], c.account) << c.environment;
    }
}

TEST_F(Scripting, FailuresToConnectOrSignInSayWhy)
{
    const ClosedPort closed;
    const std::string refused = "127.0.0.1:" + std::to_string(closed.port());
    struct Case {
        std::vector<std::string> arguments;
        int status;
        std::string err;
    };
    const Case cases[] = {
        {{"--port", std::to_string(closed.port()), "--user", "ann", "whoami"},
         1,
         "error 393601: connection refused by " + refused + "\n"},
        {{"--port", std::to_string(closed.port()), "ping"}, 1, "error 393601: connection refused by " + refused + "\n"},
        {{"--host", "no-such-host.invalid", "--user", "ann", "whoami"},
         1,
         "error 393601: host not found: no-such-host.invalid\n"},
        {{"--port", port(), "whoami"}, 2, "error: no user given: use --user or ZEL_USER, or --token or ZEL_TOKEN\n"},
    };
    for (const Case& c : cases) {
        const Outcome run = raw(c.arguments, "", false);
        EXPECT_EQ(run.status, c.status) << run.err;
        EXPECT_EQ(run.err, c.err);
        EXPECT_EQ(run.out, "");
    }
}

TEST_F(Scripting, PingAndVersionNeedNoSignIn)
{
    const Outcome ping = raw({"ping", "--json"});
    ASSERT_EQ(ping.status, 0) << ping.err;
    EXPECT_EQ(ping.json(), nlohmann::json::parse(R"({"host":"127.0.0.1","port":)" + port() + R"(,"up":true})"));
    const Outcome version = raw({"--version"}, "", false);
    EXPECT_EQ(version.status, 0);
    EXPECT_TRUE(std::regex_match(version.out, std::regex("zelctl [0-9.]+ \\(zelserverapi [0-9.]+\\)\n")))
        << version.out;
}

}  // namespace
}  // namespace zeltest
