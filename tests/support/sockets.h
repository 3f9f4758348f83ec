#pragma once
// The test programs' own IPv4 sockets, the same on BSD sockets and Winsock. They use nothing from the
// library, so the tests' end of every connection stays independent of the code under test. Addresses
// and ports are in host order; calls block unless setNonBlocking was asked for, and report failure by
// their result.

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace zeltest {

#if defined(_WIN32)
using SocketHandle = std::uintptr_t;  // SOCKET
#else
using SocketHandle = int;
#endif

inline constexpr SocketHandle kNoSocket = static_cast<SocketHandle>(~SocketHandle{0});
inline constexpr std::uint32_t kLoopback = 0x7F000001u;

// Owns one socket and closes it without a shutdown first: a close with unread bytes resets the
// connection, as tests of abrupt peers want.
class Socket {
public:
    Socket() = default;
    explicit Socket(SocketHandle handle) : handle(handle) {}
    Socket(Socket&& other) noexcept : handle(std::exchange(other.handle, kNoSocket)) {}
    Socket& operator=(Socket&& other) noexcept
    {
        reset(std::exchange(other.handle, kNoSocket));
        return *this;
    }
    ~Socket() { reset(); }

    SocketHandle get() const { return handle; }
    bool valid() const { return handle != kNoSocket; }
    void reset(SocketHandle replacement = kNoSocket);

private:
    SocketHandle handle = kNoSocket;
};

// A blocking IPv4 stream socket; invalid on failure.
Socket openTcpSocket();
bool setNonBlocking(const Socket& socket, bool enabled);
// Bounds every blocking send.
bool setSendTimeout(const Socket& socket, std::chrono::milliseconds timeout);
bool bindTo(const Socket& socket, std::uint32_t address, std::uint16_t port);
std::optional<std::uint16_t> localPort(const Socket& socket);
Socket acceptFrom(const Socket& listener);
bool connectTo(const Socket& socket, std::uint32_t address, std::uint16_t port);
// One native send (never raising SIGPIPE) or recv: the count, 0 for a closed peer, negative on error.
long sendSome(const Socket& socket, const char* data, std::size_t count);
long receiveSome(const Socket& socket, char* data, std::size_t count);
// Until a receive or accept would not block (an error counts as ready); false when the time ran out.
bool waitReadable(const Socket& socket, std::chrono::milliseconds timeout);
// Four decimal numbers 0..255 separated by dots; the address in host order.
std::optional<std::uint32_t> parseDottedAddress(const std::string& text);

// Bound to 127.0.0.1 at a port the system chooses, which no other socket can share; invalid on failure.
Socket boundOnLoopback();
// The same, listening.
Socket listenOnLoopback(int backlog);

// A loopback port that refuses connections for as long as this object lives: it is bound but never
// listened on, so no other socket (in this process or a test running beside it) can take it over,
// as could happen with a port that was merely found free and released.
class ClosedPort {
public:
    // Throws std::runtime_error when no port can be bound.
    ClosedPort();
    std::uint16_t port() const { return number; }

private:
    Socket socket;
    std::uint16_t number = 0;
};

// A loopback port that nothing listens on right now: bound by the system, then released. Another
// socket may take it before the caller uses it, so callers retry with a fresh one when that matters.
// Throws std::runtime_error when no port can be bound.
std::uint16_t releasedPort();

}  // namespace zeltest
