#include "platform/net.h"

#include <arpa/inet.h>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <netdb.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <unistd.h>

#include <chrono>
#include <memory>

namespace zel::platform {

namespace {

sockaddr_in ipv4Endpoint(Ipv4Address address, std::uint16_t port)
{
    sockaddr_in endpoint{};
    endpoint.sin_family = AF_INET;
    endpoint.sin_port = htons(port);
    endpoint.sin_addr.s_addr = address;
    return endpoint;
}

struct AddrInfoDeleter {
    void operator()(addrinfo* list) const noexcept { freeaddrinfo(list); }
};

}  // namespace

void socketLibraryStartup() noexcept {}

void socketLibraryCleanup() noexcept {}

SocketHandle createStreamSocket() noexcept { return ::socket(AF_INET, SOCK_STREAM, 0); }

namespace {

// poll() with the rest of a time-out, resumed after a signal; 0 waits without bound.
WaitOutcome pollFor(SocketHandle socket, short events, std::uint32_t timeoutMs) noexcept
{
    using Clock = std::chrono::steady_clock;
    const Clock::time_point deadline = Clock::now() + std::chrono::milliseconds(timeoutMs);
    for (;;) {
        int wait = -1;
        if (timeoutMs != 0) {
            const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now()).count();
            wait = left > 0 ? static_cast<int>(left) : 0;
        }
        pollfd entry{socket, events, 0};
        const int ready = ::poll(&entry, 1, wait);
        if (ready > 0) {
            return WaitOutcome::Ready;
        }
        if (ready == 0) {
            return WaitOutcome::TimedOut;
        }
        if (errno != EINTR) {
            return WaitOutcome::Failed;
        }
    }
}

WaitOutcome connectWithin(SocketHandle socket, const sockaddr_in& endpoint, std::uint32_t timeoutMs) noexcept
{
    if (!setNonBlocking(socket, true)) {
        return WaitOutcome::Failed;
    }
    WaitOutcome outcome = WaitOutcome::Ready;
    if (::connect(socket, reinterpret_cast<const sockaddr*>(&endpoint), sizeof endpoint) != 0) {
        outcome = errno == EINPROGRESS ? pollFor(socket, POLLOUT, timeoutMs) : WaitOutcome::Failed;
        int error = 0;
        socklen_t length = sizeof error;
        if (outcome == WaitOutcome::Ready &&
            (::getsockopt(socket, SOL_SOCKET, SO_ERROR, &error, &length) != 0 || error != 0)) {
            outcome = WaitOutcome::Failed;
        }
    }
    if (!setNonBlocking(socket, false)) {
        return WaitOutcome::Failed;
    }
    return outcome;
}

}  // namespace

WaitOutcome connectIPv4(SocketHandle socket, Ipv4Address address, std::uint16_t port, std::uint32_t timeoutMs) noexcept
{
    const sockaddr_in endpoint = ipv4Endpoint(address, port);
    if (timeoutMs != 0) {
        return connectWithin(socket, endpoint, timeoutMs);
    }
    int result;
    do {
        result = ::connect(socket, reinterpret_cast<const sockaddr*>(&endpoint), sizeof endpoint);
    } while (result != 0 && errno == EINTR);
    return result == 0 ? WaitOutcome::Ready : WaitOutcome::Failed;
}

WaitOutcome waitReadable(SocketHandle socket, std::uint32_t timeoutMs) noexcept
{
    return pollFor(socket, POLLIN, timeoutMs);
}

bool setIoTimeout(SocketHandle socket, std::uint32_t timeoutMs) noexcept
{
    timeval limit{};
    limit.tv_sec = static_cast<time_t>(timeoutMs / 1000);
    limit.tv_usec = static_cast<suseconds_t>((timeoutMs % 1000) * 1000);
    return ::setsockopt(socket, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof limit) == 0 &&
           ::setsockopt(socket, SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof limit) == 0;
}

bool bindAnyIPv4(SocketHandle socket, std::uint16_t port) noexcept
{
    const sockaddr_in endpoint = ipv4Endpoint(htonl(INADDR_ANY), port);
    return ::bind(socket, reinterpret_cast<const sockaddr*>(&endpoint), sizeof endpoint) == 0;
}

