#pragma once
// The two sides of every ratio: the library through its public interface, and a raw client that
// writes the same bytes on its own socket with nothing in between. Every operation checks its
// outcome and throws std::runtime_error when it is wrong, so a fast wrong answer never counts.

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

namespace bench {

// One parsed list entry, what either side turns a "FILEINFO" element into.
struct ListEntry {
    bool directory = false;
    std::uint32_t size = 0;
    std::string date, name, directoryPath, absolutePath;
};

class RawClient {
public:
    // Connects to 127.0.0.1:`port` and signs in.
    explicit RawClient(unsigned short port);
    ~RawClient();
    RawClient(const RawClient&) = delete;
    RawClient& operator=(const RawClient&) = delete;

    void repositoryExists();
    void upload(const std::string& localPath);
    // Receives into a new file beside `target`, then renames it onto `target`.
    void download(const std::string& target);
    // Exchange, DOM parse and a walk into entries.
    std::size_t list(std::vector<ListEntry>& out);

private:
    std::string exchange(const std::string& requestText);

    int fd_ = -1;
};

class LibraryClient {
public:
    // A session signed in to 127.0.0.1:`port` as the benchmark user, or as `user`/`password`.
    explicit LibraryClient(unsigned short port, const char* user = nullptr, const char* password = nullptr);
    ~LibraryClient();
    LibraryClient(const LibraryClient&) = delete;
    LibraryClient& operator=(const LibraryClient&) = delete;

    IZELServerSession& session() { return *session_; }
    // Throws with the status's text when `status` is a failure; releases it.
    void check(IZELServerStatus* status, const char* what);
    // A library string holding `value`, owned by this client and made once per value.
    IZELServerString& text(const std::string& value);

    void repositoryExists();
    void upload(const std::string& localPath);
    void download(const std::string& target);
    std::size_t list();

private:
    IZELServerMountPoint& mountPoint();
    IZELServerPath& path(const char* absolutePath);

    IZELServerSession* session_ = nullptr;
    IZELServerConnectionInfo* info_ = nullptr;
    IZELServerMountPoint* mountPoint_ = nullptr;
    IZELServerVector<IZELServerFileInfo>* entries_ = nullptr;
    std::map<std::string, IZELServerString*> strings_;
    std::map<std::string, IZELServerPath*> paths_;
};

}  // namespace bench
