#pragma once
// Runs the local development server (zelserverd) for end-to-end tests: a fresh data directory, a
// configuration written by the test, a free loopback port. The server is stopped with SIGTERM and
// waited for when the object goes away, and checked: a clean exit and a log without a sanitizer
// report.

#include <cstdint>
#include <string>

#include <sys/types.h>

namespace zeltest {

class LocalServer {
public:
    // `configText` is written to a file in a new temporary directory; the data directory lies beside it.
    LocalServer(const std::string& executable, const std::string& configText);
    ~LocalServer();
    LocalServer(const LocalServer&) = delete;
    LocalServer& operator=(const LocalServer&) = delete;

    // Empty when the server is listening; otherwise why it is not.
    const std::string& failure() const { return failure_; }
    std::uint16_t port() const { return port_; }
    const std::string& directory() const { return directory_; }

    // Stops the server (SIGTERM) and waits for it; returns its exit status, or -1. A server that
    // does not exit with 0 within ten seconds, or whose log holds a sanitizer report, fails the
    // running test.
    int stop();

private:
    void start(const std::string& executable);

    std::string directory_;
    std::string failure_;
    pid_t pid_ = -1;
    std::uint16_t port_ = 0;
};

}  // namespace zeltest
