// The real executable: its command line, its one stdout line, the generated administrator kept as a
// hash, and a clean exit on SIGTERM and SIGINT.
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <regex>
#include <thread>

#include "auth.h"
#include "support/server_fixture.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

// A started server with the read ends of its standard output and standard error.
struct Process {
    pid_t pid = -1;
    int out = -1;
    int err = -1;

    // Reads `fd` until it ends, holds a whole line when `line`, or the time-out passes.
    static std::string read(int fd, bool line, int timeoutMs = 20000)
    {
        std::string text;
        auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(timeoutMs);
        while (!(line && text.find('\n') != std::string::npos) && std::chrono::steady_clock::now() < deadline) {
            pollfd p{fd, POLLIN, 0};
            if (::poll(&p, 1, 100) != 1)
                continue;
            char buffer[512];
            ssize_t n = ::read(fd, buffer, sizeof buffer);
            if (n <= 0)
                break;
            text.append(buffer, static_cast<std::size_t>(n));
        }
        return text;
    }
    // The port of its "listening on" line, 0 when the line is something else.
    std::uint16_t port() const
    {
        std::string line = read(out, true);
        std::smatch match;
        if (!std::regex_match(line, match, std::regex("^listening on 127\\.0\\.0\\.1:([0-9]+)\n$")))
            return 0;
        return static_cast<std::uint16_t>(std::stoi(match[1]));
    }
    // Its exit status once it has ended (-2: killed for not ending in time), and its standard error.
    std::pair<int, std::string> finish()
    {
        int code = -2;
        for (int waited = 0; waited < 20000 && code == -2; waited += 20) {
            int status = 0;
            if (::waitpid(pid, &status, WNOHANG) == pid)
                code = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
            else
                std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        if (code == -2) {
            ::kill(pid, SIGKILL);
            ::waitpid(pid, nullptr, 0);
        }
        std::string errors = read(err, false, 2000);
        ::close(out);
        ::close(err);
        return {code, errors};
    }
};

Process spawnServer(std::vector<std::string> args)
{
    int outPipe[2], errPipe[2];
    if (::pipe(outPipe) != 0 || ::pipe(errPipe) != 0)
        return {};
    pid_t pid = ::fork();
    if (pid == 0) {
        ::dup2(outPipe[1], 1);
        ::dup2(errPipe[1], 2);
        std::string exe = ZELSERVERD_EXECUTABLE;
        std::vector<char*> argv{exe.data()};
        for (auto& arg : args)
            argv.push_back(arg.data());
        argv.push_back(nullptr);
        ::execv(exe.c_str(), argv.data());
        ::_exit(127);
    }
    ::close(outPipe[1]);
    ::close(errPipe[1]);
    return {pid, outPipe[0], errPipe[0]};
}

class Executable : public ::testing::Test {
protected:
    void SetUp() override { root_ = makeTempDir(); }
    void TearDown() override { removeTree(root_); }
    std::string root_;
};

TEST_F(Executable, GeneratesAnAdministratorOnceAndStopsOnSigterm)
{
    std::string data = root_ + "/data";
    Process first = spawnServer({"--data", data, "--listen", "127.0.0.1:0"});
    ASSERT_GT(first.pid, 0);
    std::uint16_t port = first.port();
    ASSERT_NE(port, 0);
    std::string password = readFile(data + "/admin-password");
    ASSERT_EQ(password.back(), '\n');
    password.pop_back();
    struct stat info {};
    ASSERT_EQ(::stat((data + "/admin-password").c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0600u);
    EXPECT_EQ(password.size(), 24u);
    const std::string stored = readFile(data + "/admin-password.hash");
    EXPECT_EQ(stored.find(password), std::string::npos);
    EXPECT_TRUE(zelserverd::passwordMatches(stored.substr(0, stored.size() - 1), password));
    {
        TestClient client;
        ASSERT_TRUE(client.connect(port));
        EXPECT_TRUE(client.signIn("admin", password).ok());
        EXPECT_EQ(client.command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body, "admin");
        EXPECT_EQ(client.signIn("admin", "admin").status, "ERROR");
    }
    ::kill(first.pid, SIGTERM);
    auto [code, log] = first.finish();
    EXPECT_EQ(code, 0);
    for (const std::string& line : {"created user 'admin' with password " + password,
                                    "user=admin command=SERVER_SESSION_GET_PROP outcome=SUCCESS"s,
                                    "user=- command=SERVER_SESSION_INIT outcome=ERROR"s})
        EXPECT_NE(log.find(line), std::string::npos) << log;

    // A second start keeps the password and does not print it again; SIGINT also stops it.
    Process second = spawnServer({"--data", data, "--listen", "127.0.0.1:0", "--quiet"});
    ASSERT_NE(second.port(), 0);
    EXPECT_EQ(readFile(data + "/admin-password"), password + "\n");
    ::kill(second.pid, SIGINT);
    EXPECT_EQ(second.finish(), std::make_pair(0, std::string()));
}

TEST_F(Executable, RefusesBadArgumentsAndConfigs)
{
    struct Case {
        std::vector<std::string> args;
        std::string expected;
        int code;
    };
    writeFile(root_ + "/bad.conf", "[server]\nworkers = many\n");
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
        Process p = spawnServer(c.args);
        ASSERT_GT(p.pid, 0);
        auto [code, err] = p.finish();
        EXPECT_EQ(code, c.code) << err;
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
