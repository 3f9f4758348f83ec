// Winsock start-up and clean-up by the socket wrapper, seen through Winsock itself: a process that
// never started Winsock can use the library's sockets, and once the last of them is gone Winsock is
// down again. It needs a process in which nothing else started Winsock (CTest runs each case in its
// own); otherwise it skips.

#if defined(_WIN32)

#include <winsock2.h>
#include <windows.h>

#include <string>

#include <gtest/gtest.h>

#include "support/sockets.h"
#include "transport/TcpSocket.h"

using zel::TcpSocket;

namespace {

// 0 when Winsock is up, WSANOTINITIALISED when nobody in the process holds a start-up.
int socketCallError()
{
    const SOCKET probe = ::socket(AF_INET, SOCK_STREAM, 0);
    const int error = probe == INVALID_SOCKET ? ::WSAGetLastError() : 0;
    ::closesocket(probe);
    return error;
}

}  // namespace

TEST(WinsockStartup, LibrarySocketsWorkWithoutAStartUpOfTheCallerAndCleanUpAfterTheLast)
{
    if (zeltest::socketsStarted() || TcpSocket::socketLibraryUsers() != 0) {
        GTEST_SKIP() << "Winsock was started earlier in this process";
    }
    ASSERT_EQ(socketCallError(), WSANOTINITIALISED);
    {
        std::uint16_t port = 0;
        TcpSocket listener(port);
        ASSERT_EQ(listener.errorCode, 0);
        {
            TcpSocket client("127.0.0.1", port);
            ASSERT_EQ(listener.acceptPeer(), 0);
            ASSERT_EQ(client.sendBuffer("ping", 4), 0);
            char received[4] = {};
            ASSERT_EQ(listener.receiveExact(received, 4), 0);
            EXPECT_EQ(std::string(received, 4), "ping");
        }
        // The listener still holds its start-up: closing the client must not have taken Winsock down.
        EXPECT_EQ(socketCallError(), 0);
    }
    EXPECT_EQ(socketCallError(), WSANOTINITIALISED);
    // Had the library started Winsock more often than it cleaned up, this clean-up would succeed.
    EXPECT_EQ(::WSACleanup(), SOCKET_ERROR);
}

#endif  // _WIN32
