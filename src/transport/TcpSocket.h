#pragma once
// The blocking IPv4 TCP socket under the wire protocol. Two personalities, chosen by the constructor:
// a client connected to a host and port, or a listener bound to a local port that accepts peers and
// then talks to the last accepted one. Failures are plain integer codes, never exceptions; the channel
// turns them into statuses.

#include <cstddef>
#include <cstdint>
#include <memory>

#include "platform/net.h"

namespace zel {

// Socket failure codes. A constructor leaves one of them in `errorCode`; operations return them.
inline constexpr std::int32_t SOCK_CREATE_FAILED = 392001;
inline constexpr std::int32_t SOCK_BIND_FAILED = 392002;
inline constexpr std::int32_t SOCK_NAME_FAILED = 392003;
inline constexpr std::int32_t SOCK_LISTEN_FAILED = 392004;
inline constexpr std::int32_t SOCK_HOST_UNKNOWN = 392005;
inline constexpr std::int32_t SOCK_CONNECT_FAILED = 392006;
inline constexpr std::int32_t SOCK_ACCEPT_FAILED = 392007;
inline constexpr std::int32_t SOCK_RECEIVE_FAILED = 392008;
inline constexpr std::int32_t SOCK_SEND_FAILED = 392009;
inline constexpr std::int32_t SOCK_REUSE_FAILED = 392011;
inline constexpr std::int32_t SOCK_TIMED_OUT = 392012;
// Returned by receiveExact when the socket is non-blocking and nothing is there.
inline constexpr std::int32_t SOCK_WOULD_BLOCK = -1;

class TcpSocket {
public:
    // Client: connects to host:remotePort (a name or a dotted address), giving up after
    // `connectTimeoutMs` milliseconds (0: as long as the system lets it). `errorCode` is 0 on
    // success, else SOCK_CREATE_FAILED, SOCK_HOST_UNKNOWN, SOCK_CONNECT_FAILED or SOCK_TIMED_OUT.
    TcpSocket(const char* host, std::uint16_t remotePort, std::uint32_t connectTimeoutMs = 0);

    // Listener: binds to any address on `localPort` and listens; with port 0 the system chooses and the
    // chosen port is written back. `errorCode` is 0, or SOCK_CREATE_FAILED / SOCK_BIND_FAILED (not
    // listening), or SOCK_REUSE_FAILED / SOCK_NAME_FAILED / SOCK_LISTEN_FAILED (the work went on).
    explicit TcpSocket(std::uint16_t& localPort);

    ~TcpSocket();

    TcpSocket(const TcpSocket&) = delete;
    TcpSocket& operator=(const TcpSocket&) = delete;

    // Set once by the constructor; the operations do not look at it, the owner must.
    std::int32_t errorCode = 0;

    // Receives exactly `count` bytes into `buffer`. Returns 0 when all arrived (at once when count is
    // below 1), SOCK_RECEIVE_FAILED when the peer closed or on error, SOCK_TIMED_OUT, or
    // SOCK_WOULD_BLOCK. The running total is written to `received` (when given) after every piece,
    // so a failure leaves the partial count there and the bytes in the buffer.
    std::int32_t receiveExact(void* buffer, std::int32_t count, std::int32_t* received = nullptr);

    // One send of the whole buffer: 0, SOCK_SEND_FAILED when the system took fewer bytes, or
    // SOCK_TIMED_OUT when the I/O time-out ran out first.
    std::int32_t sendBuffer(const void* buffer, std::size_t count);

    // Bounds each later send and receive (on this socket and on peers it accepts) to `timeoutMs`
    // milliseconds; 0 removes the bound. A receive or send that runs out of time returns
    // SOCK_TIMED_OUT. False when the system refused the setting.
    bool setIoTimeout(std::uint32_t timeoutMs);

    // Accepts the next peer on a listener, closing the previous one first, waiting at most
    // `timeoutMs` milliseconds (0: without bound). 0, SOCK_ACCEPT_FAILED or SOCK_TIMED_OUT.
    std::int32_t acceptPeer(std::uint32_t timeoutMs = 0);

    // Whether the connection still looks usable: reads one byte without waiting. Idle and open, or a
    // byte waiting (which is consumed), counts as usable; closed or failed does not.
    bool probeConnection();

    // Writes this machine's dotted IPv4 address into buffer (size bytes with the terminator). The
    // buffer is left empty when the address cannot be found or does not fit; nothing is written when
    // the buffer is null or size is not positive.
    void localHostAddress(char* buffer, std::int32_t size);

    // Closes the accepted peer and the main socket; a second call does nothing.
    void close();

    // The connected remote port, or the bound local port of a listener.
    std::uint16_t getPort() const { return port; }
    // The host name given to the client constructor; null for a listener or a failed connect.
    const char* getHostName() const { return hostName.get(); }
    // Dotted address of the last accepted peer; null before the first accept.
    const char* getPeerAddress() const { return peerAddress.get(); }

    // How many sockets hold a start-up of the socket library (test seam). Failed constructors keep
    // theirs for the life of the process.
    static std::uint32_t socketLibraryUsers() noexcept;
    // How often the socket library was started and cleaned up in this process (test seam).
    static std::uint32_t socketLibraryStartups() noexcept;
    static std::uint32_t socketLibraryCleanups() noexcept;

private:
    static constexpr std::size_t kPeerAddressSize = 50;

    void countLibraryUser();
    void releaseLibraryUser();
    void connectTo(const char* name, std::uint16_t remotePort, std::uint32_t timeoutMs);
    std::int32_t failureCode(std::int32_t plainFailure) const;
    void startListening(std::uint16_t& localPort);
    platform::SocketHandle ioSocket() const;
    static void shutdownAndClose(platform::SocketHandle& socket);

    platform::SocketHandle mainSocket = platform::kInvalidSocket;
    platform::SocketHandle acceptedSocket = platform::kInvalidSocket;
    std::uint16_t port = 0;
    std::uint32_t ioTimeoutMs = 0;
    std::unique_ptr<char[]> hostName;
    std::unique_ptr<char[]> peerAddress;
};

}  // namespace zel
