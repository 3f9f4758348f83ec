#ifndef WIN32_LEAN_AND_MEAN
#define WIN32_LEAN_AND_MEAN
#endif
#ifndef NOMINMAX
#define NOMINMAX
#endif

#include "platform/net.h"

#include <winsock2.h>
#include <windows.h>

#include <climits>
#include <cstring>

namespace zel::platform {

static_assert(sizeof(SocketHandle) == sizeof(SOCKET), "SocketHandle must hold a SOCKET");

namespace {

sockaddr_in ipv4Endpoint(Ipv4Address address, std::uint16_t port)
{
    sockaddr_in endpoint{};
    endpoint.sin_family = AF_INET;
    endpoint.sin_port = htons(port);
    endpoint.sin_addr.s_addr = address;
    return endpoint;
}

// Winsock takes int lengths; a larger request is cut down and then shows as a short count.
int clampLength(std::size_t count)
{
    return count > static_cast<std::size_t>(INT_MAX) ? INT_MAX : static_cast<int>(count);
}

}  // namespace

void socketLibraryStartup() noexcept
{
    WSADATA data;
    ::WSAStartup(0x0101, &data);
}

void socketLibraryCleanup() noexcept { ::WSACleanup(); }

SocketHandle createStreamSocket() noexcept { return static_cast<SocketHandle>(::socket(AF_INET, SOCK_STREAM, 0)); }

namespace {

timeval timevalOf(std::uint32_t timeoutMs)
{
    timeval limit{};
    limit.tv_sec = static_cast<long>(timeoutMs / 1000);
    limit.tv_usec = static_cast<long>((timeoutMs % 1000) * 1000);
    return limit;
}

// A non-blocking connect reports success in the write set and failure in the exception set.
WaitOutcome connectWithin(SOCKET socket, const sockaddr_in& endpoint, std::uint32_t timeoutMs) noexcept
{
    u_long nonBlocking = 1;
    if (::ioctlsocket(socket, FIONBIO, &nonBlocking) != 0) {
        return WaitOutcome::Failed;
    }
    WaitOutcome outcome = WaitOutcome::Ready;
    if (::connect(socket, reinterpret_cast<const sockaddr*>(&endpoint), static_cast<int>(sizeof endpoint)) != 0) {
        if (::WSAGetLastError() != WSAEWOULDBLOCK) {
            outcome = WaitOutcome::Failed;
        } else {
            fd_set writable;
            fd_set failed;
            FD_ZERO(&writable);
            FD_ZERO(&failed);
            FD_SET(socket, &writable);
            FD_SET(socket, &failed);
            timeval limit = timevalOf(timeoutMs);
            const int ready = ::select(0, nullptr, &writable, &failed, &limit);
            if (ready == 0) {
                outcome = WaitOutcome::TimedOut;
            } else if (ready < 0 || FD_ISSET(socket, &failed) || !FD_ISSET(socket, &writable)) {
                outcome = WaitOutcome::Failed;
            }
        }
    }
    u_long blocking = 0;
    if (::ioctlsocket(socket, FIONBIO, &blocking) != 0) {
        return WaitOutcome::Failed;
    }
    return outcome;
}

}  // namespace

WaitOutcome connectIPv4(SocketHandle socket, Ipv4Address address, std::uint16_t port, std::uint32_t timeoutMs) noexcept
{
    const sockaddr_in endpoint = ipv4Endpoint(address, port);
    if (timeoutMs != 0) {
        return connectWithin(static_cast<SOCKET>(socket), endpoint, timeoutMs);
    }
    return ::connect(static_cast<SOCKET>(socket), reinterpret_cast<const sockaddr*>(&endpoint),
                     static_cast<int>(sizeof endpoint)) == 0
               ? WaitOutcome::Ready
               : WaitOutcome::Failed;
}

WaitOutcome waitReadable(SocketHandle socket, std::uint32_t timeoutMs) noexcept
{
    fd_set readable;
    FD_ZERO(&readable);
    FD_SET(static_cast<SOCKET>(socket), &readable);
    timeval limit = timevalOf(timeoutMs);
    const int ready = ::select(0, &readable, nullptr, nullptr, timeoutMs != 0 ? &limit : nullptr);
    if (ready > 0) {
        return WaitOutcome::Ready;
    }
    return ready == 0 ? WaitOutcome::TimedOut : WaitOutcome::Failed;
}

// Winsock takes these two options as a DWORD of milliseconds.
bool setIoTimeout(SocketHandle socket, std::uint32_t timeoutMs) noexcept
{
    const DWORD limit = timeoutMs;
    const char* value = reinterpret_cast<const char*>(&limit);
    return ::setsockopt(static_cast<SOCKET>(socket), SOL_SOCKET, SO_RCVTIMEO, value, static_cast<int>(sizeof limit)) ==
               0 &&
           ::setsockopt(static_cast<SOCKET>(socket), SOL_SOCKET, SO_SNDTIMEO, value, static_cast<int>(sizeof limit)) ==
               0;
}

bool bindAnyIPv4(SocketHandle socket, std::uint16_t port) noexcept
{
    const sockaddr_in endpoint = ipv4Endpoint(htonl(INADDR_ANY), port);
    return ::bind(static_cast<SOCKET>(socket), reinterpret_cast<const sockaddr*>(&endpoint),
                  static_cast<int>(sizeof endpoint)) == 0;
}

bool boundPort(SocketHandle socket, std::uint16_t& port) noexcept
{
    sockaddr_in endpoint{};
    int length = static_cast<int>(sizeof endpoint);
    if (::getsockname(static_cast<SOCKET>(socket), reinterpret_cast<sockaddr*>(&endpoint), &length) != 0) {
        return false;
    }
    port = ntohs(endpoint.sin_port);
    return true;
}

bool listenOn(SocketHandle socket, int backlog) noexcept { return ::listen(static_cast<SOCKET>(socket), backlog) == 0; }

SocketHandle acceptIPv4(SocketHandle socket, Ipv4Address& peer) noexcept
{
    sockaddr_in endpoint{};
    int length = static_cast<int>(sizeof endpoint);
    const SOCKET accepted = ::accept(static_cast<SOCKET>(socket), reinterpret_cast<sockaddr*>(&endpoint), &length);
    if (accepted != INVALID_SOCKET) {
        peer = endpoint.sin_addr.s_addr;
    }
    return static_cast<SocketHandle>(accepted);
}

long sendSome(SocketHandle socket, const void* data, std::size_t count) noexcept
{
    return ::send(static_cast<SOCKET>(socket), static_cast<const char*>(data), clampLength(count), 0);
}

long receiveSome(SocketHandle socket, void* data, std::size_t count) noexcept
{
    return ::recv(static_cast<SOCKET>(socket), static_cast<char*>(data), clampLength(count), 0);
}

void shutdownBoth(SocketHandle socket) noexcept { ::shutdown(static_cast<SOCKET>(socket), SD_BOTH); }

void closeSocket(SocketHandle socket) noexcept { ::closesocket(static_cast<SOCKET>(socket)); }

bool setReuseAddress(SocketHandle socket) noexcept
{
    const std::int32_t enabled = 1;
    return ::setsockopt(static_cast<SOCKET>(socket), SOL_SOCKET, SO_REUSEADDR, reinterpret_cast<const char*>(&enabled),
                        static_cast<int>(sizeof enabled)) == 0;
}

bool setNonBlocking(SocketHandle socket, bool enabled) noexcept
{
    u_long mode = enabled ? 1 : 0;
    return ::ioctlsocket(static_cast<SOCKET>(socket), FIONBIO, &mode) == 0;
}

SocketError lastSocketError() noexcept
{
    switch (::WSAGetLastError()) {
    case WSAETIMEDOUT:
        return SocketError::TimedOut;
    case WSAEWOULDBLOCK:
        return SocketError::WouldBlock;
    default:
        return SocketError::Other;
    }
}

std::vector<Ipv4Address> resolveIPv4(const char* name)
{
    std::vector<Ipv4Address> addresses;
    if (name == nullptr) {
        return addresses;
    }
    // gethostbyname answers for names and dotted addresses alike; its result lives in thread-local
    // storage owned by Winsock and is copied out before the next resolver call.
    const hostent* host = ::gethostbyname(name);
    if (host == nullptr || host->h_addrtype != AF_INET || host->h_addr_list == nullptr) {
        return addresses;
    }
    const std::size_t length =
        host->h_length < static_cast<int>(sizeof(Ipv4Address)) ? host->h_length : sizeof(Ipv4Address);
    for (char** entry = host->h_addr_list; *entry != nullptr; ++entry) {
        Ipv4Address address = 0;
        std::memcpy(&address, *entry, length);
        addresses.push_back(address);
    }
    return addresses;
}

std::string localHostName(std::size_t capacity)
{
    if (capacity == 0) {
        return {};
    }
    std::string name(capacity, '\0');
    if (::gethostname(name.data(), clampLength(capacity)) != 0) {
        return {};
    }
    const std::size_t length = name.find('\0');
    if (length == std::string::npos) {
        return {};
    }
    name.resize(length);
    return name;
}

std::string dottedAddress(Ipv4Address address)
{
    in_addr raw{};
    raw.s_addr = address;
    // inet_ntoa's buffer belongs to Winsock and is overwritten by the next call on this thread.
    const char* text = ::inet_ntoa(raw);
    return text != nullptr ? std::string(text) : std::string();
}

}  // namespace zel::platform
