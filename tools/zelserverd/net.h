// Sockets and frame I/O. The server only ever speaks IPv4/IPv6 TCP on the addresses it is told.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace zelserverd {

// Owns one file descriptor; closes it when destroyed.
class UniqueFd {
public:
    UniqueFd() = default;
    explicit UniqueFd(int fd) : fd_(fd) {}
    UniqueFd(UniqueFd&& other) noexcept : fd_(other.release()) {}
    UniqueFd& operator=(UniqueFd&& other) noexcept;
    UniqueFd(const UniqueFd&) = delete;
    UniqueFd& operator=(const UniqueFd&) = delete;
    ~UniqueFd() { reset(); }

    int get() const { return fd_; }
    bool valid() const { return fd_ >= 0; }
    int release();
    void reset(int fd = -1);

private:
    int fd_ = -1;
};

// Binds and listens on host:port (port 0 picks a free one). On failure `error` says why.
UniqueFd listenOn(const std::string& host, std::uint16_t port, std::string& error);
std::uint16_t boundPort(int fd);
std::string peerAddress(int fd);
// Connects to host:port, giving up after timeoutMs.
UniqueFd connectTo(const std::string& host, std::uint16_t port, int timeoutMs, std::string& error);
// "host:port" or "[v6]:port"; false when malformed.
bool splitHostPort(std::string_view text, std::string& host, std::uint16_t& port);

// Send or receive exactly `size` bytes. `stallMs` bounds each wait for the peer to make room or
// send more (-1: no bound); false when it passes, the peer is gone or the socket was shut down.
bool sendAll(int fd, const void* data, std::size_t size, int stallMs);
bool recvExact(int fd, void* data, std::size_t size, int stallMs);

enum class FrameStatus { Ok, Closed, TooLarge };

// How long a connection may keep the server waiting, in milliseconds (-1: no bound).
struct Patience {
    int idleMs = -1;   // for the first byte of the next command
    int stallMs = -1;  // for each further piece of a frame or transfer, and for room to send
};

// Frame reading and writing on one connected socket. Writes go out as one send per frame:
// a prefix sent apart from its payload meets Nagle's algorithm and the peer's delayed
// acknowledgement, which costs tens of milliseconds per exchange on loopback.
class FrameIo {
public:
    FrameIo(int fd, std::uint32_t maxFrame, Patience patience = {}) : fd_(fd), maxFrame_(maxFrame), patience_(patience)
    {}
    // The payload grows as its bytes arrive: a length prefix alone commits no memory.
    FrameStatus readFrame(std::string& payload);
    // Length of the last frame refused as too large.
    std::uint32_t refusedLength() const { return refusedLength_; }
    bool writeFrame(std::string_view payload);
    bool writeRaw(const void* data, std::size_t size) { return sendAll(fd_, data, size, patience_.stallMs); }
    bool readRaw(void* data, std::size_t size) { return recvExact(fd_, data, size, patience_.stallMs); }
    int fd() const { return fd_; }

private:
    int fd_;
    std::uint32_t maxFrame_;
    Patience patience_;
    std::uint32_t refusedLength_ = 0;
};

}  // namespace zelserverd
