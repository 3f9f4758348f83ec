// The socket wrapper against real loopback peers: its own listener and the fake server.

#include "transport/TcpSocket.h"

#include <chrono>
#include <memory>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "support/fake_server.h"
#include "support/sockets.h"

using namespace std::string_literals;
using zel::TcpSocket;
using zeltest::FakeServer;

namespace {

// Loopback delivery of a close may lag behind the call that caused it; probe until the connection
// reads as dead, within a bound.
bool becomesUnusable(TcpSocket& socket)
{
    for (int attempt = 0; attempt < 1000; ++attempt) {
        if (!socket.probeConnection()) {
            return true;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    return false;
}

}  // namespace

TEST(TcpSocket, SendToAClosedPeerFailsWithoutASignal)
{
    FakeServer server;
    server.closeConnection().start();
    TcpSocket client("127.0.0.1", server.port());
    ASSERT_EQ(client.errorCode, 0);
    EXPECT_TRUE(becomesUnusable(client));
    // The first sends may still be taken into the buffer; the peer's reset fails the later ones.
    const std::string chunk(1024, 'c');
    std::int32_t result = 0;
    for (int attempt = 0; attempt < 200 && result == 0; ++attempt) {
        result = client.sendBuffer(chunk.data(), chunk.size());
        std::this_thread::sleep_for(std::chrono::milliseconds(result == 0 ? 5 : 0));
    }
    EXPECT_EQ(result, zel::SOCK_SEND_FAILED);
    EXPECT_TRUE(server.verify());
}

TEST(TcpSocket, FixedPortCanBeListenedOnAgainWhileTheOldConnectionLingers)
{
    std::uint16_t port = zeltest::releasedPort();
    auto owner = std::make_unique<TcpSocket>(port);
    for (int attempt = 0; attempt < 10 && owner->errorCode == zel::SOCK_BIND_FAILED; ++attempt) {
        port = zeltest::releasedPort();
        owner = std::make_unique<TcpSocket>(port);
    }
    ASSERT_EQ(owner->errorCode, 0);
    const std::uint16_t requested = port;
    {
        TcpSocket client("127.0.0.1", port);
        ASSERT_EQ(owner->acceptPeer(), 0);
        // The listener's side closes first, so its end of the connection stays behind on the port.
        owner->close();
        EXPECT_TRUE(becomesUnusable(client));
    }
    TcpSocket again(port);
    EXPECT_EQ(again.errorCode, 0);
    EXPECT_EQ(port, requested);
    EXPECT_EQ(TcpSocket("127.0.0.1", port).errorCode, 0);
}
