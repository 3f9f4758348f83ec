#pragma once
// The test programs' own IPv4 sockets, the same on BSD sockets and Winsock: the fake server, the
// closed ports and the plain clients of the tests are written against this and nothing else. It uses
// nothing from the library, so that the tests' end of every connection stays independent of the code
// under test.
//
// Addresses and ports are in host order (kLoopback is 127.0.0.1). Calls behave as the native ones do:
// blocking unless setNonBlocking was asked for, failures reported by the result, with the reason in
// lastSocketError(). On Windows the first socket opened here starts Winsock for the rest of the
// process; the library's own start-up counting is a separate matter.

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace zeltest {

#if defined(_WIN32)
using SocketHandle = std::uintptr_t;  // SOCKET
#else
using SocketHandle = int;
#endif

// INVALID_SOCKET on Winsock, -1 on BSD sockets.
inline constexpr SocketHandle kNoSocket = static_cast<SocketHandle>(~SocketHandle{0});
inline constexpr std::uint32_t kLoopback = 0x7F000001u;

// Owns one socket and closes it (no shutdown first: a close with unread bytes resets the connection,
// as tests of abrupt peers want).
class Socket {
public:
    Socket() = default;
    explicit Socket(SocketHandle handle) : handle(handle) {}
    ~Socket() { reset(); }
    Socket(Socket&& other) noexcept;
    Socket& operator=(Socket&& other) noexcept;
    Socket(const Socket&) = delete;
    Socket& operator=(const Socket&) = delete;

    SocketHandle get() const { return handle; }
    bool valid() const { return handle != kNoSocket; }
    SocketHandle release();
    void reset(SocketHandle replacement = kNoSocket);

private:
    SocketHandle handle = kNoSocket;
};

// ---- Errors -----------------------------------------------------------------------------------------

// The error number of the last failed socket call on this thread: errno, or WSAGetLastError().
int lastSocketError();
// The system's text for such a number, followed by the number itself.
std::string socketErrorText(int error);
bool isWouldBlock(int error);
bool isInterrupted(int error);
// What a non-blocking connect answers when it goes on in the background.
bool isConnectInProgress(int error);
bool isConnectionReset(int error);
bool isConnectionAborted(int error);

// ---- Sockets ----------------------------------------------------------------------------------------

// Starts Winsock once for the test process (nothing on POSIX); openTcpSocket calls it.
void startSockets();
// Whether startSockets has started Winsock in this process; always false on POSIX.
bool socketsStarted();

// A blocking IPv4 stream socket; invalid on failure.
Socket openTcpSocket();
bool setNonBlocking(const Socket& socket, bool enabled);
// Bounds every blocking receive; one that runs out fails with a would-block or time-out error.
bool setReceiveTimeout(const Socket& socket, std::chrono::milliseconds timeout);
// Keeps the port from being shared by a later socket that asks for address reuse. Winsock lets such a
// socket bind over an existing one unless the first refused it; BSD sockets never do, so there this
// does nothing.
bool setExclusiveAddress(const Socket& socket);
bool bindTo(const Socket& socket, std::uint32_t address, std::uint16_t port);
std::optional<std::uint16_t> localPort(const Socket& socket);
bool listenOn(const Socket& socket, int backlog);
// The next peer; invalid on failure (or, non-blocking, when none is waiting).
Socket acceptFrom(const Socket& listener);
// One native connect. A non-blocking socket usually fails with isConnectInProgress(); wait until it is
// writable, then pendingError() tells how the connect ended.
bool connectTo(const Socket& socket, std::uint32_t address, std::uint16_t port);
// SO_ERROR, which reading clears; nullopt when it cannot be read.
std::optional<int> pendingError(const Socket& socket);

// One native send (never raising SIGPIPE) or recv; the count, 0 for a closed peer (recv), negative on
// error.
long sendSome(const Socket& socket, const char* data, std::size_t count);
long receiveSome(const Socket& socket, char* data, std::size_t count);

// Waits until a receive (or accept) or a send (or the end of a connect) would not block, or the
// socket has an error to report, which counts as ready: the next call reports it. False when the
// time-out passed first. A zero time-out only looks.
bool waitReadable(const Socket& socket, std::chrono::milliseconds timeout);
bool waitWritable(const Socket& socket, std::chrono::milliseconds timeout);

// Four decimal numbers 0..255 separated by dots, nothing else; the address in host order.
std::optional<std::uint32_t> parseDottedAddress(std::string_view text);

// ---- Shorthands for tests ---------------------------------------------------------------------------

// Bound to 127.0.0.1 at a port the system chooses, and listening; invalid on failure.
Socket listenOnLoopback(int backlog);
// Blocking, connected to 127.0.0.1:port; invalid when the connect failed.
Socket connectToLoopback(std::uint16_t port);
// Sends every byte on a blocking socket; false on the first failed send.
bool sendAll(const Socket& socket, std::string_view bytes);

}  // namespace zeltest
