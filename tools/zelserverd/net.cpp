#include "net.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netdb.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "framing.h"
#include "util.h"

namespace zelserverd {

UniqueFd& UniqueFd::operator=(UniqueFd&& other) noexcept
{
    if (this != &other)
        reset(other.release());
    return *this;
}

int UniqueFd::release()
{
    int fd = fd_;
    fd_ = -1;
    return fd;
}

void UniqueFd::reset(int fd)
{
    if (fd_ >= 0)
        ::close(fd_);
    fd_ = fd;
}

namespace {

struct AddrInfoList {
    addrinfo* head = nullptr;
    ~AddrInfoList()
    {
        if (head)
            freeaddrinfo(head);
    }
};

bool resolve(const std::string& host, std::uint16_t port, int flags, AddrInfoList& list, std::string& error)
{
    addrinfo hints{};
    hints.ai_family = AF_UNSPEC;
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = flags;
    std::string service = std::to_string(port);
    int rc = getaddrinfo(host.empty() ? nullptr : host.c_str(), service.c_str(), &hints, &list.head);
    if (rc != 0) {
        error = "cannot resolve '" + host + "': " + gai_strerror(rc);
        return false;
    }
    return true;
}

}  // namespace

UniqueFd listenOn(const std::string& host, std::uint16_t port, std::string& error)
{
    AddrInfoList list;
    if (!resolve(host, port, AI_PASSIVE | AI_NUMERICSERV, list, error))
        return {};
    for (addrinfo* ai = list.head; ai; ai = ai->ai_next) {
        UniqueFd fd(::socket(ai->ai_family, ai->ai_socktype | SOCK_CLOEXEC, ai->ai_protocol));
        if (!fd.valid())
            continue;
        int one = 1;
        ::setsockopt(fd.get(), SOL_SOCKET, SO_REUSEADDR, &one, sizeof one);
        if (::bind(fd.get(), ai->ai_addr, ai->ai_addrlen) != 0) {
            error = "cannot bind " + host + ":" + std::to_string(port) + ": " + std::strerror(errno);
            continue;
        }
        if (::listen(fd.get(), 64) != 0) {
            error = std::string("cannot listen: ") + std::strerror(errno);
            continue;
        }
        return fd;
    }
    if (error.empty())
        error = "no usable address for '" + host + "'";
    return {};
}

std::uint16_t boundPort(int fd)
{
    sockaddr_storage addr{};
    socklen_t len = sizeof addr;
    if (::getsockname(fd, reinterpret_cast<sockaddr*>(&addr), &len) != 0)
        return 0;
    if (addr.ss_family == AF_INET)
        return ntohs(reinterpret_cast<sockaddr_in*>(&addr)->sin_port);
    if (addr.ss_family == AF_INET6)
        return ntohs(reinterpret_cast<sockaddr_in6*>(&addr)->sin6_port);
    return 0;
}

std::string peerAddress(int fd)
{
    sockaddr_storage addr{};
    socklen_t len = sizeof addr;
    if (::getpeername(fd, reinterpret_cast<sockaddr*>(&addr), &len) != 0)
        return {};
    char text[INET6_ADDRSTRLEN] = {};
    if (addr.ss_family == AF_INET)
        ::inet_ntop(AF_INET, &reinterpret_cast<sockaddr_in*>(&addr)->sin_addr, text, sizeof text);
    else if (addr.ss_family == AF_INET6)
        ::inet_ntop(AF_INET6, &reinterpret_cast<sockaddr_in6*>(&addr)->sin6_addr, text, sizeof text);
    return text;
}

UniqueFd connectTo(const std::string& host, std::uint16_t port, int timeoutMs, std::string& error)
{
    AddrInfoList list;
    if (!resolve(host, port, AI_NUMERICSERV, list, error))
        return {};
    for (addrinfo* ai = list.head; ai; ai = ai->ai_next) {
        UniqueFd fd(::socket(ai->ai_family, ai->ai_socktype | SOCK_CLOEXEC | SOCK_NONBLOCK, ai->ai_protocol));
        if (!fd.valid())
            continue;
        int rc = ::connect(fd.get(), ai->ai_addr, ai->ai_addrlen);
        if (rc != 0 && errno == EINPROGRESS) {
            pollfd p{fd.get(), POLLOUT, 0};
            if (::poll(&p, 1, timeoutMs) == 1) {
                int soError = 0;
                socklen_t len = sizeof soError;
                ::getsockopt(fd.get(), SOL_SOCKET, SO_ERROR, &soError, &len);
                rc = soError == 0 ? 0 : -1;
                errno = soError;
            } else {
                errno = ETIMEDOUT;
            }
        }
        if (rc != 0) {
            error = "cannot connect to " + host + ":" + std::to_string(port) + ": " + std::strerror(errno);
            continue;
        }
        // Back to blocking mode: the caller writes whole frames and expects sendAll to finish.
        int flags = ::fcntl(fd.get(), F_GETFL);
        ::fcntl(fd.get(), F_SETFL, flags & ~O_NONBLOCK);
        return fd;
    }
    return {};
}

bool splitHostPort(std::string_view text, std::string& host, std::uint16_t& port)
{
    std::size_t colon = text.rfind(':');
    if (colon == std::string_view::npos)
        return false;
    std::string_view hostPart = text.substr(0, colon);
    if (hostPart.size() >= 2 && hostPart.front() == '[' && hostPart.back() == ']')
        hostPart = hostPart.substr(1, hostPart.size() - 2);
    auto number = parseDecimal(text.substr(colon + 1), 65535);
    if (hostPart.empty() || !number)
        return false;
    host = std::string(hostPart);
    port = static_cast<std::uint16_t>(*number);
    return true;
}

namespace {

// Waits until `fd` is ready for `events` or `stallMs` passes; false on time-out or error.
bool waitFor(int fd, short events, int stallMs)
{
    for (;;) {
        pollfd p{fd, events, 0};
        int rc = ::poll(&p, 1, stallMs);
        if (rc < 0 && errno == EINTR)
            continue;
        return rc == 1;
    }
}

constexpr std::size_t kFrameGrowth = 65536;

}  // namespace

// The socket stays blocking for everyone else; these calls never block in the kernel, they wait
// in poll, where a time-out and a shutdown both reach them.
namespace {

// One loop for both directions: `io` moves at most `size` bytes without blocking, and a full or
// empty socket is waited for in poll for `event`.
template <typename Byte, typename Io>
bool moveAll(int fd, Byte* bytes, std::size_t size, short event, int stallMs, Io io)
{
    while (size > 0) {
        ssize_t n = io(fd, bytes, size);
        if (n < 0 && errno == EINTR)
            continue;
        if (n < 0 && (errno == EAGAIN || errno == EWOULDBLOCK)) {
            if (!waitFor(fd, event, stallMs))
                return false;
            continue;
        }
        if (n <= 0)
            return false;
        bytes += n;
        size -= static_cast<std::size_t>(n);
    }
    return true;
}

}  // namespace

bool sendAll(int fd, const void* data, std::size_t size, int stallMs)
{
    return moveAll(fd, static_cast<const char*>(data), size, POLLOUT, stallMs,
                   [](int f, const char* p, std::size_t n) { return ::send(f, p, n, MSG_NOSIGNAL | MSG_DONTWAIT); });
}

bool recvExact(int fd, void* data, std::size_t size, int stallMs)
{
    return moveAll(fd, static_cast<char*>(data), size, POLLIN, stallMs,
                   [](int f, char* p, std::size_t n) { return ::recv(f, p, n, MSG_DONTWAIT); });
}

FrameStatus FrameIo::readFrame(std::string& payload)
{
    unsigned char prefix[4];
    if (!recvExact(fd_, prefix, 1, patience_.idleMs) || !recvExact(fd_, prefix + 1, 3, patience_.stallMs))
        return FrameStatus::Closed;
    std::uint32_t length = decodeLength(prefix);
    if (length > maxFrame_) {
        refusedLength_ = length;
        return FrameStatus::TooLarge;
    }
    payload.clear();
    while (payload.size() < length) {
        std::size_t have = payload.size();
        std::size_t piece = std::min<std::size_t>(length - have, kFrameGrowth);
        payload.resize(have + piece);
        if (!recvExact(fd_, payload.data() + have, piece, patience_.stallMs))
            return FrameStatus::Closed;
    }
    return FrameStatus::Ok;
}

bool FrameIo::writeFrame(std::string_view payload)
{
    std::string frame = encodeFrame(payload);
    return sendAll(fd_, frame.data(), frame.size(), patience_.stallMs);
}

}  // namespace zelserverd
