#include "zelserverd_figures.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <thread>

#include "clients.h"

namespace bench {
namespace {

constexpr const char* kAdmin = "admin";
constexpr const char* kNoOpWorkspace = "#!/bin/sh\n# @title No-op\n# @description Ends at once.\nexit 0\n";
constexpr const char* kRepositoryName = "bench";
constexpr const char* kSharedResource = "DEFAULT";  // the one zelserverd makes without a configuration
constexpr std::size_t kSmallFileBytes = 64 * 1024;

// zelserverd on a free loopback port with a fresh data directory; stopped and removed on destruction.
class Zelserverd {
public:
    Zelserverd(const std::string& program, const std::string& workDir) : data_(workDir + "/zelserverd-data")
    {
        std::filesystem::remove_all(data_);
        int out[2];
        if (::pipe(out) != 0) {
            throw std::runtime_error("pipe failed");
        }
        std::fflush(nullptr);
        child_ = ::fork();
        if (child_ == 0) {
            ::dup2(out[1], STDOUT_FILENO);
            ::close(out[0]);
            // Its start-up note (the generated password) would only clutter the table.
            const int quiet = ::open("/dev/null", O_WRONLY);
            ::dup2(quiet, STDERR_FILENO);
            ::execl(program.c_str(), program.c_str(), "--data", data_.c_str(), "--listen", "127.0.0.1:0", "--quiet",
                    static_cast<char*>(nullptr));
            std::_Exit(127);
        }
        ::close(out[1]);
        std::string line;
        char c = 0;
        while (::read(out[0], &c, 1) == 1 && c != '\n') {
            line += c;
        }
        ::close(out[0]);
        const std::size_t colon = line.rfind(':');
        if (child_ < 0 || line.rfind("listening on ", 0) != 0 || colon == std::string::npos) {
            throw std::runtime_error("zelserverd did not start (" + program + ")");
        }
        port_ = static_cast<unsigned short>(std::stoi(line.substr(colon + 1)));
        std::ifstream(data_ + "/admin-password") >> password_;
    }

    ~Zelserverd()
    {
        if (child_ > 0) {
            ::kill(child_, SIGTERM);
            ::waitpid(child_, nullptr, 0);
        }
        std::error_code ignored;
        std::filesystem::remove_all(data_, ignored);
    }

    Zelserverd(const Zelserverd&) = delete;
    Zelserverd& operator=(const Zelserverd&) = delete;

