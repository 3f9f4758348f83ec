// zelserverd: the local development server. See docs/zelserverd.md.
#include <csignal>
#include <cstdio>
#include <cstring>
#include <string>

#include "server.h"

namespace {

void usage(std::FILE* out)
{
    std::fprintf(out,
                 "usage: zelserverd --data DIR [--listen HOST:PORT] [--config FILE] [--quiet]\n"
                 "  --data DIR          state directory (database, repositories, jobs, logs)\n"
                 "  --listen HOST:PORT  address to bind (default 127.0.0.1:%u; port 0 picks one)\n"
                 "  --config FILE       users, roles, shared resources, job services, limits\n"
                 "  --quiet             no log line per command on standard error\n",
                 static_cast<unsigned>(zelserverd::kDefaultPort));
}

}  // namespace

int main(int argc, char** argv)
{
    zelserverd::ServerOptions options;
    for (int i = 1; i < argc; ++i) {
        std::string arg = argv[i];
        auto value = [&](std::string& out) {
            if (i + 1 >= argc)
                return false;
            out = argv[++i];
            return true;
        };
        bool ok = true;
        if (arg == "--data")
            ok = value(options.dataDir);
        else if (arg == "--listen")
            ok = value(options.listen);
        else if (arg == "--config")
            ok = value(options.configFile);
        else if (arg == "--quiet")
            options.quiet = true;
        else if (arg == "--help" || arg == "-h") {
            usage(stdout);
            return 0;
        } else
            ok = false;
        if (!ok) {
            std::fprintf(stderr, "zelserverd: bad argument '%s'\n", arg.c_str());
            usage(stderr);
            return 2;
        }
    }
    if (options.dataDir.empty()) {
        usage(stderr);
        return 2;
    }

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
