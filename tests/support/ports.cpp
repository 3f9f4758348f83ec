#include "support/ports.h"

#include <optional>
#include <stdexcept>

namespace zeltest {

// Exclusive, so that on Winsock a later socket asking for address reuse cannot bind over it either.
ClosedPort::ClosedPort() : socket(openTcpSocket())
{
    std::optional<std::uint16_t> port;
    if (socket.valid() && setExclusiveAddress(socket) && bindTo(socket, kLoopback, 0)) {
        port = localPort(socket);
    }
    if (!port) {
        throw std::runtime_error("closed port: cannot bind: " + socketErrorText(lastSocketError()));
    }
    number = *port;
}

std::uint16_t releasedPort()
{
    const Socket socket = openTcpSocket();
    std::optional<std::uint16_t> port;
    if (socket.valid() && bindTo(socket, kLoopback, 0)) {
        port = localPort(socket);
    }
    if (!port) {
        throw std::runtime_error("released port: cannot bind: " + socketErrorText(lastSocketError()));
    }
    return *port;
}

}  // namespace zeltest
