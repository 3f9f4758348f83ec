// zelserverd: the local development server. See docs/zelserverd.md.
#include <termios.h>
#include <unistd.h>

#include <CLI/CLI.hpp>
#include <csignal>
#include <cstdio>
#include <iostream>
#include <string>

#include "server.h"

namespace {

// Reads one password line from standard input, without echo on a terminal, and prints its hash.
int hashPasswordCommand()
{
    termios saved{};
    bool terminal = ::isatty(STDIN_FILENO) && ::tcgetattr(STDIN_FILENO, &saved) == 0;
    if (terminal) {
        termios quiet = saved;
        quiet.c_lflag &= ~static_cast<tcflag_t>(ECHO);
        ::tcsetattr(STDIN_FILENO, TCSANOW, &quiet);
        std::fprintf(stderr, "password: ");
    }
    std::string password;
    std::getline(std::cin, password);
    if (terminal) {
        ::tcsetattr(STDIN_FILENO, TCSANOW, &saved);
        std::fprintf(stderr, "\n");
    }
    if (!password.empty() && password.back() == '\r')
        password.pop_back();
    if (password.empty()) {
        std::fprintf(stderr, "zelserverd: no password given on standard input\n");
        return 1;
    }
    std::string hash = zelserverd::hashPassword(password);
    if (hash.empty()) {
        std::fprintf(stderr, "zelserverd: cannot hash the password\n");
        return 1;
    }
    std::printf("%s\n", hash.c_str());
    return 0;
}

int serve(const zelserverd::ServerOptions& options)
{
    // Signals are taken by sigwait on this thread only: every thread started below inherits the
    // blocked mask, so no handler ever runs in the middle of a command.
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGINT);
    sigaddset(&signals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    std::signal(SIGPIPE, SIG_IGN);

    std::string error;
    std::unique_ptr<zelserverd::Server> server = zelserverd::Server::create(options, error);
    if (!server) {
        std::fprintf(stderr, "zelserverd: %s\n", error.c_str());
        return 1;
    }
    if (!server->generatedPassword().empty())
        std::fprintf(stderr, "zelserverd: created user 'admin' with password %s (kept in %s/%s)\n",
                     server->generatedPassword().c_str(), server->state().dataDir.c_str(),
                     std::string(zelserverd::kAdminPasswordFile).c_str());
    server->start();
    std::string host = server->host();
    if (host.find(':') != std::string::npos)
        host = "[" + host + "]";
    std::printf("listening on %s:%u\n", host.c_str(), static_cast<unsigned>(server->port()));
    std::fflush(stdout);

    int received = 0;
    sigwait(&signals, &received);
    server->state().log.info(std::string("stopping on ") + (received == SIGINT ? "SIGINT" : "SIGTERM"));
    server->stop();
    server->state().log.info("stopped");
    return 0;
}

}  // namespace

int main(int argc, char** argv)
{
    zelserverd::ServerOptions options;
    CLI::App app{"zelserverd: the local development server (see docs/zelserverd.md)", "zelserverd"};
    app.set_version_flag("--version", "zelserverd " ZEL_VERSION " (zelserverapi " ZEL_VERSION ")");
    app.add_option("--data", options.dataDir, "State directory (database, repositories, jobs, logs)");
    app.add_option("--listen", options.listen, "Address to bind, HOST:PORT (default 127.0.0.1:7071; port 0 picks one)");
    app.add_option("--config", options.configFile, "Users, roles, shared resources, job services, limits");
    app.add_flag("--quiet", options.quiet, "No log line per command on standard error");
    CLI::App* hash = app.add_subcommand(
        "hash-password", "Read a password on standard input and print the hash to put in the configuration");
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& e) {
        return app.exit(e) == 0 ? 0 : 2;
    }
    if (hash->parsed())
        return hashPasswordCommand();
    if (options.dataDir.empty()) {
        std::fprintf(stderr, "zelserverd: --data DIR is required\n%s", app.help().c_str());
        return 2;
    }
    return serve(options);
}
