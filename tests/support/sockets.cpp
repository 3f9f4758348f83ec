#include "support/sockets.h"

#include <algorithm>
#include <cctype>
#include <climits>
#include <utility>

#if defined(_WIN32)
#include <winsock2.h>
#include <windows.h>

#include <atomic>
#include <mutex>
#else
#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#endif

namespace zeltest {

namespace {

using Clock = std::chrono::steady_clock;

#if defined(_WIN32)
using Native = SOCKET;
using Length = int;
#else
using Native = int;
using Length = socklen_t;
#endif

Native native(const Socket& socket) { return static_cast<Native>(socket.get()); }

void closeHandle(SocketHandle handle)
{
#if defined(_WIN32)
    ::closesocket(static_cast<SOCKET>(handle));
#else
    ::close(handle);
#endif
}

// Closing a socket may overwrite the error number of the call that made the caller give up.
void restoreSocketError(int error)
{
#if defined(_WIN32)
    ::WSASetLastError(error);
#else
    errno = error;
#endif
}

Socket giveUp(Socket& socket)
{
    const int error = lastSocketError();
    socket.reset();
    restoreSocketError(error);
    return Socket();
}

sockaddr_in endpoint(std::uint32_t address, std::uint16_t port)
{
    sockaddr_in result{};
    result.sin_family = AF_INET;
    result.sin_port = htons(port);
    result.sin_addr.s_addr = htonl(address);
    return result;
}

int leftOf(Clock::time_point deadline)
{
    const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now()).count();
    return static_cast<int>(std::clamp<long long>(left, 0, INT_MAX));
}

#if defined(_WIN32)
// select rather than WSAPoll: some Windows releases never report a refused connect through WSAPoll,
// while select puts it in the exception set.
bool waitReady(const Socket& socket, bool forWriting, std::chrono::milliseconds timeout)
{
    const Clock::time_point deadline = Clock::now() + timeout;
    for (;;) {
        const int left = leftOf(deadline);
        fd_set ready;
        fd_set failed;
        FD_ZERO(&ready);
        FD_ZERO(&failed);
        FD_SET(native(socket), &ready);
        FD_SET(native(socket), &failed);
        timeval limit{left / 1000, (left % 1000) * 1000};
        const int result = ::select(0, forWriting ? nullptr : &ready, forWriting ? &ready : nullptr, &failed, &limit);
        if (result != SOCKET_ERROR) {
            return result > 0;
        }
        if (!isInterrupted(lastSocketError())) {
            return true;
        }
    }
}
#else
bool waitReady(const Socket& socket, bool forWriting, std::chrono::milliseconds timeout)
{
    const Clock::time_point deadline = Clock::now() + timeout;
    for (;;) {
        pollfd entry{native(socket), static_cast<short>(forWriting ? POLLOUT : POLLIN), 0};
        const int result = ::poll(&entry, 1, leftOf(deadline));
        if (result >= 0) {
            return result > 0;
        }
        if (!isInterrupted(lastSocketError())) {
            return true;
        }
    }
}
#endif

}  // namespace

// ---- Socket -----------------------------------------------------------------------------------------

Socket::Socket(Socket&& other) noexcept : handle(std::exchange(other.handle, kNoSocket)) {}

Socket& Socket::operator=(Socket&& other) noexcept
{
    if (this != &other) {
        reset(std::exchange(other.handle, kNoSocket));
    }
    return *this;
}

SocketHandle Socket::release() { return std::exchange(handle, kNoSocket); }

void Socket::reset(SocketHandle replacement)
{
    if (handle != kNoSocket) {
        closeHandle(handle);
    }
    handle = replacement;
}

// ---- Errors -----------------------------------------------------------------------------------------

#if defined(_WIN32)

int lastSocketError() { return ::WSAGetLastError(); }

