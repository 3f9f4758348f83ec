// Winsock start-up and clean-up by the socket wrapper, seen from outside through Winsock itself: a
// process that never started Winsock can use the library's sockets, and once the last of them is
// gone Winsock is down again, with every start-up of the library given back.
//
// The checks need a process in which nothing else has started Winsock. CTest runs every case in a
// process of its own; in a run of the whole program the test sockets of earlier cases have started
// it for good, and the cases skip.

#if defined(_WIN32)

#include <winsock2.h>
#include <windows.h>

#include <cstdint>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/sockets.h"
#include "transport/TcpSocket.h"

using zel::TcpSocket;

namespace {

// The error a plain socket() call gets right now: 0 when Winsock is up (the socket is closed again),
// WSANOTINITIALISED when nobody in the process holds a start-up.
int socketCallError()
{
    const SOCKET probe = ::socket(AF_INET, SOCK_STREAM, 0);
    if (probe == INVALID_SOCKET) {
        return ::WSAGetLastError();
    }
    ::closesocket(probe);
    return 0;
}

// Whether this process is fresh as far as Winsock goes; otherwise the case cannot show anything.
std::optional<std::string> notFresh()
{
    if (zeltest::socketsStarted()) {
        return "the tests' own sockets have started Winsock in this process";
    }
    if (TcpSocket::socketLibraryUsers() != 0) {
        return "an earlier socket of the library still holds Winsock";
    }
    return std::nullopt;
}

}  // namespace

TEST(WinsockStartup, LibrarySocketsWorkWithoutAStartUpOfTheCallerAndCleanUpAfterTheLast)
{
    if (const auto reason = notFresh()) {
        GTEST_SKIP() << *reason;
    }
    ASSERT_EQ(socketCallError(), WSANOTINITIALISED) << "Winsock was already started in this process";
    const std::uint32_t startups = TcpSocket::socketLibraryStartups();
    const std::uint32_t cleanups = TcpSocket::socketLibraryCleanups();
    {
        std::uint16_t port = 0;
        TcpSocket listener(port);
        ASSERT_EQ(listener.errorCode, 0);
        ASSERT_NE(port, 0);
        {
            TcpSocket client("127.0.0.1", port);
            ASSERT_EQ(client.errorCode, 0);
            ASSERT_EQ(listener.acceptPeer(), 0);
            ASSERT_EQ(client.sendBuffer("ping", 4), 0);
            char received[4] = {};
            ASSERT_EQ(listener.receiveExact(received, 4), 0);
            EXPECT_EQ(std::string(received, 4), "ping");
            EXPECT_EQ(socketCallError(), 0);
        }
        // The listener still holds its start-up: closing the client must not have taken Winsock down.
        EXPECT_EQ(TcpSocket::socketLibraryUsers(), 1u);
        EXPECT_EQ(socketCallError(), 0);
        EXPECT_EQ(TcpSocket::socketLibraryStartups(), startups + 1);
        EXPECT_EQ(TcpSocket::socketLibraryCleanups(), cleanups);
    }
    EXPECT_EQ(TcpSocket::socketLibraryUsers(), 0u);
    EXPECT_EQ(TcpSocket::socketLibraryCleanups(), cleanups + 1);
    EXPECT_EQ(socketCallError(), WSANOTINITIALISED);
    // Had the library started Winsock more often than it cleaned up, this clean-up would succeed.
    EXPECT_EQ(::WSACleanup(), SOCKET_ERROR);
    EXPECT_EQ(::WSAGetLastError(), WSANOTINITIALISED);
}

#endif  // _WIN32
