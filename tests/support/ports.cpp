#include "support/ports.h"

#include <optional>
#include <stdexcept>

namespace zeltest {

namespace {

std::uint16_t portOf(const Socket& socket)
{
    const std::optional<std::uint16_t> port = socket.valid() ? localPort(socket) : std::nullopt;
    if (!port) {
        throw std::runtime_error("cannot bind a loopback port: " + socketErrorText(lastSocketError()));
    }
    return *port;
}

}  // namespace

ClosedPort::ClosedPort() : socket(boundOnLoopback()), number(portOf(socket)) {}

std::uint16_t releasedPort() { return portOf(boundOnLoopback()); }

}  // namespace zeltest