std::string socketErrorText(int error)
{
    char text[512] = {};
    const DWORD length = ::FormatMessageA(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS, nullptr,
                                          static_cast<DWORD>(error), 0, text, sizeof text, nullptr);
    std::string message(text, length);
    while (!message.empty() && std::isspace(static_cast<unsigned char>(message.back()))) {
        message.pop_back();
    }
    if (message.empty()) {
        message = "Winsock error";
    }
    return message + " (" + std::to_string(error) + ")";
}

bool isWouldBlock(int error) { return error == WSAEWOULDBLOCK; }
bool isInterrupted(int error) { return error == WSAEINTR; }
bool isConnectInProgress(int error) { return error == WSAEWOULDBLOCK || error == WSAEINPROGRESS; }
bool isConnectionReset(int error) { return error == WSAECONNRESET; }
bool isConnectionAborted(int error) { return error == WSAECONNABORTED; }

#else

int lastSocketError() { return errno; }

std::string socketErrorText(int error)
{
    return std::string(std::strerror(error)) + " (" + std::to_string(error) + ")";
}

bool isWouldBlock(int error) { return error == EAGAIN || error == EWOULDBLOCK; }
bool isInterrupted(int error) { return error == EINTR; }
bool isConnectInProgress(int error) { return error == EINPROGRESS; }
bool isConnectionReset(int error) { return error == ECONNRESET; }
bool isConnectionAborted(int error) { return error == ECONNABORTED; }

#endif

// ---- Sockets ----------------------------------------------------------------------------------------

#if defined(_WIN32)

namespace {
std::once_flag startOnce;
std::atomic<bool> started{false};
}  // namespace

// Never cleaned up: sockets of the fake servers may still be closing when the process ends, and the
// library's own start-ups and clean-ups must not be able to take Winsock away from them.
void startSockets()
{
    std::call_once(startOnce, [] {
        WSADATA data;
        started = ::WSAStartup(MAKEWORD(2, 2), &data) == 0;
    });
}

bool socketsStarted() { return started.load(); }

#else

void startSockets() {}

bool socketsStarted() { return false; }

#endif

Socket openTcpSocket()
{
    startSockets();
    return Socket(static_cast<SocketHandle>(::socket(AF_INET, SOCK_STREAM, 0)));
}

bool setNonBlocking(const Socket& socket, bool enabled)
{
#if defined(_WIN32)
    u_long mode = enabled ? 1 : 0;
    return ::ioctlsocket(native(socket), FIONBIO, &mode) == 0;
#else
    const int flags = ::fcntl(native(socket), F_GETFL);
    if (flags < 0) {
        return false;
    }
    return ::fcntl(native(socket), F_SETFL, enabled ? flags | O_NONBLOCK : flags & ~O_NONBLOCK) == 0;
#endif
}

bool setReceiveTimeout(const Socket& socket, std::chrono::milliseconds timeout)
{
#if defined(_WIN32)
    const DWORD limit = static_cast<DWORD>(timeout.count());
#else
    const timeval limit{static_cast<time_t>(timeout.count() / 1000),
                        static_cast<suseconds_t>(timeout.count() % 1000 * 1000)};
#endif
    return ::setsockopt(native(socket), SOL_SOCKET, SO_RCVTIMEO, reinterpret_cast<const char*>(&limit),
                        static_cast<Length>(sizeof limit)) == 0;
}

bool setExclusiveAddress(const Socket& socket)
{
#if defined(_WIN32)
    const BOOL enabled = TRUE;
    return ::setsockopt(native(socket), SOL_SOCKET, SO_EXCLUSIVEADDRUSE, reinterpret_cast<const char*>(&enabled),
                        sizeof enabled) == 0;
#else
    return socket.valid();
#endif
}

bool bindTo(const Socket& socket, std::uint32_t address, std::uint16_t port)
{
    const sockaddr_in local = endpoint(address, port);
    return ::bind(native(socket), reinterpret_cast<const sockaddr*>(&local), static_cast<Length>(sizeof local)) == 0;
}

