// The server: its state, the listening socket, and one thread per connection.
#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <list>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "auth.h"
#include "config.h"
#include "jobs.h"
#include "logger.h"
#include "repository_store.h"
#include "net.h"
#include "shared_resources.h"
#include "store.h"

namespace zelserverd {

// The server is released with the library and carries its version.
constexpr std::string_view kServerVersion = ZEL_VERSION;
constexpr std::string_view kAdminPasswordFile = "admin-password";
// How long stop() lets connections finish the reply they are writing.
constexpr std::chrono::seconds kStopGrace{2};

struct ServerOptions {
    std::string dataDir;
    std::string configFile;  // empty: built-in defaults with a generated administrator
    std::string listen;      // empty: from the config, else 127.0.0.1:7071
    bool quiet = false;
    std::FILE* logStream = stderr;
};

// Everything the command handlers share. Built once, before the first connection.
struct ServerState {
    explicit ServerState(const ServerOptions& options)
        : log(options.logStream, options.quiet), tokens(db), auth(config, &tokens), repos(db)
    {}

    std::string dataDir;
    std::string tempDir;  // DATA/tmp: every upload and copy is received here, emptied at start
    Config config;
    Logger log;
    Database db;
    TokenStore tokens;
    Authenticator auth;
    std::vector<SharedArea> areas;
    RepositoryStore repos;
    std::unique_ptr<JobManager> jobs;
    std::atomic<bool> stopping{false};

    const SharedArea* findArea(std::string_view name) const
    {
        for (const auto& area : areas)
            if (area.config().name == name)
                return &area;
        return nullptr;
    }
};

class Server {
public:
    // Loads the configuration, prepares the data directory and the database, and binds the
    // listening socket. Null with `error` set on failure.
    static std::unique_ptr<Server> create(const ServerOptions& options, std::string& error);
    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;
    ~Server();

    // Starts accepting connections on a background thread.
    void start();
    // Stops accepting, ends every connection after its current command, joins every thread.
    // Safe to call more than once.
    void stop();

    std::string host() const { return host_; }
    std::uint16_t port() const { return port_; }
    ServerState& state() { return *state_; }
    // Set when a generated administrator password was created on this start.
    const std::string& generatedPassword() const { return generatedPassword_; }

private:
    explicit Server(const ServerOptions& options);
    std::string prepare(const ServerOptions& options);
    std::string prepareDefaultConfig();
    void acceptLoop();
    void reapFinished();
    void turnAway(int fd);

    struct Connection {
        int fd;
        std::thread thread;
        std::atomic<bool> finished{false};
    };

    std::unique_ptr<ServerState> state_;
    UniqueFd listener_;
    UniqueFd wakeRead_;
    UniqueFd wakeWrite_;
    std::string host_;
    std::uint16_t port_ = 0;
    std::string generatedPassword_;
    std::thread acceptThread_;
    std::mutex connectionsMutex_;
    std::list<Connection> connections_;
    bool stopped_ = false;
};

// Runs one client connection until it closes or the server stops.
void serveConnection(ServerState& state, int fd);

}  // namespace zelserverd
