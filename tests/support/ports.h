#pragma once
// Ports for tests that must fail to connect or that need a port number nobody holds.

#include <cstdint>

#include "support/sockets.h"

namespace zeltest {

// A loopback port that refuses connections for as long as this object lives: it is bound but never
// listened on, so no other socket (in this process or a test running beside it) can take it over,
// as could happen with a port that was merely found free and released.
class ClosedPort {
public:
    // Throws std::runtime_error when no port can be bound.
    ClosedPort();

    ClosedPort(const ClosedPort&) = delete;
    ClosedPort& operator=(const ClosedPort&) = delete;

    std::uint16_t port() const { return number; }

private:
    Socket socket;
    std::uint16_t number = 0;
};

// A loopback port that nothing listens on right now: bound by the system, then released. Another
// socket may take it before the caller uses it, so callers retry with a fresh one when that matters.
// Throws std::runtime_error when no port can be bound.
std::uint16_t releasedPort();

}  // namespace zeltest