std::optional<std::uint16_t> localPort(const Socket& socket)
{
    sockaddr_in local{};
    Length length = sizeof local;
    if (::getsockname(native(socket), reinterpret_cast<sockaddr*>(&local), &length) != 0) {
        return std::nullopt;
    }
    return ntohs(local.sin_port);
}

bool listenOn(const Socket& socket, int backlog) { return ::listen(native(socket), backlog) == 0; }

Socket acceptFrom(const Socket& listener)
{
    return Socket(static_cast<SocketHandle>(::accept(native(listener), nullptr, nullptr)));
}

bool connectTo(const Socket& socket, std::uint32_t address, std::uint16_t port)
{
    const sockaddr_in remote = endpoint(address, port);
    return ::connect(native(socket), reinterpret_cast<const sockaddr*>(&remote), static_cast<Length>(sizeof remote)) ==
           0;
}

std::optional<int> pendingError(const Socket& socket)
{
    int error = 0;
    Length length = sizeof error;
    if (::getsockopt(native(socket), SOL_SOCKET, SO_ERROR, reinterpret_cast<char*>(&error), &length) != 0) {
        return std::nullopt;
    }
    return error;
}

long sendSome(const Socket& socket, const char* data, std::size_t count)
{
#if defined(_WIN32)
    return ::send(native(socket), data, static_cast<int>(std::min<std::size_t>(count, INT_MAX)), 0);
#else
    return ::send(native(socket), data, count, MSG_NOSIGNAL);
#endif
}

long receiveSome(const Socket& socket, char* data, std::size_t count)
{
#if defined(_WIN32)
    return ::recv(native(socket), data, static_cast<int>(std::min<std::size_t>(count, INT_MAX)), 0);
#else
    return ::recv(native(socket), data, count, 0);
#endif
}

bool waitReadable(const Socket& socket, std::chrono::milliseconds timeout) { return waitReady(socket, false, timeout); }

bool waitWritable(const Socket& socket, std::chrono::milliseconds timeout) { return waitReady(socket, true, timeout); }

std::optional<std::uint32_t> parseDottedAddress(std::string_view text)
{
    std::uint32_t address = 0;
    std::size_t at = 0;
    for (int part = 0; part < 4; ++part) {
        if (part > 0) {
            if (at >= text.size() || text[at] != '.') {
                return std::nullopt;
            }
            ++at;
        }
        const std::size_t start = at;
        unsigned value = 0;
        while (at < text.size() && at - start < 3 && text[at] >= '0' && text[at] <= '9') {
            value = value * 10 + static_cast<unsigned>(text[at] - '0');
            ++at;
        }
        const std::size_t digits = at - start;
        // "01" is refused as the system's own parsers do: a leading zero once meant octal.
        if (digits == 0 || value > 255 || (digits > 1 && text[start] == '0')) {
            return std::nullopt;
        }
        address = (address << 8) | value;
    }
    if (at != text.size()) {
        return std::nullopt;
    }
    return address;
}

// ---- Shorthands -------------------------------------------------------------------------------------

Socket listenOnLoopback(int backlog)
{
    Socket listener = openTcpSocket();
    if (!listener.valid() || !setExclusiveAddress(listener) || !bindTo(listener, kLoopback, 0) ||
        !listenOn(listener, backlog)) {
        return giveUp(listener);
    }
    return listener;
}

Socket connectToLoopback(std::uint16_t port)
{
    Socket client = openTcpSocket();
    if (!client.valid() || !connectTo(client, kLoopback, port)) {
        return giveUp(client);
    }
    return client;
}

bool sendAll(const Socket& socket, std::string_view bytes)
{
    std::size_t done = 0;
    while (done < bytes.size()) {
        const long sent = sendSome(socket, bytes.data() + done, bytes.size() - done);
        if (sent <= 0) {
            if (sent < 0 && isInterrupted(lastSocketError())) {
                continue;
            }
            return false;
        }
        done += static_cast<std::size_t>(sent);
    }
    return true;
}

}  // namespace zeltest
