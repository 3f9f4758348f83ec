#pragma once
// The benchmark's own server: a child process on 127.0.0.1 that answers every exchange of the
// benchmark with canned frames, the same for the library and the raw client. It refuses any request
// that is not byte for byte the expected one, checks the CRC of every upload and sends downloads of
// known content, so every figure is also a correctness check.

#include <cstdint>
#include <sys/types.h>

namespace bench {

struct CannedServerConfig {
    std::uint64_t downloadBytes = 0;
    unsigned listEntries = 0;
};

class CannedServer {
public:
    // Forks the server; it serves until this object is destroyed (or this process dies).
    explicit CannedServer(const CannedServerConfig& config);
    ~CannedServer();
    CannedServer(const CannedServer&) = delete;
    CannedServer& operator=(const CannedServer&) = delete;

    unsigned short port() const { return port_; }

private:
    pid_t child_ = -1;
    unsigned short port_ = 0;
};

}  // namespace bench
