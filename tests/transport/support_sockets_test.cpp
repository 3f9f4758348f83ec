// The tests' own socket layer, on which the fake server and the plain test clients stand.

#include "support/sockets.h"

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/ports.h"

using namespace zeltest;
using std::chrono::milliseconds;

TEST(TestSockets, DottedAddressesAreParsedStrictly)
{
    const struct {
        const char* text;
        std::optional<std::uint32_t> address;
    } cases[] = {
        {"127.0.0.1", 0x7F000001u},
        {"0.0.0.0", 0u},
        {"255.255.255.255", 0xFFFFFFFFu},
        {"10.1.22.133", 0x0A011685u},
        {"", std::nullopt},
        {"127.0.0", std::nullopt},
        {"127.0.0.1.", std::nullopt},
        {"127.0.0.1.5", std::nullopt},
        {"256.0.0.1", std::nullopt},
        {"1.2.3.1000", std::nullopt},
        {"01.2.3.4", std::nullopt},
        {"1..3.4", std::nullopt},
        {" 1.2.3.4", std::nullopt},
        {"1.2.3.4 ", std::nullopt},
        {"1.2.3.-4", std::nullopt},
        {"localhost", std::nullopt},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(parseDottedAddress(c.text), c.address) << '"' << c.text << '"';
    }
}

TEST(TestSockets, ConnectedPairCarriesBytesBothWays)
{
    const Socket listener = listenOnLoopback(1);
    ASSERT_TRUE(listener.valid()) << socketErrorText(lastSocketError());
    const std::optional<std::uint16_t> port = localPort(listener);
    ASSERT_TRUE(port.has_value());
    ASSERT_NE(*port, 0);

    const Socket client = connectToLoopback(*port);
    ASSERT_TRUE(client.valid()) << socketErrorText(lastSocketError());
    ASSERT_TRUE(waitReadable(listener, milliseconds(5000)));
    const Socket server = acceptFrom(listener);
    ASSERT_TRUE(server.valid());
    ASSERT_TRUE(setReceiveTimeout(server, milliseconds(5000)));
    ASSERT_TRUE(setReceiveTimeout(client, milliseconds(5000)));

    // Nothing sent yet: a look without waiting finds nothing to read.
    EXPECT_FALSE(waitReadable(server, milliseconds(0)));
    ASSERT_TRUE(sendAll(client, std::string("up\0!", 4)));
    ASSERT_TRUE(waitReadable(server, milliseconds(5000)));
    char buffer[8] = {};
    ASSERT_EQ(receiveSome(server, buffer, 4), 4);
    EXPECT_EQ(std::string(buffer, 4), std::string("up\0!", 4));

    ASSERT_TRUE(sendAll(server, "down"));
    ASSERT_EQ(receiveSome(client, buffer, 4), 4);
    EXPECT_EQ(std::string(buffer, 4), "down");
}

TEST(TestSockets, NonBlockingReceiveOnAQuietSocketWouldBlock)
{
    const Socket listener = listenOnLoopback(1);
    ASSERT_TRUE(listener.valid());
    const Socket client = connectToLoopback(localPort(listener).value_or(0));
    ASSERT_TRUE(client.valid());
    ASSERT_TRUE(setNonBlocking(client, true));
    char byte = 0;
    EXPECT_LT(receiveSome(client, &byte, 1), 0);
    EXPECT_TRUE(isWouldBlock(lastSocketError())) << socketErrorText(lastSocketError());
}

TEST(TestSockets, ConnectToAClosedPortFailsBothWays)
{
    const ClosedPort closed;
    const Socket blocking = connectToLoopback(closed.port());
    EXPECT_FALSE(blocking.valid());
    EXPECT_NE(lastSocketError(), 0);

    // Non-blocking: the connect goes on in the background, and its end shows through the pending error.
    const Socket background = openTcpSocket();
    ASSERT_TRUE(background.valid());
    ASSERT_TRUE(setNonBlocking(background, true));
    if (!connectTo(background, kLoopback, closed.port())) {
        ASSERT_TRUE(isConnectInProgress(lastSocketError())) << socketErrorText(lastSocketError());
        ASSERT_TRUE(waitWritable(background, milliseconds(5000)));
    }
    const std::optional<int> error = pendingError(background);
    ASSERT_TRUE(error.has_value());
    EXPECT_NE(*error, 0);
}

TEST(TestSockets, ClosedPortKeepsItsPortFromOtherListeners)
{
    const ClosedPort closed;
    const Socket intruder = openTcpSocket();
    ASSERT_TRUE(intruder.valid());
    EXPECT_FALSE(bindTo(intruder, kLoopback, closed.port()));
}
