// The library against a server that lies, stalls or never answers: every case ends in a status, in
// bounded time and memory, a connection left in the middle of a message is given up, and a download
// that does not complete leaves the caller's file as it was.

#include <atomic>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/heap.h"
#include "hostile_fixture.h"
#include "support/environment.h"
#include "support/sockets.h"
#include "transport/connection_limits.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

constexpr unsigned kTimedOut = 392012;

TEST_F(HostileSessionTest, ReplyFramesAreBoundedBeforeTheirContentIsRead)
{
    struct Case {
        const char* name;
        Properties properties;
        Bytes served;  // what the server sends in answer to the command
        unsigned number;
        const char* inMessage;
        bool dropped;  // the connection is given up: the next command finds none
    };
    const Case cases[] = {
        {"prefix announcing 4 GiB",
         {},
         "\xFF\xFF\xFF\xF0SUCCESS\0"s + std::string(4096, 'x'),
         393604,
         "4294967280 bytes, more than the 67108864",
         true},
        {"one byte over MAX_REPLY_BYTES",
         {{"MAX_REPLY_BYTES", "100"}},
         frame("SUCCESS\0"s + std::string(93, 'x')),
         393604,
         "101 bytes, more than the 100",
         true},
        {"exactly MAX_REPLY_BYTES",
         {{"MAX_REPLY_BYTES", "100"}},
         frame("SUCCESS\0"s + std::string(92, 'x')),
         0,
         "",
         false},
        {"torn inside the prefix", {}, "\0\0"s, 393608, "392008", false},
        {"torn inside the payload", {}, frame("SUCCESS\0body"s).substr(0, 9), 393608, "392008", false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        FakeServer server;
        server.exchange(firstHandshake(), signedIn()).expectAnyFrame().sendRaw(c.served);
        if (c.number == 393608) {
            server.closeConnection();
        }
        signIn(server, c.properties);
        const Outcome got = sessionProperty();
        EXPECT_EQ(got.number, c.number) << got.message;
        EXPECT_NE(got.message.find(c.inMessage), std::string::npos) << got.message;
        if (c.dropped) {
            EXPECT_EQ(sessionProperty().number, 393622u);
        }
        EXPECT_TRUE(server.verify());
    }
}

TEST_F(HostileSessionTest, TimeOutsEndTheStepThatWaitedWithTheSocketCode)
{
    struct Case {
        const char* name;
        Properties properties;
        Bytes served;     // sent after the command has been read
        bool resultPort;  // a transacted job, whose result the server never delivers
        unsigned number;
        bool dropped;
    };
    const Case cases[] = {
        {"no answer", {{"IO_TIMEOUT", "0.2"}}, "", false, 393608, true},
        {"stalled frame", {{"IO_TIMEOUT", "0.2"}}, frame("SUCCESS\0body"s).substr(0, 7), false, 393608, true},
        {"no result", {{"RESULT_PORT_TIMEOUT", "0.2"}}, frame("SUCCESS\0queued"s), true, 393618, false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        FakeServer server;
        server.exchange(firstHandshake(), signedIn()).expectAnyFrame().sendRaw(c.served);
        signIn(server, c.properties);
        unsigned unused = 0;
        const Outcome got = c.resultPort ? outcome(transactJob(*session, "", unused)) : sessionProperty();
        EXPECT_EQ(got.number, c.number) << got.message;
        EXPECT_EQ(got.code, kTimedOut) << got.message;
        if (c.dropped) {
            EXPECT_EQ(sessionProperty().number, 393622u);
        }
        EXPECT_TRUE(server.verify());
    }
}

// A listener whose accept queue is full takes no more connections: the system drops the next one's
// handshake, as a server too busy to answer does.
TEST_F(HostileSessionTest, ConnectingGivesUpAfterTheConnectTimeOut)
{
    const Socket busy = listenOnLoopback(0);
    const std::optional<std::uint16_t> port = localPort(busy);
    ASSERT_TRUE(port);
    std::vector<Socket> queued;
    for (int i = 0; i < 4; ++i) {
        queued.push_back(openTcpSocket());
        setNonBlocking(queued.back(), true);
        connectTo(queued.back(), kLoopback, *port);
    }
    const auto started = std::chrono::steady_clock::now();
    // The I/O time-out only matters should the system take the connection after all.
    const Outcome got = init(*port, {{"CONNECT_TIMEOUT", "0.3"}, {"IO_TIMEOUT", "2"}});
    EXPECT_EQ(got.number, 393601u) << got.message;
    EXPECT_EQ(got.code, kTimedOut);
    EXPECT_LT(std::chrono::steady_clock::now() - started, std::chrono::seconds(20));
}

TEST_F(HostileSessionTest, LimitPropertiesThatDoNotConvertAreRefusedBeforeConnecting)
{
    const Properties cases[] = {
        {{"CONNECT_TIMEOUT", "-1"}},      {{"IO_TIMEOUT", "abc"}},      {{"IO_TIMEOUT", "1.2345"}},
        {{"RESULT_PORT_TIMEOUT", "3e1"}}, {{"MAX_REPLY_BYTES", "0"}},   {{"MAX_REPLY_BYTES", "4294967296"}},
        {{"IO_TIMEOUT", "2000001"}},      {{"CONNECT_TIMEOUT", " 30"}},
    };
    for (const Properties& properties : cases) {
        const Outcome got = init(1, properties);
        EXPECT_EQ(got.number, 393617u) << properties.begin()->second;
        EXPECT_NE(got.message.find(properties.begin()->first), std::string::npos) << got.message;
    }
}

TEST(ConnectionLimits, SecondsAreReadToTheMillisecond)
{
    struct Case {
        const char* text;
        std::uint32_t milliseconds;
    };
    const Case cases[] = {{"30", 30000}, {"0", 0}, {"0.25", 250}, {"1.5", 1500}, {"0.001", 1}, {"2000000", 2000000000}};
    for (const Case& c : cases) {
        EXPECT_EQ(zel::secondsAsMilliseconds(c.text), c.milliseconds) << c.text;
    }
}

// Each download of the library, and the source its refusal names.
const std::pair<Call, const char*> kDownloads[] = {
    {downloadSharedFile, "/in/a.txt"}, {getItem, "plan.zlw"}, {getItemResource, "notes.txt"}, {getLogFile, "job 42"}};

// A file the server offers after the command: header, the client's go-ahead, then the content.
FakeServer& offerFile(FakeServer& server, const std::string& content, std::size_t sent)
{
    return server.sendFrame(fileHeader(content.size(), crc32(content)))
        .expectFrame(readyAck())
        .sendRaw(content.substr(0, sent));
}

TEST_F(HostileSessionTest, FailedDownloadsLeaveTheDestinationAsItWas)
{
    struct Case {
        const char* name;
        std::function<void(FakeServer&)> answer;  // the server's part after reading the command
        unsigned number;
        const char* inMessage;  // "<source>" stands for the download's source
        unsigned received;
        bool replaced;  // the destination holds the new content afterwards
    };
    const Case cases[] = {
        {"refused in place of the file", [](FakeServer& s) { s.sendFrame(reply("ERROR", "no such file")); }, 393625,
         "no such file", 0, false},
        {"no file header", [](FakeServer& s) { s.sendFrame(reply("SUCCESS", "false")); }, 393638, "<source>", 0, false},
        {"final answer false",
         [](FakeServer& s) { offerFile(s, "fresh", 5).expectFrame(readyAck()).sendFrame(reply("SUCCESS", "false")); },
         0, "", 0, false},
        {"final answer neither",
         [](FakeServer& s) { offerFile(s, "fresh", 5).expectFrame(readyAck()).sendFrame(reply("SUCCESS", "maybe")); },
         393604, "maybe", 0, false},
        {"complete",
         [](FakeServer& s) { offerFile(s, "fresh", 5).expectFrame(readyAck()).sendFrame(reply("SUCCESS", "true")); }, 0,
         "", 1, true},
    };
    for (const auto& [call, source] : kDownloads) {
        for (const Case& c : cases) {
            SCOPED_TRACE(std::string(source) + ": " + c.name);
            const TempDir folder("zel-download");
            const std::filesystem::path destination = folder.path() / "kept.txt";
            spew(destination, "old");
            FakeServer server;
            server.exchange(firstHandshake(), signedIn()).expectAnyFrame();
            c.answer(server);
            signIn(server);
            unsigned received = 7;
            const Outcome got = outcome(call(*session, destination.string(), received));
            EXPECT_EQ(got.number, c.number) << got.message;
            const std::string expected = c.inMessage == std::string("<source>") ? source : c.inMessage;
            EXPECT_NE(got.message.find(expected), std::string::npos) << got.message;
            EXPECT_EQ(received, c.received);
            EXPECT_EQ(slurp(destination), c.replaced ? "fresh" : "old");
            EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.path()), {}), 1) << "no temporary file";
            EXPECT_TRUE(server.verify());
        }
    }
}