    std::unique_ptr<LibraryClient> signIn() const
    {
        return std::make_unique<LibraryClient>(port_, kAdmin, password_.c_str());
    }
    const std::string& dataDir() const { return data_; }

private:
    std::string data_;
    pid_t child_ = -1;
    unsigned short port_ = 0;
    std::string password_;
};

// The repository "bench" holding the no-op workspace.
void publishNoOp(LibraryClient& client, const std::string& workDir)
{
    const std::string local = workDir + "/noop.zlw";
    std::ofstream(local) << kNoOpWorkspace;
    IZELServerSession& session = client.session();
    client.check(session.getRepositoryManager()->addRepository(client.text(kRepositoryName), client.text("bench")),
                 "addRepository");
    IZELServerRepository* repository = session.createRepository();
    unsigned found = 0;
    client.check(session.getRepositoryManager()->getRepository(client.text(kRepositoryName), *repository, found),
                 "getRepository");
    IZELServerStatus* added = repository->addItem(client.text("noop.zlw"), client.text(local));
    session.destroyRepository(&repository);
    client.check(added, "addItem");
}

double noOpJobSeconds(LibraryClient& client)
{
    IZELServerSession& session = client.session();
    IZELServerStringArray* directives = session.createStringArray();
    IZELServerString* result = session.createString();
    IZELServerStatus* status = nullptr;
    const double seconds = secondsOf([&] {
        status = session.getTransformationManager()->transactJobString(
            client.text("zeljob"), client.text("bench/noop/noop.zlw"), *directives, *result);
    });
    std::string text(result->c_str(), result->length());
    std::replace(text.begin(), text.end(), '\0', ' ');
    session.destroyString(&result);
    session.destroyStringArray(&directives);
    client.check(status, "transactJobString");
    if (text.find("jobStatus=SUCCESS") == std::string::npos) {
        throw std::runtime_error("the no-op job did not succeed: " + text);
    }
    return seconds;
}

// Seconds per acknowledged upload of a small file into the default shared resource.
std::vector<double> smallUploadSeconds(LibraryClient& client, const std::string& workDir, unsigned count)
{
    const std::string local = workDir + "/small.dat";
    std::ofstream(local, std::ios::binary) << std::string(kSmallFileBytes, 'z');
    IZELServerSession& session = client.session();
    IZELServerMountPoint* mountPoint = session.createMountPoint();
    unsigned found = 0;
    IZELServerStatus* status =
        session.getMountPointManager()->getSharedResource(client.text(kSharedResource), *mountPoint, found);
    IZELServerPath* path = found != 0 ? mountPoint->createPath(client.text("/small.dat")) : nullptr;
    std::vector<double> samples;
    for (unsigned i = 0; status == nullptr && path != nullptr && i < count; ++i) {
        samples.push_back(secondsOf([&] { status = mountPoint->upload(client.text(local), *path, nullptr); }));
    }
    if (path != nullptr) {
        mountPoint->releaseObject(path);
    }
    session.destroyMountPoint(&mountPoint);
    client.check(status, "upload");
    if (samples.size() != count) {
        throw std::runtime_error("zelserverd has no shared resource " + std::string(kSharedResource));
    }
    return samples;
}

// A small file written beside `dir`'s other files and renamed into place, as an upload ends, with or
// without the flushes of the file and of its directory that make it survive a power loss.
void writeAndRename(const std::string& dir, bool flushed)
{
    const std::string temporary = dir + "/.bench-flush", target = dir + "/bench-flush.dat";
    const std::string content(kSmallFileBytes, 'z');
    const int fd = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    bool good = fd >= 0 && ::write(fd, content.data(), content.size()) == static_cast<ssize_t>(content.size()) &&
                (!flushed || ::fsync(fd) == 0);
    good = fd >= 0 && ::close(fd) == 0 && good && ::rename(temporary.c_str(), target.c_str()) == 0;
    if (good && flushed) {
        const int dirFd = ::open(dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        good = dirFd >= 0 && ::fsync(dirFd) == 0;
        good = dirFd >= 0 && ::close(dirFd) == 0 && good;
    }
    if (!good) {
        throw std::runtime_error("cannot write and rename a file in " + dir);
    }
}

void measureDurability(LibraryClient& client, const Zelserverd& server, const ServerFigureOptions& options,
                       std::vector<Row>& rows)
{
    std::vector<double> uploads = smallUploadSeconds(client, options.workDir, options.uploads);
    std::sort(uploads.begin(), uploads.end());
    const double uploadMs = median(uploads) * 1e3;
    rows.push_back({"zelserverd: 64 KiB upload, acknowledged once file and directory are on disk (median of " +
                        std::to_string(uploads.size()) + ")",
                    fixed(uploadMs, 2) + " ms", "", "", "", ""});
    // The same file system as the uploads: flushing is what the acknowledgement waits for.
    const Samples s = interleave(
        options.uploads, [&] { writeAndRename(server.dataDir(), true); },
        [&] { writeAndRename(server.dataDir(), false); });
    const double flushedMs = median(s.library) * 1e3, plainMs = median(s.raw) * 1e3;
    rows.push_back({"flush cost on its file system: 64 KiB write + rename with fsync of file and directory, "
                    "against without",
                    fixed(flushedMs, 2) + " ms", fixed(plainMs, 2) + " ms", fixed(flushedMs / plainMs, 1), "", ""});
}

// Commands per second of `sessions` sessions, each on its own thread, asking repositoryExists.
double throughput(const Zelserverd& server, unsigned sessions, double seconds)
{
    std::vector<std::unique_ptr<LibraryClient>> clients;
    for (unsigned i = 0; i < sessions; ++i) {
        clients.push_back(server.signIn());
    }
    std::atomic<bool> stop{false};
    std::atomic<unsigned long> done{0};
    std::atomic<bool> failed{false};
    std::vector<std::thread> threads;
    const auto start = std::chrono::steady_clock::now();
    for (auto& client : clients) {
        threads.emplace_back([&, c = client.get()] {
            try {
                while (!stop.load()) {
                    c->repositoryExists();
                    ++done;
                }
            } catch (const std::exception&) {
                failed = true;
            }
        });
    }
    std::this_thread::sleep_for(std::chrono::duration<double>(seconds));
    stop = true;
    for (std::thread& thread : threads) {
        thread.join();
    }
    const double elapsed = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    if (failed) {
        throw std::runtime_error("a throughput session failed");
    }
    return static_cast<double>(done.load()) / elapsed;
}

}  // namespace

void measureZelserverd(const ServerFigureOptions& options, std::vector<Row>& rows)
{
    const Zelserverd server(options.zelserverd, options.workDir);
    const std::unique_ptr<LibraryClient> client = server.signIn();
    publishNoOp(*client, options.workDir);
    std::vector<double> samples;
    for (unsigned i = 0; i < options.jobs; ++i) {
        samples.push_back(noOpJobSeconds(*client));
    }
    std::sort(samples.begin(), samples.end());
    const double ms = median(samples) * 1e3;
    rows.push_back(
        {"zelserverd: no-op job, submit to result (median of " + std::to_string(samples.size()) + ")",
         fixed(ms, 2) + " ms (min " + fixed(samples.front() * 1e3, 2) + ", max " + fixed(samples.back() * 1e3, 2) + ")",
         "", "", "<= 5 ms", metText(ms <= 5.0)});
    measureDurability(*client, server, options, rows);
    for (const unsigned sessions : {1u, 2u, 4u}) {
        const double rate = throughput(server, sessions, options.seconds);
        rows.push_back({"zelserverd: repositoryExists throughput, " + std::to_string(sessions) + " session(s)",
                        fixed(rate, 0) + " commands/s", "", "", "", ""});
    }
}

}  // namespace bench
