// The real executable: its command line, its one stdout line, the generated administrator,
// and a clean exit on SIGTERM and SIGINT.
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <functional>
#include <regex>
#include <thread>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

struct Process {
  pid_t pid = -1;
  int out = -1;
  int err = -1;
};

Process spawnServer(const std::vector<std::string>& args) {
  int outPipe[2], errPipe[2];
  if (::pipe(outPipe) != 0 || ::pipe(errPipe) != 0) return {};
  pid_t pid = ::fork();
  if (pid == 0) {
    ::dup2(outPipe[1], 1);
    ::dup2(errPipe[1], 2);
    std::vector<char*> argv;
    std::string exe = ZELSERVERD_EXECUTABLE;
    argv.push_back(exe.data());
    std::vector<std::string> copies = args;
    for (auto& arg : copies) argv.push_back(arg.data());
    argv.push_back(nullptr);
    ::execv(exe.c_str(), argv.data());
    ::_exit(127);
  }
  ::close(outPipe[1]);
  ::close(errPipe[1]);
  return {pid, outPipe[0], errPipe[0]};
}

// Reads from fd until `done` says so or the time-out passes.
std::string readUntil(int fd, int timeoutMs, const std::function<bool(const std::string&)>& done) {
  std::string text;
  auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(timeoutMs);
  while (!done(text) && std::chrono::steady_clock::now() < deadline) {
    pollfd p{fd, POLLIN, 0};
    if (::poll(&p, 1, 100) != 1) continue;
    char buffer[512];
    ssize_t n = ::read(fd, buffer, sizeof buffer);
    if (n <= 0) break;
    text.append(buffer, static_cast<std::size_t>(n));
  }
  return text;
}

// Waits for the exit status; kills the process if it does not end in time.
int waitExit(pid_t pid, int timeoutMs) {
  for (int waited = 0; waited < timeoutMs; waited += 20) {
    int status = 0;
    if (::waitpid(pid, &status, WNOHANG) == pid) return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  ::kill(pid, SIGKILL);
  ::waitpid(pid, nullptr, 0);
  return -2;
}

std::uint16_t listeningPort(const std::string& line) {
  std::smatch match;
  std::regex pattern("^listening on 127\\.0\\.0\\.1:([0-9]+)\n$");
  if (!std::regex_match(line, match, pattern)) return 0;
  return static_cast<std::uint16_t>(std::stoi(match[1]));
}

std::string trimmedFile(const std::string& path) {
  std::string text = readFile(path);
  while (!text.empty() && (text.back() == '\n' || text.back() == ' ')) text.pop_back();
  return text;
}

class Executable : public ::testing::Test {
 protected:
  void SetUp() override { root_ = makeTempDir(); }
  void TearDown() override { removeTree(root_); }
  std::string root_;
};

TEST_F(Executable, GeneratesAnAdministratorOnceAndStopsOnSigterm) {
  std::string data = root_ + "/data";
  Process first = spawnServer({"--data", data, "--listen", "127.0.0.1:0"});
  ASSERT_GT(first.pid, 0);
  std::string line = readUntil(first.out, 20000, [](const std::string& t) {
    return t.find('\n') != std::string::npos;
  });
  std::uint16_t port = listeningPort(line);
  ASSERT_NE(port, 0) << line;

  std::string password = trimmedFile(data + "/admin-password");
  struct stat info {};
  ASSERT_EQ(::stat((data + "/admin-password").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0600u);
  EXPECT_EQ(password.size(), 24u);
  {
    TestClient client;
    ASSERT_TRUE(client.connect(port));
    EXPECT_TRUE(client.signIn("admin", password).ok());
    EXPECT_EQ(client.command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body,
              "admin");
    EXPECT_EQ(client.signIn("admin", "admin").status, "ERROR");
  }
  ::kill(first.pid, SIGTERM);
  EXPECT_EQ(waitExit(first.pid, 20000), 0);
  std::string log = readUntil(first.err, 1000, [](const std::string&) { return false; });
  EXPECT_NE(log.find("created user 'admin' with password " + password), std::string::npos) << log;
  EXPECT_NE(log.find("user=admin command=SERVER_SESSION_GET_PROP outcome=SUCCESS"),
            std::string::npos) << log;
  EXPECT_NE(log.find("user=- command=SERVER_SESSION_INIT outcome=ERROR"), std::string::npos)
      << log;
  ::close(first.out);
  ::close(first.err);

  // A second start keeps the password and does not print it again; SIGINT also stops it.
  Process second = spawnServer({"--data", data, "--listen", "127.0.0.1:0", "--quiet"});
  line = readUntil(second.out, 20000, [](const std::string& t) {
    return t.find('\n') != std::string::npos;
  });
  ASSERT_NE(listeningPort(line), 0) << line;
  EXPECT_EQ(trimmedFile(data + "/admin-password"), password);
  ::kill(second.pid, SIGINT);
  EXPECT_EQ(waitExit(second.pid, 20000), 0);
  EXPECT_EQ(readUntil(second.err, 1000, [](const std::string&) { return false; }), "");
  ::close(second.out);
  ::close(second.err);
}

TEST_F(Executable, RefusesBadArgumentsAndConfigs) {
  struct Case {
    std::vector<std::string> args;
    std::string expected;
    int code;
  };
  writeFile(root_ + "/bad.conf", "[server]\nworkers = many\n");
  const Case cases[] = {
      {{}, "usage: zelserverd", 2},
      {{"--data"}, "bad argument '--data'", 2},
      {{"--data", root_ + "/d", "--bogus"}, "bad argument '--bogus'", 2},
      {{"--data", root_ + "/d", "--listen", "nohost"}, "bad --listen address 'nohost'", 1},
      {{"--data", root_ + "/d", "--config", root_ + "/bad.conf"},
       root_ + "/bad.conf: line 2: workers must be 1 to 64", 1},
      {{"--data", root_ + "/d", "--config", root_ + "/missing.conf"},
       "cannot read config file", 1},
  };
  for (const Case& c : cases) {
    Process p = spawnServer(c.args);
    ASSERT_GT(p.pid, 0);
    int code = waitExit(p.pid, 20000);
    std::string err = readUntil(p.err, 2000, [](const std::string&) { return false; });
    EXPECT_EQ(code, c.code) << err;
    EXPECT_NE(err.find(c.expected), std::string::npos) << err;
    ::close(p.out);
    ::close(p.err);
  }
}

}  // namespace
}  // namespace zeltest
