#pragma once
// Ports for tests that must fail to connect.

#include <cstdint>

namespace zeltest {

// A loopback port that refuses connections for as long as this object lives: it is bound but never
// listened on, so no other socket (in this process or a test running beside it) can take it over,
// as could happen with a port that was merely found free and released.
class ClosedPort {
public:
    // Throws std::runtime_error when no port can be bound.
    ClosedPort();
    ~ClosedPort();

    ClosedPort(const ClosedPort&) = delete;
    ClosedPort& operator=(const ClosedPort&) = delete;

    std::uint16_t port() const { return number; }

private:
    int fd = -1;
    std::uint16_t number = 0;
};

}  // namespace zeltest
