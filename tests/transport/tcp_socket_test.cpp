// The socket wrapper against real loopback peers: its own listener, plain sockets, and the fake server.

#include "transport/TcpSocket.h"

#include <chrono>
#include <cstring>
#include <memory>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "support/fake_server.h"
#include "support/ports.h"
#include "support/sockets.h"

using namespace std::string_literals;
using zel::TcpSocket;
using zeltest::FakeServer;

namespace {

// Loopback delivery of a close may lag behind the call that caused it; probe until the connection
// reads as dead, within a bound.
bool becomesUnusable(TcpSocket& socket)
{
    const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(5);
    while (std::chrono::steady_clock::now() < until) {
        if (!socket.probeConnection()) {
            return true;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    return false;
}

// A listener and a client connected to it, accepted through the backlog without a second thread.
struct ConnectedPair {
    std::uint16_t port = 0;
    std::unique_ptr<TcpSocket> listener;
    std::unique_ptr<TcpSocket> client;

    ConnectedPair()
    {
        listener = std::make_unique<TcpSocket>(port);
        client = std::make_unique<TcpSocket>("127.0.0.1", port);
        EXPECT_EQ(listener->errorCode, 0);
        EXPECT_EQ(client->errorCode, 0);
        EXPECT_EQ(listener->acceptPeer(), 0);
    }
};

}  // namespace

// ---- receiveExact -----------------------------------------------------------------------------------

TEST(TcpSocketReceive, CountBelowOneReturnsAtOnceWithoutReading)
{
    ConnectedPair pair;
    ASSERT_EQ(pair.listener->sendBuffer("xy", 2), 0);
    char buffer[4] = {'-', '-', '-', '-'};
    std::int32_t counter = 77;
    EXPECT_EQ(pair.client->receiveExact(buffer, 0, &counter), 0);
    EXPECT_EQ(pair.client->receiveExact(buffer, -5, &counter), 0);
    EXPECT_EQ(counter, 77);
    EXPECT_EQ(buffer[0], '-');
    // The bytes are still there for the next real read.
    ASSERT_EQ(pair.client->receiveExact(buffer, 2, &counter), 0);
    EXPECT_EQ(counter, 2);
    EXPECT_EQ(std::string(buffer, 2), "xy");

    TcpSocket failed("no-such-host.invalid", 1);
    EXPECT_EQ(failed.receiveExact(buffer, 0, nullptr), 0);
}

TEST(TcpSocketReceive, PeerClosingInsideAFrameGivesReceiveFailedWithThePartialCount)
{
    FakeServer server;
    server
        .sendRaw("\x00\x00\x00\x0a"
                 "abc"s)
        .closeConnection();
    server.start();

    TcpSocket client("127.0.0.1", server.port());
    ASSERT_EQ(client.errorCode, 0);
    unsigned char prefix[4];
    ASSERT_EQ(client.receiveExact(prefix, 4), 0);
    EXPECT_EQ(prefix[3], 10);
    char payload[10] = {};
    std::int32_t counter = -1;
    EXPECT_EQ(client.receiveExact(payload, 10, &counter), zel::SOCK_RECEIVE_FAILED);
    EXPECT_EQ(counter, 3);
    EXPECT_EQ(std::string(payload, 3), "abc");
    EXPECT_TRUE(server.verify());
}

TEST(TcpSocketReceive, CloseBeforeAnyByteIsAReceiveFailureEvenAfterAWouldBlockProbe)
{
    FakeServer server;
    server.expectFrame("ping").closeConnection();
    server.start();

    TcpSocket client("127.0.0.1", server.port());
    ASSERT_EQ(client.errorCode, 0);
    // The probe ends in a would-block; the close that follows must not be mistaken for one.
    ASSERT_TRUE(client.probeConnection());
    const std::string ping = zeltest::frame("ping");
    ASSERT_EQ(client.sendBuffer(ping.data(), ping.size()), 0);
    char buffer[4];
    std::int32_t counter = 99;
    EXPECT_EQ(client.receiveExact(buffer, 4, &counter), zel::SOCK_RECEIVE_FAILED);
    EXPECT_EQ(counter, 99);
    EXPECT_TRUE(server.verify());
}

// ---- sendBuffer -------------------------------------------------------------------------------------

TEST(TcpSocketSend, SendToAClosedPeerEventuallyFails)
{
    FakeServer server;
    server.closeConnection();
    server.start();

    TcpSocket client("127.0.0.1", server.port());
    ASSERT_EQ(client.errorCode, 0);
    ASSERT_TRUE(server.waitForScript());
    const std::string chunk(1024, 'c');
    std::int32_t result = 0;
    // The first sends may still be taken into the buffer; the peer's reset turns the later ones into
    // errors (and must not raise a signal that ends the process).
    for (int attempt = 0; attempt < 200 && result == 0; ++attempt) {
        result = client.sendBuffer(chunk.data(), chunk.size());
        if (result == 0) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
    }
    EXPECT_EQ(result, zel::SOCK_SEND_FAILED);
    EXPECT_TRUE(server.verify());
}

// ---- client constructor -----------------------------------------------------------------------------

TEST(TcpSocketConnect, ConnectsByNameAndRecordsHostAndPort)
{
    FakeServer server;
    server.expectPeerClose();
    server.start();

    TcpSocket client("localhost", server.port());
    EXPECT_EQ(client.errorCode, 0);
    ASSERT_NE(client.getHostName(), nullptr);
    EXPECT_STREQ(client.getHostName(), "localhost");
    EXPECT_EQ(client.getPort(), server.port());
    EXPECT_EQ(client.getPeerAddress(), nullptr);
    client.close();
    EXPECT_TRUE(server.verify());
}

TEST(TcpSocketConnect, ClosedPortsAndUnknownHostsFail)
{
    const zeltest::ClosedPort closed;
    TcpSocket refused("127.0.0.1", closed.port());
    EXPECT_EQ(refused.errorCode, zel::SOCK_CONNECT_FAILED);
    EXPECT_EQ(refused.getHostName(), nullptr);
    EXPECT_EQ(refused.getPort(), 0);
    EXPECT_FALSE(refused.probeConnection());
    TcpSocket unknown("no-such-host.invalid", 4000);
    EXPECT_EQ(unknown.errorCode, zel::SOCK_HOST_UNKNOWN);
}

// ---- listener constructor ---------------------------------------------------------------------------

TEST(TcpSocketListen, PortZeroWritesTheChosenPortBack)
{
    std::uint16_t port = 0;
    TcpSocket listener(port);
    ASSERT_EQ(listener.errorCode, 0);
    ASSERT_NE(port, 0);
    EXPECT_EQ(listener.getPort(), port);
    EXPECT_EQ(listener.getHostName(), nullptr);

    TcpSocket client("127.0.0.1", port);
    EXPECT_EQ(client.errorCode, 0);
    EXPECT_EQ(listener.acceptPeer(), 0);
    ASSERT_NE(listener.getPeerAddress(), nullptr);
    EXPECT_STREQ(listener.getPeerAddress(), "127.0.0.1");
}

TEST(TcpSocketListen, FixedPortCanBeListenedOnAgainWhileTheOldConnectionLingers)
{
    std::uint16_t port = 0;
    std::uint16_t requested = 0;
    {
        std::unique_ptr<TcpSocket> owner;
        for (int attempt = 0; attempt < 10; ++attempt) {
            requested = port = zeltest::releasedPort();
            owner = std::make_unique<TcpSocket>(port);
            if (owner->errorCode != zel::SOCK_BIND_FAILED) {
                break;
            }
        }
        TcpSocket& listener = *owner;
        ASSERT_EQ(listener.errorCode, 0);
        EXPECT_EQ(port, requested);
        EXPECT_EQ(listener.getPort(), requested);
        TcpSocket client("127.0.0.1", port);
        ASSERT_EQ(client.errorCode, 0);
        ASSERT_EQ(listener.acceptPeer(), 0);
        // The listener's side closes first, so its end of the connection stays behind on the port.
        listener.close();
        EXPECT_TRUE(becomesUnusable(client));
    }
    TcpSocket again(port);
    EXPECT_EQ(again.errorCode, 0);
    EXPECT_EQ(port, requested);
    TcpSocket client("127.0.0.1", port);
    EXPECT_EQ(client.errorCode, 0);
}

TEST(TcpSocketListen, PortHeldByAnotherListenerGivesBindFailed)
{
    std::uint16_t port = 0;
    TcpSocket first(port);
    ASSERT_EQ(first.errorCode, 0);
    const std::uint32_t usersBefore = TcpSocket::socketLibraryUsers();
    std::uint16_t same = port;
    {
        TcpSocket second(same);
        EXPECT_EQ(second.errorCode, zel::SOCK_BIND_FAILED);
        EXPECT_EQ(second.acceptPeer(), zel::SOCK_ACCEPT_FAILED);
    }
    EXPECT_EQ(same, port);
    // The failed listener never gives its start-up count back.
    EXPECT_EQ(TcpSocket::socketLibraryUsers(), usersBefore + 1);
}

// ---- acceptPeer -------------------------------------------------------------------------------------

TEST(TcpSocketAccept, SecondAcceptReplacesThePeer)
{
    std::uint16_t port = 0;
    TcpSocket listener(port);
    ASSERT_EQ(listener.errorCode, 0);
    TcpSocket first("127.0.0.1", port);
    TcpSocket second("127.0.0.1", port);
    ASSERT_EQ(first.errorCode, 0);
    ASSERT_EQ(second.errorCode, 0);

    ASSERT_EQ(listener.acceptPeer(), 0);
    ASSERT_EQ(listener.sendBuffer("1", 1), 0);
    char byte = 0;
    ASSERT_EQ(first.receiveExact(&byte, 1), 0);
    EXPECT_EQ(byte, '1');

    ASSERT_EQ(listener.acceptPeer(), 0);
    EXPECT_STREQ(listener.getPeerAddress(), "127.0.0.1");
    EXPECT_TRUE(becomesUnusable(first));
    ASSERT_EQ(listener.sendBuffer("2", 1), 0);
    ASSERT_EQ(second.receiveExact(&byte, 1), 0);
    EXPECT_EQ(byte, '2');
}

// ---- probeConnection --------------------------------------------------------------------------------

TEST(TcpSocketProbe, ConnectionClosedByTheServerIsNotUsable)
{
    FakeServer server;
    server.closeConnection();
    server.start();

    TcpSocket client("127.0.0.1", server.port());
    ASSERT_EQ(client.errorCode, 0);
    ASSERT_TRUE(server.waitForScript());
    EXPECT_TRUE(becomesUnusable(client));
    EXPECT_TRUE(server.verify());
}

TEST(TcpSocketProbe, IdleOrPendingConnectionIsUsableAndStaysBlocking)
{
    FakeServer server;
    // One write, so "AB" is already waiting when "pong" has been read.
    server.expectFrame("ping").sendRaw("pongAB");
    server.start();

    TcpSocket client("127.0.0.1", server.port());
    ASSERT_EQ(client.errorCode, 0);
    // Had the probe left the socket non-blocking, the read below would come back before the answer.
    EXPECT_TRUE(client.probeConnection());
    const std::string ping = zeltest::frame("ping");
    ASSERT_EQ(client.sendBuffer(ping.data(), ping.size()), 0);
    char buffer[4];
    ASSERT_EQ(client.receiveExact(buffer, 4), 0);
    EXPECT_TRUE(client.probeConnection());
    char byte = 0;
    ASSERT_EQ(client.receiveExact(&byte, 1), 0);
    EXPECT_EQ(byte, 'B');
    EXPECT_TRUE(server.verify());
}

// ---- localHostAddress -------------------------------------------------------------------------------

TEST(TcpSocketLocalAddress, WritesTheAddressOnlyWhenItFits)
{
    std::uint16_t port = 0;
    TcpSocket socket(port);
    char full[64];
    std::memset(full, 'x', sizeof full);
    socket.localHostAddress(full, sizeof full);
    const std::string address = full;
    ASSERT_FALSE(address.empty()) << "this machine's host name does not resolve";
    EXPECT_TRUE(zeltest::parseDottedAddress(address).has_value()) << address;

    char exact[64];
    std::memset(exact, 'x', sizeof exact);
    socket.localHostAddress(exact, static_cast<std::int32_t>(address.size() + 1));
    EXPECT_EQ(std::string(exact), address);

    char tooShort[64];
    std::memset(tooShort, 'x', sizeof tooShort);
    socket.localHostAddress(tooShort, static_cast<std::int32_t>(address.size()));
    EXPECT_EQ(tooShort[0], '\0');

    char untouched[4] = {'x', 'x', 'x', 'x'};
    socket.localHostAddress(untouched, 0);
    socket.localHostAddress(untouched, -3);
    socket.localHostAddress(nullptr, 64);
    EXPECT_EQ(untouched[0], 'x');
}

// ---- start-up counting and close --------------------------------------------------------------------

TEST(TcpSocketLibrary, TwoSocketsStartTheLibraryOnceAndCleanUpOnce)
{
    const std::uint32_t users = TcpSocket::socketLibraryUsers();
    const std::uint32_t startups = TcpSocket::socketLibraryStartups();
    const std::uint32_t cleanups = TcpSocket::socketLibraryCleanups();
    // Only a process with no live socket starts and cleans up; otherwise the counts must not move.
    const std::uint32_t firstUse = users == 0 ? 1 : 0;
    {
        std::uint16_t port1 = 0;
        std::uint16_t port2 = 0;
        TcpSocket first(port1);
        EXPECT_EQ(TcpSocket::socketLibraryUsers(), users + 1);
        EXPECT_EQ(TcpSocket::socketLibraryStartups(), startups + firstUse);
        TcpSocket second(port2);
        EXPECT_EQ(TcpSocket::socketLibraryUsers(), users + 2);
        EXPECT_EQ(TcpSocket::socketLibraryStartups(), startups + firstUse);

        first.close();
        EXPECT_EQ(TcpSocket::socketLibraryUsers(), users + 1);
        first.close();
        EXPECT_EQ(TcpSocket::socketLibraryUsers(), users + 1);
        EXPECT_EQ(TcpSocket::socketLibraryCleanups(), cleanups);
    }
    EXPECT_EQ(TcpSocket::socketLibraryUsers(), users);
    EXPECT_EQ(TcpSocket::socketLibraryCleanups(), cleanups + firstUse);
    EXPECT_EQ(TcpSocket::socketLibraryStartups(), startups + firstUse);
}

TEST(TcpSocketClose, ClosingAListenerAlsoClosesItsAcceptedPeer)
{
    ConnectedPair pair;
    pair.listener->close();
    EXPECT_TRUE(becomesUnusable(*pair.client));
    char byte = 0;
    EXPECT_EQ(pair.client->receiveExact(&byte, 1), zel::SOCK_RECEIVE_FAILED);
    // Nothing left to send through.
    EXPECT_EQ(pair.listener->sendBuffer("x", 1), zel::SOCK_SEND_FAILED);
}
