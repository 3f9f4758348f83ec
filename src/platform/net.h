#pragma once
// Native IPv4 stream sockets behind one small set of functions, so that the transport builds unchanged
// on Winsock and on BSD sockets. Nothing here sets an option, a time-out or a mode that the caller did
// not ask for; without a time-out every call blocks the way the native call does.

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace zel::platform {

#if defined(_WIN32)
using SocketHandle = std::uintptr_t;  // SOCKET
#else
using SocketHandle = int;
#endif

// All bits set: INVALID_SOCKET on Winsock, -1 on BSD sockets.
inline constexpr SocketHandle kInvalidSocket = static_cast<SocketHandle>(~SocketHandle{0});

// IPv4 address as the four bytes in network order, packed into 32 bits exactly as they lie in memory.
using Ipv4Address = std::uint32_t;

// The portable meaning of the last failed socket call of this thread.
enum class SocketError { TimedOut, WouldBlock, Other };

// Winsock start-up asking for version 1.1 and its matching clean-up; nothing on BSD sockets.
// The start-up result is deliberately not looked at: a failure shows in the first socket call.
void socketLibraryStartup() noexcept;
void socketLibraryCleanup() noexcept;

// AF_INET, SOCK_STREAM, protocol 0; kInvalidSocket on failure.
SocketHandle createStreamSocket() noexcept;

enum class WaitOutcome { Ready, TimedOut, Failed };

// Connect to address:port (port in host order). With a time-out (milliseconds, 0 for none) the
// connect runs non-blocking and is given up after that long; the socket is blocking again afterwards.
WaitOutcome connectIPv4(SocketHandle socket, Ipv4Address address, std::uint16_t port, std::uint32_t timeoutMs) noexcept;

// Waits until the socket can be read (for a listener: a peer is waiting to be accepted), at most
// `timeoutMs` milliseconds.
WaitOutcome waitReadable(SocketHandle socket, std::uint32_t timeoutMs) noexcept;

// Bounds every later send and receive on the socket to `timeoutMs` milliseconds (SO_SNDTIMEO and
// SO_RCVTIMEO); 0 lets them block without bound. A receive that runs out of time fails with an error
// that lastSocketError() reports as TimedOut or WouldBlock, depending on the platform.
bool setIoTimeout(SocketHandle socket, std::uint32_t timeoutMs) noexcept;

// Binds to INADDR_ANY:port (port in host order; 0 lets the system choose).
bool bindAnyIPv4(SocketHandle socket, std::uint16_t port) noexcept;

// The local port the socket is bound to, in host order.
bool boundPort(SocketHandle socket, std::uint16_t& port) noexcept;

bool listenOn(SocketHandle socket, int backlog) noexcept;

// Accepts one peer; kInvalidSocket on failure. The peer's address is written on success.
SocketHandle acceptIPv4(SocketHandle socket, Ipv4Address& peer) noexcept;

// One native send with no flags of meaning (on BSD sockets MSG_NOSIGNAL, so that a vanished peer
// yields an error instead of ending the process). Returns the count sent or a negative number.
long sendSome(SocketHandle socket, const void* data, std::size_t count) noexcept;

// One native recv with flags 0. Returns the count received, 0 when the peer closed, negative on error.
long receiveSome(SocketHandle socket, void* data, std::size_t count) noexcept;

// Shuts down both directions; the result is of no interest to anyone.
void shutdownBoth(SocketHandle socket) noexcept;
void closeSocket(SocketHandle socket) noexcept;

// SO_REUSEADDR at level SOL_SOCKET set to the 32-bit value 1.
bool setReuseAddress(SocketHandle socket) noexcept;

// FIONBIO on Winsock, O_NONBLOCK on BSD sockets.
bool setNonBlocking(SocketHandle socket, bool enabled) noexcept;

// Classifies the last socket error of the calling thread.
SocketError lastSocketError() noexcept;

// Every IPv4 address of a host name or dotted address, in the resolver's order; empty when the name
// does not resolve.
std::vector<Ipv4Address> resolveIPv4(const char* name);

// This machine's host name; empty on failure or when it does not fit in `capacity` bytes.
std::string localHostName(std::size_t capacity);

// Dotted decimal text of an address, as inet_ntoa writes it.
std::string dottedAddress(Ipv4Address address);

}  // namespace zel::platform
