#include "support/local_server.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>

#include <gtest/gtest.h>

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace zeltest {

namespace {

constexpr int kStartTimeoutMs = 10000;
constexpr int kStopTimeoutMs = 10000;

// Reads one line from `fd` within the time-out; empty when none came.
std::string readLine(int fd, int timeoutMs)
{
    std::string line;
    char c = 0;
    while (true) {
        pollfd entry{fd, POLLIN, 0};
        if (::poll(&entry, 1, timeoutMs) <= 0)
            return {};
        if (::read(fd, &c, 1) != 1)
            return {};
        if (c == '\n')
            return line;
        line += c;
    }
}

}  // namespace

LocalServer::LocalServer(const std::string& executable, const std::string& configText)
{
    char pattern[] = "/tmp/zel-e2e-XXXXXX";
    if (::mkdtemp(pattern) == nullptr) {
        failure_ = "cannot make a temporary directory";
        return;
    }
    directory_ = pattern;
    std::ofstream(directory_ + "/zelserverd.conf") << configText;
    start(executable);
}

void LocalServer::start(const std::string& executable)
{
    int out[2];
    if (::pipe(out) != 0) {
        failure_ = "cannot make a pipe";
        return;
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, out[1], STDOUT_FILENO);
    posix_spawn_file_actions_addclose(&actions, out[0]);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, (directory_ + "/server.log").c_str(),
                                     O_WRONLY | O_CREAT | O_APPEND, 0600);
    const std::string data = directory_ + "/data";
    const std::string config = directory_ + "/zelserverd.conf";
    const char* argv[] = {executable.c_str(), "--data",   data.c_str(),   "--listen",
                          "127.0.0.1:0",      "--config", config.c_str(), nullptr};
    const int spawned =
        ::posix_spawn(&pid_, executable.c_str(), &actions, nullptr, const_cast<char* const*>(argv), environ);
    posix_spawn_file_actions_destroy(&actions);
    ::close(out[1]);
    if (spawned != 0) {
        pid_ = -1;
        ::close(out[0]);
        failure_ = "cannot start " + executable;
        return;
    }
    const std::string line = readLine(out[0], kStartTimeoutMs);
    ::close(out[0]);
    const std::string prefix = "listening on 127.0.0.1:";
    if (line.rfind(prefix, 0) != 0) {
        failure_ = "the server did not report its port (got '" + line + "')";
        return;
    }
    port_ = static_cast<std::uint16_t>(std::atoi(line.c_str() + prefix.size()));
}

int LocalServer::stop()
{
    if (pid_ <= 0)
        return -1;
    ::kill(pid_, SIGTERM);
    // The server stops within a few seconds whatever its clients do; one that does not is a fault.
    int status = 0;
    bool ended = false;
    for (int waited = 0; waited < kStopTimeoutMs && !ended; waited += 20) {
        ended = ::waitpid(pid_, &status, WNOHANG) == pid_;
        if (!ended)
            ::usleep(20000);
    }
    if (!ended) {
        ::kill(pid_, SIGKILL);
        ::waitpid(pid_, &status, 0);
    }
    pid_ = -1;
    const int code = ended && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    std::ifstream in(directory_ + "/server.log");
    const std::string log((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    // Whatever a sanitizer reports ends up on standard error, which is the server's log here.
    if (code != 0 || log.find("Sanitizer") != std::string::npos || log.find("runtime error:") != std::string::npos)
        ADD_FAILURE() << "zelserverd did not stop cleanly (exit status " << code << "); its log:\n" << log;
    return code;
}

LocalServer::~LocalServer()
{
    stop();
    if (!directory_.empty()) {
        std::error_code ignored;
        std::filesystem::remove_all(directory_, ignored);
    }
}

}  // namespace zeltest