TEST_F(HostileSessionTest, CommandsWithoutAConnectionReportNotConnected)
{
    EXPECT_EQ(sessionProperty().number, 393622u) << "before init";
    FakeServer server;
    server.exchange(firstHandshake(), signedIn());
    signIn(server);
    EXPECT_EQ(outcome(session->disconnect()).number, 0u);
    EXPECT_EQ(sessionProperty().number, 393622u) << "after disconnect";
    unsigned received = 7;
    EXPECT_EQ(outcome(getItem(*session, "x", received)).number, 393622u);
    EXPECT_TRUE(server.verify());
}

TEST_F(HostileSessionTest, RefusedSignInLeavesAnUnauthenticatedIdentity)
{
    FakeServer server;
    server.exchange(firstHandshake(), reply("SUCCESS", "<S/>"));
    server.start();
    EXPECT_EQ(init(server.port()).number, 393631u);
    ASSERT_NE(session->getIdentity(), nullptr);
    EXPECT_FALSE(session->getIdentity()->isAuthenticated());
    EXPECT_TRUE(server.verify());
}

std::atomic<int> exhaustionReports{0};

TEST_F(HostileSessionTest, NoExceptionLeavesTheInterface)
{
    const zel::heap::FailureRoutine previous = zel::heap::setFailureRoutine([](int) { ++exhaustionReports; });
    const struct {
        const char* thrown;
        const char* message;
        int reports;  // calls of the out-of-memory routine
    } cases[] = {{"memory", "Not enough memory for the operation.", 1}, {"no store", "no store", 0}};
    for (const auto& c : cases) {
        exhaustionReports = 0;
        const Outcome got = init(1, {{"!throw", c.thrown}});
        EXPECT_EQ(got.number, 393625u);
        EXPECT_EQ(got.message, c.message);
        EXPECT_EQ(exhaustionReports.load(), c.reports);
    }
    zel::heap::setFailureRoutine(previous);
}

}  // namespace
}  // namespace zeltest
