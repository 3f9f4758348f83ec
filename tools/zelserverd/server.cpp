#include "server.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <filesystem>
#include <fstream>

#include "framing.h"
#include "util.h"

namespace zelserverd {

namespace fs = std::filesystem;

Server::Server(const ServerOptions& options) : state_(std::make_unique<ServerState>(options)) {}

Server::~Server() { stop(); }

std::unique_ptr<Server> Server::create(const ServerOptions& options, std::string& error)
{
    std::unique_ptr<Server> server(new Server(options));
    error = server->prepare(options);
    if (!error.empty())
        return nullptr;
    return server;
}

std::string Server::prepare(const ServerOptions& options)
{
    if (options.dataDir.empty())
        return "no data directory given (--data DIR)";
    std::error_code ec;
    fs::create_directories(options.dataDir, ec);
    if (ec)
        return "cannot create data directory '" + options.dataDir + "': " + ec.message();
    state_->dataDir = fs::canonical(options.dataDir, ec).string();
    if (ec)
        return "cannot resolve data directory '" + options.dataDir + "': " + ec.message();
    // The database, the stored files, the job folders and the administrator's password are the
    // server's alone: nobody else, jobs included, may look inside.
    if (::chmod(state_->dataDir.c_str(), 0700) != 0)
        return "cannot restrict data directory '" + state_->dataDir + "': " + std::strerror(errno);

    // Temporaries live apart from everyone's files; what a crash left there is swept now.
    state_->tempDir = state_->dataDir + "/tmp";
    fs::remove_all(state_->tempDir, ec);
    if (!fs::create_directory(state_->tempDir, ec))
        return "cannot create '" + state_->tempDir + "': " + ec.message();

    Config& config = state_->config;
    std::string error =
        options.configFile.empty() ? prepareDefaultConfig() : loadConfigFile(options.configFile, config);
    if (!error.empty())
        return error;
    for (const auto& user : config.users)
        if (!isPasswordHash(user.password))
            state_->log.info("warning: user '" + user.name +
                             "' has a plain-text password in the configuration; put the output of "
                             "'zelserverd hash-password' there instead");
    if (!options.listen.empty() && !splitHostPort(options.listen, config.listenHost, config.listenPort))
        return "bad --listen address '" + options.listen + "' (expected HOST:PORT)";
    for (const auto& area : config.sharedResources) {
        fs::create_directories(area.path, ec);
        if (!fs::is_directory(area.path))
            return "shared resource '" + area.name + "': '" + area.path + "' is not a directory";
        state_->areas.emplace_back(area, error);
        if (!error.empty())
            return error;
    }

    error = state_->db.open(state_->dataDir + "/zelserverd.db");
    if (!error.empty())
        return error;
    error = state_->repos.open(state_->dataDir + "/store");
    if (!error.empty())
        return error;
    state_->jobs =
        std::make_unique<JobManager>(state_->db, state_->repos, state_->log, config, state_->dataDir + "/jobs");
    error = state_->jobs->open();
    if (!error.empty())
        return error;

    listener_ = listenOn(config.listenHost, config.listenPort, error);
    if (!listener_.valid())
        return error;
    host_ = config.listenHost;
    port_ = boundPort(listener_.get());

    int pipeFds[2];
    if (::pipe2(pipeFds, O_CLOEXEC) != 0)
        return std::string("pipe: ") + std::strerror(errno);
    wakeRead_.reset(pipeFds[0]);
    wakeWrite_.reset(pipeFds[1]);
    return {};
}

namespace {

// Writes a new file that only the server's account may read, replacing an older one.
std::string writePrivateFile(const std::string& path, const std::string& content)
{
    ::unlink(path.c_str());
    UniqueFd fd(::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (!fd.valid() || ::write(fd.get(), content.data(), content.size()) != static_cast<ssize_t>(content.size()) ||
        ::fsync(fd.get()) != 0)
        return "cannot write '" + path + "': " + std::strerror(errno);
    return {};
}

}  // namespace

std::string Server::prepareDefaultConfig()
{
    // Without a configuration there is one administrator whose password is generated once. Its
    // plain text goes to the owner's file only (mode 0600, in the data directory that jobs cannot
    // reach); the server keeps and checks a hash. There is no built-in password.
    std::string path = state_->dataDir + "/" + std::string(kAdminPasswordFile);
    std::string hashPath = path + ".hash";
    std::string password;
    std::ifstream existing(path);
    if (existing) {
        std::getline(existing, password);
        password = trim(password);
        if (password.empty())
            return "'" + path + "' is empty; delete it to generate a new password";
    } else {
        password = randomHex(12);
        if (password.empty())
            return "cannot read random bytes for the administrator password";
        std::string error = writePrivateFile(path, password + "\n");
        if (!error.empty())
            return error;
        ::unlink(hashPath.c_str());
        generatedPassword_ = password;
    }
    std::string hash;
    std::ifstream stored(hashPath);
    if (!stored || !std::getline(stored, hash) || !passwordMatches(hash, password)) {
        hash = hashPassword(password);
        std::string error =
            hash.empty() ? "cannot hash the administrator password" : writePrivateFile(hashPath, hash + "\n");
        if (!error.empty())
            return error;
    }
    password = hash;
    Config& config = state_->config;
    config.users.push_back(UserConfig{"admin", password, {"admin"}});
    config.sharedResources.push_back(SharedResourceConfig{std::string(kDefaultSharedResource),
                                                          state_->dataDir + "/shared", "Default",
                                                          "Shared files of this development server"});
    config.jobServices.push_back(JobServiceConfig{std::string(kDefaultJobService), {}});
    return {};
}

void Server::start()
{
    state_->jobs->start();
    acceptThread_ = std::thread([this] { acceptLoop(); });
}

void Server::acceptLoop()
{
    while (!state_->stopping) {
        pollfd fds[2] = {{listener_.get(), POLLIN, 0}, {wakeRead_.get(), POLLIN, 0}};
        int rc = ::poll(fds, 2, 1000);
        reapFinished();
        if (rc < 0 && errno != EINTR)
            break;
        if (rc <= 0 || !(fds[0].revents & POLLIN))
            continue;
        int fd = ::accept4(listener_.get(), nullptr, nullptr, SOCK_CLOEXEC);
        if (fd < 0)
            continue;
        std::lock_guard lock(connectionsMutex_);
        if (connections_.size() >= state_->config.maxConnections) {
            turnAway(fd);
            continue;
        }
        Connection& connection = connections_.emplace_back();
        connection.fd = fd;
        connection.thread = std::thread([this, &connection] {
            serveConnection(*state_, connection.fd);
            // The peer learns of the end at once; the descriptor itself is closed only after the
            // join, so stop() can never shut down a number that was reused meanwhile.
            ::shutdown(connection.fd, SHUT_RDWR);
            connection.finished = true;
        });
    }
}

// One thread per connection is the cost of a client; past the limit a client gets one error frame
// (into an empty socket buffer, so it never blocks) and the connection is closed.
void Server::turnAway(int fd)
{
    std::string message =
        "the server has " + std::to_string(state_->config.maxConnections) + " connections, its limit; try again later";
    std::string frame = encodeFrame(replyPayload(false, message));
    sendAll(fd, frame.data(), frame.size(), 0);
    ::close(fd);
    state_->log.command("-", "-", "CLOSED", 0, message);
}

void Server::reapFinished()
{
    std::lock_guard lock(connectionsMutex_);
    for (auto it = connections_.begin(); it != connections_.end();) {
        if (!it->finished) {
            ++it;
            continue;
        }
        it->thread.join();
        ::close(it->fd);
        it = connections_.erase(it);
    }
}

void Server::stop()
{
    if (stopped_)
        return;
    stopped_ = true;
    state_->stopping = true;
    if (wakeWrite_.valid()) {
        char byte = 1;
        (void)!::write(wakeWrite_.get(), &byte, 1);
    }
    if (acceptThread_.joinable())
        acceptThread_.join();
    listener_.reset();
    std::lock_guard lock(connectionsMutex_);
    // Shutting down only the receiving side wakes a connection waiting for its next command,
    // while a reply being written still goes out in full; a client that does not take it within
    // the grace period is cut off, so stopping never waits on a client.
    for (Connection& connection : connections_)
        ::shutdown(connection.fd, SHUT_RD);
    auto deadline = std::chrono::steady_clock::now() + kStopGrace;
    for (Connection& connection : connections_)
        while (!connection.finished && std::chrono::steady_clock::now() < deadline)
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
    for (Connection& connection : connections_)
        if (!connection.finished)
            ::shutdown(connection.fd, SHUT_RDWR);
    for (Connection& connection : connections_) {
        connection.thread.join();
        ::close(connection.fd);
    }
    connections_.clear();
    // Jobs end after the connections: a connection may be waiting for an abort to complete.
    if (state_->jobs)
        state_->jobs->stop();
}

}  // namespace zelserverd
