// The real executable: its command line, its one stdout line, the generated administrator kept as a
// hash, and a clean exit on SIGTERM and SIGINT.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <cstdio>
#include <cstdlib>
#include <regex>
#include <utility>

#include "auth.h"
#include "support/server_fixture.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

// The server, run by a shell that prints its own process id and then becomes the server; its standard
// error goes to the file `errors`.
class Process {
public:
    Process(const std::vector<std::string>& args, const std::string& errors)
    {
        std::string command = "echo $$; exec " ZELSERVERD_EXECUTABLE;
        for (const std::string& arg : args)
            command += " '" + arg + "'";
        out_ = ::popen((command + " 2>'" + errors + "'").c_str(), "r");
        pid_ = std::atoi(line().c_str());
    }
    // The next line of its standard output; "" at its end.
    std::string line()
    {
        char text[512];
        return out_ != nullptr && std::fgets(text, sizeof text, out_) != nullptr ? text : "";
    }
    // The port of its "listening on" line, 0 when the line is something else.
    std::uint16_t port()
    {
        std::smatch match;
        const std::string text = line();
        if (!std::regex_match(text, match, std::regex("^listening on 127\\.0\\.0\\.1:([0-9]+)\n$")))
            return 0;
        return static_cast<std::uint16_t>(std::stoi(match[1]));
    }
    ~Process() { finish(SIGKILL); }
    // Sends `signal` (none when 0) and waits for the end; the exit status, -1 for any other end.
    int finish(int signal = 0)
    {
        if (out_ == nullptr)
            return -1;
        if (signal != 0 && pid_ > 0)
            ::kill(pid_, signal);
        const int status = ::pclose(std::exchange(out_, nullptr));
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

private:
    FILE* out_ = nullptr;
    pid_t pid_ = 0;
};

class Executable : public ::testing::Test {
protected:
    const TempDir dir_{"zelserverd-test"};
    const std::string root_ = dir_.string();
};

TEST_F(Executable, GeneratesAnAdministratorOnceAndStopsOnSigterm)
{
    const std::string data = root_ + "/data";
    const std::string errors = root_ + "/errors";
    Process first({"--data", data, "--listen", "127.0.0.1:0"}, errors);
    const std::uint16_t port = first.port();
    ASSERT_NE(port, 0);
    std::string password = slurp(data + "/admin-password");
    ASSERT_EQ(password.back(), '\n');
    password.pop_back();
    struct stat info {};
    ASSERT_EQ(::stat((data + "/admin-password").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600u);
    EXPECT_EQ(password.size(), 24u);
    const std::string stored = slurp(data + "/admin-password.hash");
    EXPECT_EQ(stored.find(password), std::string::npos);
    EXPECT_TRUE(zelserverd::passwordMatches(stored.substr(0, stored.size() - 1), password));
    {
        TestClient client;
        ASSERT_TRUE(client.connect(port));
        EXPECT_TRUE(client.signIn("admin", password).ok());
        EXPECT_EQ(client.command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body, "admin");
        EXPECT_EQ(client.signIn("admin", "admin").status, "ERROR");
    }
    EXPECT_EQ(first.finish(SIGTERM), 0);
    const std::string log = slurp(errors);
    for (const std::string& line : {"created user 'admin' with password " + password,
                                    "user=admin command=SERVER_SESSION_GET_PROP outcome=SUCCESS"s,
                                    "user=- command=SERVER_SESSION_INIT outcome=ERROR"s})
        EXPECT_NE(log.find(line), std::string::npos) << log;

    // A second start keeps the password and does not print it again; SIGINT also stops it.
    Process second({"--data", data, "--listen", "127.0.0.1:0", "--quiet"}, errors);
    ASSERT_NE(second.port(), 0);
    EXPECT_EQ(slurp(data + "/admin-password"), password + "\n");
    EXPECT_EQ(second.finish(SIGINT), 0);
    EXPECT_EQ(slurp(errors), "");
}

TEST_F(Executable, RefusesBadArgumentsAndConfigs)
{
    struct Case {
        std::vector<std::string> args;
        std::string expected;
        int code;
    };
    spew(root_ + "/bad.conf", "[server]\nworkers = many\n");
    const Case cases[] = {
        {{}, "--data DIR is required", 2},
        {{"--data"}, "--data: 1 required TEXT missing", 2},
        {{"--data", root_ + "/d", "--bogus"}, "not expected: --bogus", 2},
        {{"--data", root_ + "/d", "--listen", "nohost"}, "bad --listen address 'nohost'", 1},
        {{"--data", root_ + "/d", "--config", root_ + "/bad.conf"},
         root_ + "/bad.conf: line 2: workers must be 1 to 64",
         1},
        {{"--data", root_ + "/d", "--config", root_ + "/missing.conf"}, "cannot read config file", 1},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(Process(c.args, root_ + "/errors").finish(), c.code);
        const std::string err = slurp(root_ + "/errors");
        EXPECT_NE(err.find(c.expected), std::string::npos) << err;
    }
}

TEST(Passwords, HashesAreCheckedPlainTextStaysAcceptedAndNothingElseMatches)
{
    const std::string hash = zelserverd::hashPassword("s3cret");
    ASSERT_EQ(hash.rfind("$y$", 0), 0u);
    EXPECT_NE(hash, zelserverd::hashPassword("s3cret")) << "each hash has its own salt";
    struct Case {
        std::string stored;
        std::string given;
        bool matches;
    };
    for (const Case& c : {Case{hash, "s3cret", true}, Case{hash, "s3cret ", false}, Case{hash, hash, false},
                          Case{"s3cret", "s3cret", true}, Case{"s3cret", "S3cret", false}, Case{"$bogus", "", false}})
        EXPECT_EQ(zelserverd::passwordMatches(c.stored, c.given), c.matches) << c.stored << " / " << c.given;
}

}  // namespace
}  // namespace zeltest
