#include "transport/TcpSocket.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <mutex>
#include <string>
#include <vector>

namespace zel {

namespace {

// The socket library is started by the first live socket and cleaned up by the last one. Sessions on
// different threads open and close sockets at the same time, so the test-and-change of the counter
// and the start-up or clean-up it triggers happen under one lock; the counters themselves stay atomic
// so that they can be read without it.
std::mutex libraryMutex;
std::atomic<std::uint32_t> libraryUsers{0};
std::atomic<std::uint32_t> libraryStartups{0};
std::atomic<std::uint32_t> libraryCleanups{0};

constexpr int kListenBacklog = 5;
constexpr std::size_t kHostNameCapacity = 256;

bool isValid(platform::SocketHandle socket) { return socket != platform::kInvalidSocket; }

std::unique_ptr<char[]> copyText(const char* text)
{
    const std::size_t length = std::strlen(text);
    auto copy = std::make_unique<char[]>(length + 1);
    std::memcpy(copy.get(), text, length + 1);
    return copy;
}

}  // namespace

TcpSocket::TcpSocket(const char* host, std::uint16_t remotePort, std::uint32_t connectTimeoutMs)
{
    countLibraryUser();
    connectTo(host, remotePort, connectTimeoutMs);
}

TcpSocket::TcpSocket(std::uint16_t& localPort)
{
    countLibraryUser();
    startListening(localPort);
}

TcpSocket::~TcpSocket() { close(); }

// Contract: every constructor counts one user before it tries to connect or listen, and only close()
// of a socket that holds a main socket gives the count back. A failed constructor's count is kept, so
// after any failed socket the platform's socket library stays started until the process ends; a
// later start-up is therefore never repeated while a caller may still be using the library.
void TcpSocket::countLibraryUser()
{
    const std::lock_guard<std::mutex> lock(libraryMutex);
    if (libraryUsers.load() == 0) {
        platform::socketLibraryStartup();
        ++libraryStartups;
    }
    ++libraryUsers;
}

void TcpSocket::releaseLibraryUser()
{
    const std::lock_guard<std::mutex> lock(libraryMutex);
    if (libraryUsers.load() == 0) {
        return;
    }
    if (--libraryUsers == 0) {
        platform::socketLibraryCleanup();
        ++libraryCleanups;
    }
}

std::uint32_t TcpSocket::socketLibraryUsers() noexcept { return libraryUsers.load(); }

std::uint32_t TcpSocket::socketLibraryStartups() noexcept { return libraryStartups.load(); }

std::uint32_t TcpSocket::socketLibraryCleanups() noexcept { return libraryCleanups.load(); }

void TcpSocket::shutdownAndClose(platform::SocketHandle& socket)
{
    platform::shutdownBoth(socket);
    platform::closeSocket(socket);
    socket = platform::kInvalidSocket;
}

void TcpSocket::connectTo(const char* name, std::uint16_t remotePort, std::uint32_t timeoutMs)
{
    platform::SocketHandle socket = platform::createStreamSocket();
    if (!isValid(socket)) {
        errorCode = SOCK_CREATE_FAILED;
        return;
    }
    const std::vector<platform::Ipv4Address> addresses = platform::resolveIPv4(name);
    if (addresses.empty()) {
        shutdownAndClose(socket);
        errorCode = SOCK_HOST_UNKNOWN;
        return;
    }
    // No option of any kind unless asked for: the server's replies may take as long as its jobs do.
    const platform::WaitOutcome connected = platform::connectIPv4(socket, addresses.front(), remotePort, timeoutMs);
    if (connected != platform::WaitOutcome::Ready) {
        shutdownAndClose(socket);
        errorCode = connected == platform::WaitOutcome::TimedOut ? SOCK_TIMED_OUT : SOCK_CONNECT_FAILED;
        return;
    }
    mainSocket = socket;
    acceptedSocket = platform::kInvalidSocket;
    port = remotePort;
    hostName = copyText(name);
}

void TcpSocket::startListening(std::uint16_t& localPort)
{
    platform::SocketHandle socket = platform::createStreamSocket();
    if (!isValid(socket)) {
        errorCode = SOCK_CREATE_FAILED;
        return;
    }
    // A fixed port must be reusable at once after an earlier listener left connections in TIME_WAIT;
    // a system-chosen port never collides, so it is left alone.
    if (localPort != 0 && !platform::setReuseAddress(socket)) {
        errorCode = SOCK_REUSE_FAILED;
    }
    if (!platform::bindAnyIPv4(socket, localPort)) {
        shutdownAndClose(socket);
        errorCode = SOCK_BIND_FAILED;
        return;
    }
    if (localPort == 0) {
        std::uint16_t chosen = 0;
        if (platform::boundPort(socket, chosen)) {
            localPort = chosen;
        } else {
            errorCode = SOCK_NAME_FAILED;
        }
    }
    mainSocket = socket;
    acceptedSocket = platform::kInvalidSocket;
    if (!platform::listenOn(mainSocket, kListenBacklog)) {
        errorCode = SOCK_LISTEN_FAILED;
    }
    port = localPort;
}

platform::SocketHandle TcpSocket::ioSocket() const { return isValid(acceptedSocket) ? acceptedSocket : mainSocket; }

std::int32_t TcpSocket::receiveExact(void* buffer, std::int32_t count, std::int32_t* received)
{
    if (count < 1) {
        return 0;
    }
    auto* bytes = static_cast<char*>(buffer);
    std::int32_t total = 0;
    for (;;) {
        const long got = platform::receiveSome(ioSocket(), bytes + total, static_cast<std::size_t>(count - total));
        if (got == 0) {
            // A clean close sets no error number; reading one here would report whatever an earlier
            // call (often the probe's would-block) left behind.
            return SOCK_RECEIVE_FAILED;
        }
        if (got < 0) {
            return failureCode(SOCK_RECEIVE_FAILED);
        }
        total += static_cast<std::int32_t>(got);
        if (received != nullptr) {
            *received = total;
        }
        if (total >= count) {
            return 0;
        }
    }
}

// With an I/O time-out the socket stays blocking, so "would block" can only mean that the time ran
// out (BSD sockets say EAGAIN where Winsock says WSAETIMEDOUT).
std::int32_t TcpSocket::failureCode(std::int32_t plainFailure) const
{
    switch (platform::lastSocketError()) {
    case platform::SocketError::TimedOut:
        return SOCK_TIMED_OUT;
    case platform::SocketError::WouldBlock:
        return ioTimeoutMs != 0 ? SOCK_TIMED_OUT : SOCK_WOULD_BLOCK;
    case platform::SocketError::Other:
        break;
    }
    return plainFailure;
}

// Callers hand over whole frames or whole file chunks; a short send is reported rather than resumed,
// because the far side cannot resynchronise on a partly written frame anyway. A blocking send comes
// back short only when the time-out cut it off.
std::int32_t TcpSocket::sendBuffer(const void* buffer, std::size_t count)
{
    const long sent = platform::sendSome(ioSocket(), buffer, count);
    if (sent < 0) {
        const std::int32_t code = failureCode(SOCK_SEND_FAILED);
        return code == SOCK_WOULD_BLOCK ? SOCK_SEND_FAILED : code;
    }
    if (static_cast<std::size_t>(sent) != count) {
        return ioTimeoutMs != 0 ? SOCK_TIMED_OUT : SOCK_SEND_FAILED;
    }
    return 0;
}

bool TcpSocket::setIoTimeout(std::uint32_t timeoutMs)
{
    ioTimeoutMs = timeoutMs;
    return platform::setIoTimeout(ioSocket(), timeoutMs);
}

std::int32_t TcpSocket::acceptPeer(std::uint32_t timeoutMs)
{
    if (isValid(acceptedSocket)) {
        shutdownAndClose(acceptedSocket);
    }
    if (timeoutMs != 0) {
        const platform::WaitOutcome waited = platform::waitReadable(mainSocket, timeoutMs);
        if (waited != platform::WaitOutcome::Ready) {
            return waited == platform::WaitOutcome::TimedOut ? SOCK_TIMED_OUT : SOCK_ACCEPT_FAILED;
        }
    }
    platform::Ipv4Address peer = 0;
    const platform::SocketHandle accepted = platform::acceptIPv4(mainSocket, peer);
    if (!isValid(accepted)) {
        return SOCK_ACCEPT_FAILED;
    }
    acceptedSocket = accepted;
    if (ioTimeoutMs != 0) {
        platform::setIoTimeout(acceptedSocket, ioTimeoutMs);
    }
    if (!peerAddress) {
        peerAddress = std::make_unique<char[]>(kPeerAddressSize);
    }
    std::memset(peerAddress.get(), 0, kPeerAddressSize);
    const std::string dotted = platform::dottedAddress(peer);
    std::memcpy(peerAddress.get(), dotted.data(), std::min(dotted.size(), kPeerAddressSize - 1));
    return 0;
}

// No peek: the one byte is consumed. The server never sends anything unasked, so whatever is waiting
// between commands is stale and losing it does no harm.
bool TcpSocket::probeConnection()
{
    const platform::SocketHandle socket = ioSocket();
    // A socket that cannot be made non-blocking must not be read: the read could wait for ever.
    if (!platform::setNonBlocking(socket, true)) {
        return false;
    }
    char byte = 0;
    const long got = platform::receiveSome(socket, &byte, 1);
    const platform::SocketError error = platform::lastSocketError();
    platform::setNonBlocking(socket, false);
    if (got > 0) {
        return true;
    }
    return got < 0 && error == platform::SocketError::WouldBlock;
}

void TcpSocket::localHostAddress(char* buffer, std::int32_t size)
{
    if (buffer == nullptr || size <= 0) {
        return;
    }
    buffer[0] = '\0';
    const std::string name = platform::localHostName(kHostNameCapacity);
    if (name.empty()) {
        return;
    }
    const std::vector<platform::Ipv4Address> addresses = platform::resolveIPv4(name.c_str());
    if (addresses.empty()) {
        return;
    }
    const std::string dotted = platform::dottedAddress(addresses.front());
    if (dotted.empty() || dotted.size() + 1 > static_cast<std::size_t>(size)) {
        return;
    }
    std::memcpy(buffer, dotted.c_str(), dotted.size() + 1);
}

void TcpSocket::close()
{
    if (isValid(acceptedSocket)) {
        shutdownAndClose(acceptedSocket);
    }
    if (isValid(mainSocket)) {
        shutdownAndClose(mainSocket);
        releaseLibraryUser();
    }
}

}  // namespace zel
