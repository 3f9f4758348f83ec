#include "support/sockets.h"

#include <algorithm>
#include <climits>
#include <stdexcept>

#if defined(_WIN32)
#include <winsock2.h>
#include <windows.h>

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
#endif

namespace zeltest {

namespace {

#if defined(_WIN32)
using Native = SOCKET;
using Length = int;
#else
using Native = int;
using Length = socklen_t;
#endif

Native native(const Socket& socket) { return static_cast<Native>(socket.get()); }

sockaddr_in endpoint(std::uint32_t address, std::uint16_t port)
{
    sockaddr_in result{};
    result.sin_family = AF_INET;
    result.sin_port = htons(port);
    result.sin_addr.s_addr = htonl(address);
    return result;
}

int clampedCount(std::size_t count) { return static_cast<int>(std::min<std::size_t>(count, INT_MAX)); }

}  // namespace

void Socket::reset(SocketHandle replacement)
{
    if (handle != kNoSocket && handle != replacement) {
#if defined(_WIN32)
        ::closesocket(static_cast<SOCKET>(handle));
#else
        ::close(handle);
#endif
    }
    handle = replacement;
}

#if defined(_WIN32)

// Never cleaned up: sockets of the fake servers may still be closing when the process ends, and the
// library's own start-ups and clean-ups must not be able to take Winsock away from them.
Socket openTcpSocket()
{
    static std::once_flag once;
    std::call_once(once, [] {
        WSADATA data;
        ::WSAStartup(MAKEWORD(2, 2), &data);
    });
    return Socket(static_cast<SocketHandle>(::socket(AF_INET, SOCK_STREAM, 0)));
}

bool setNonBlocking(const Socket& socket, bool enabled)
{
    u_long mode = enabled ? 1 : 0;
    return ::ioctlsocket(native(socket), FIONBIO, &mode) == 0;
}

bool setSendTimeout(const Socket& socket, std::chrono::milliseconds timeout)
{
    const DWORD limit = static_cast<DWORD>(timeout.count());
    return ::setsockopt(native(socket), SOL_SOCKET, SO_SNDTIMEO, reinterpret_cast<const char*>(&limit), sizeof limit) ==
           0;
}

// select rather than WSAPoll, which some Windows releases get wrong.
bool waitReadable(const Socket& socket, std::chrono::milliseconds timeout)
{
    fd_set ready;
    FD_ZERO(&ready);
    FD_SET(native(socket), &ready);
    const long ms = static_cast<long>(timeout.count());
    timeval limit{ms / 1000, (ms % 1000) * 1000};
    return ::select(0, &ready, nullptr, nullptr, &limit) != 0;
}

#else

Socket openTcpSocket() { return Socket(::socket(AF_INET, SOCK_STREAM, 0)); }

bool setNonBlocking(const Socket& socket, bool enabled)
{
    const int flags = ::fcntl(native(socket), F_GETFL);
    return flags >= 0 && ::fcntl(native(socket), F_SETFL, enabled ? flags | O_NONBLOCK : flags & ~O_NONBLOCK) == 0;
}

bool setSendTimeout(const Socket& socket, std::chrono::milliseconds timeout)
{
    const timeval limit{static_cast<time_t>(timeout.count() / 1000),
                        static_cast<suseconds_t>(timeout.count() % 1000 * 1000)};
    return ::setsockopt(native(socket), SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof limit) == 0;
}

bool waitReadable(const Socket& socket, std::chrono::milliseconds timeout)
{
    pollfd entry{native(socket), POLLIN, 0};
    int result = 0;
    do {
        result = ::poll(&entry, 1, static_cast<int>(timeout.count()));
    } while (result < 0 && errno == EINTR);
    return result != 0;
}

#endif

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

long sendSome(const Socket& socket, const char* data, std::size_t count)
{
#if defined(_WIN32)
    return ::send(native(socket), data, clampedCount(count), 0);
#else
    return ::send(native(socket), data, static_cast<std::size_t>(clampedCount(count)), MSG_NOSIGNAL);
#endif
}

long receiveSome(const Socket& socket, char* data, std::size_t count)
{
    return ::recv(native(socket), data, clampedCount(count), 0);
}

std::optional<std::uint32_t> parseDottedAddress(const std::string& text)
{
    const unsigned long address = ::inet_addr(text.c_str());
    if (address == INADDR_NONE && text != "255.255.255.255") {
        return std::nullopt;
    }
    return ntohl(static_cast<std::uint32_t>(address));
}

Socket boundOnLoopback()
{
    Socket socket = openTcpSocket();
#if defined(_WIN32)
    // Winsock lets a later socket that asks for address reuse bind over this one unless it refuses.
    const BOOL exclusive = TRUE;
    ::setsockopt(native(socket), SOL_SOCKET, SO_EXCLUSIVEADDRUSE, reinterpret_cast<const char*>(&exclusive),
                 sizeof exclusive);
#endif
    return bindTo(socket, kLoopback, 0) ? std::move(socket) : Socket();
}

Socket listenOnLoopback(int backlog)
{
    Socket listener = boundOnLoopback();
    return ::listen(native(listener), backlog) == 0 ? std::move(listener) : Socket();
}

namespace {

std::uint16_t portOf(const Socket& socket)
{
    const std::optional<std::uint16_t> port = socket.valid() ? localPort(socket) : std::nullopt;
    if (!port) {
        throw std::runtime_error("cannot bind a loopback port");
    }
    return *port;
}

}  // namespace

ClosedPort::ClosedPort() : socket(boundOnLoopback()), number(portOf(socket)) {}

std::uint16_t releasedPort() { return portOf(boundOnLoopback()); }

}  // namespace zeltest