bool boundPort(SocketHandle socket, std::uint16_t& port) noexcept
{
    sockaddr_in endpoint{};
    socklen_t length = sizeof endpoint;
    if (::getsockname(socket, reinterpret_cast<sockaddr*>(&endpoint), &length) != 0) {
        return false;
    }
    port = ntohs(endpoint.sin_port);
    return true;
}

bool listenOn(SocketHandle socket, int backlog) noexcept { return ::listen(socket, backlog) == 0; }

SocketHandle acceptIPv4(SocketHandle socket, Ipv4Address& peer) noexcept
{
    sockaddr_in endpoint{};
    socklen_t length = sizeof endpoint;
    SocketHandle accepted;
    do {
        accepted = ::accept(socket, reinterpret_cast<sockaddr*>(&endpoint), &length);
    } while (accepted == kInvalidSocket && errno == EINTR);
    if (accepted != kInvalidSocket) {
        peer = endpoint.sin_addr.s_addr;
    }
    return accepted;
}

long sendSome(SocketHandle socket, const void* data, std::size_t count) noexcept
{
    ssize_t sent;
    do {
        sent = ::send(socket, data, count, MSG_NOSIGNAL);
    } while (sent < 0 && errno == EINTR);
    return static_cast<long>(sent);
}

long receiveSome(SocketHandle socket, void* data, std::size_t count) noexcept
{
    ssize_t received;
    do {
        received = ::recv(socket, data, count, 0);
    } while (received < 0 && errno == EINTR);
    return static_cast<long>(received);
}

void shutdownBoth(SocketHandle socket) noexcept { ::shutdown(socket, SHUT_RDWR); }

void closeSocket(SocketHandle socket) noexcept
{
    // Retrying close after EINTR could close a descriptor that another thread has just been given.
    ::close(socket);
}

bool setReuseAddress(SocketHandle socket) noexcept
{
    const std::int32_t enabled = 1;
    return ::setsockopt(socket, SOL_SOCKET, SO_REUSEADDR, &enabled, sizeof enabled) == 0;
}

bool setNonBlocking(SocketHandle socket, bool enabled) noexcept
{
    const int flags = ::fcntl(socket, F_GETFL);
    if (flags < 0) {
        return false;
    }
    const int wanted = enabled ? (flags | O_NONBLOCK) : (flags & ~O_NONBLOCK);
    return ::fcntl(socket, F_SETFL, wanted) == 0;
}

SocketError lastSocketError() noexcept
{
    const int error = errno;
    if (error == ETIMEDOUT) {
        return SocketError::TimedOut;
    }
    if (error == EAGAIN || error == EWOULDBLOCK) {
        return SocketError::WouldBlock;
    }
    return SocketError::Other;
}

std::vector<Ipv4Address> resolveIPv4(const char* name)
{
    std::vector<Ipv4Address> addresses;
    if (name == nullptr) {
        return addresses;
    }
    addrinfo hints{};
    hints.ai_family = AF_INET;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (::getaddrinfo(name, nullptr, &hints, &found) != 0 || found == nullptr) {
        return addresses;
    }
    const std::unique_ptr<addrinfo, AddrInfoDeleter> owner(found);
    for (const addrinfo* entry = found; entry != nullptr; entry = entry->ai_next) {
        if (entry->ai_family == AF_INET && entry->ai_addr != nullptr && entry->ai_addrlen >= sizeof(sockaddr_in)) {
            sockaddr_in endpoint{};
            std::memcpy(&endpoint, entry->ai_addr, sizeof endpoint);
            addresses.push_back(endpoint.sin_addr.s_addr);
        }
    }
    return addresses;
}

std::string localHostName(std::size_t capacity)
{
    if (capacity == 0) {
        return {};
    }
    std::string name(capacity, '\0');
    if (::gethostname(name.data(), capacity) != 0) {
        return {};
    }
    const std::size_t length = name.find('\0');
    if (length == std::string::npos) {
        // Truncated without a terminator: the name did not fit.
        return {};
    }
    name.resize(length);
    return name;
}

std::string dottedAddress(Ipv4Address address)
{
    in_addr raw{};
    raw.s_addr = address;
    char text[INET_ADDRSTRLEN] = {};
    if (::inet_ntop(AF_INET, &raw, text, sizeof text) == nullptr) {
        return {};
    }
    return text;
}

}  // namespace zel::platform
