// The fake server itself, driven by a plain socket client written here, so that the later wire tests
// can trust what it reports.

#include "support/fake_server.h"

#include <chrono>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/ports.h"
#include "support/sockets.h"

using namespace std::string_literals;
using namespace zeltest;

namespace {

// Blocking client with a receive time-out, so that a broken server fails the test instead of hanging.
class Client {
public:
    explicit Client(std::uint16_t port) : socket(connectToLoopback(port))
    {
        connected = socket.valid() && setReceiveTimeout(socket, std::chrono::seconds(5));
    }

    bool connected = false;

    void send(std::string_view bytes) { ASSERT_TRUE(sendAll(socket, bytes)) << "send failed"; }

    // Up to `count` bytes; fewer when the server closed or went quiet.
    Bytes read(std::size_t count)
    {
        Bytes bytes(count, '\0');
        std::size_t done = 0;
        while (done < count) {
            const long got = receiveSome(socket, bytes.data() + done, count - done);
            if (got <= 0) {
                break;
            }
            done += static_cast<std::size_t>(got);
        }
        bytes.resize(done);
        return bytes;
    }

    std::optional<Bytes> readFrame()
    {
        const Bytes prefix = read(4);
        if (prefix.size() != 4) {
            return std::nullopt;
        }
        const std::uint32_t length = (std::uint32_t{static_cast<unsigned char>(prefix[0])} << 24) |
                                     (std::uint32_t{static_cast<unsigned char>(prefix[1])} << 16) |
                                     (std::uint32_t{static_cast<unsigned char>(prefix[2])} << 8) |
                                     std::uint32_t{static_cast<unsigned char>(prefix[3])};
        Bytes payload = read(length);
        if (payload.size() != length) {
            return std::nullopt;
        }
        return payload;
    }

    // True when the server closed the connection (end of stream or reset), not merely went quiet.
    bool seesClose()
    {
        char byte;
        const long got = receiveSome(socket, &byte, 1);
        return got == 0 || (got < 0 && isConnectionReset(lastSocketError()));
    }

    void close() { socket.reset(); }

private:
    Socket socket;
};

// A plain listening socket for the connect-back exchange.
class Listener {
public:
    Listener() : socket(listenOnLoopback(4)) { port = localPort(socket).value_or(0); }

    // The accepted socket; invalid when nobody connected within a few seconds.
    Socket accept()
    {
        if (!waitReadable(socket, std::chrono::seconds(5))) {
            return Socket();
        }
        return acceptFrom(socket);
    }

    std::uint16_t port = 0;

private:
    Socket socket;
};

}  // namespace

// ---- Builders and readers ---------------------------------------------------------------------------

TEST(FakeServerPayloads, RequestIsVersionHeaderKeywordAndNamedValues)
{
    const Bytes payload =
        request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}});
    EXPECT_EQ(payload, "APIVERSION=1\0SERVER_SESSION_INIT\0clientID=\0userID=ann\0userPassword=pw1"s);
    EXPECT_EQ(payload.size(), 70u);
    EXPECT_EQ(frame(payload).substr(0, 4), "\x00\x00\x00\x46"s);
    EXPECT_EQ(request("REP_GET_REPOSITORIES"), "APIVERSION=1\0REP_GET_REPOSITORIES"s);
}

TEST(FakeServerPayloads, RepliesHeadersAndAcknowledgement)
{
    EXPECT_EQ(reply("SUCCESS", "true"), "SUCCESS\0true"s);
    EXPECT_EQ(reply("ERROR", ""), "ERROR\0"s);
    EXPECT_EQ(fileHeader(0, 0), "fileLength=0\0fileCRC=0"s);
    EXPECT_EQ(fileHeader(131073, 4294967295u), "fileLength=131073\0fileCRC=4294967295"s);
    EXPECT_EQ(readyAck(), "SUCCESS\0ready_to_transfer"s);
    EXPECT_EQ(crc32("123456789"), 0xCBF43926u);
    EXPECT_EQ(crc32(""), 0u);
}

TEST(FakeServerPayloads, FrameLengthIsBigEndian)
{
    EXPECT_EQ(frame(""), "\0\0\0\0"s);
    const Bytes wire = frame(Bytes(0x01022C, 'p'));
    EXPECT_EQ(wire.substr(0, 4), "\x00\x01\x02\x2C"s);
    EXPECT_EQ(wire.size(), 4u + 0x01022C);
}

TEST(FakeServerPayloads, ParsesRequests)
{
    const auto parsed = parseRequest("APIVERSION=1\0JOB_REQUEST\0a=1\0b=x=y\0a=2"s);
    ASSERT_TRUE(parsed);
    EXPECT_EQ(parsed->version, "1");
    EXPECT_EQ(parsed->keyword, "JOB_REQUEST");
    const Values expected{{"a", "1"}, {"b", "x=y"}, {"a", "2"}};
    EXPECT_EQ(parsed->values, expected);
    EXPECT_EQ(requestValue("APIVERSION=1\0JOB_REQUEST\0a=1\0a=2"s, "a"), "1");
    EXPECT_EQ(requestValue("APIVERSION=1\0JOB_REQUEST\0a=1"s, "b"), std::nullopt);
    EXPECT_TRUE(isRequestFor("APIVERSION=1\0JOB_REQUEST\0a=1"s, "JOB_REQUEST"));
    EXPECT_FALSE(isRequestFor("APIVERSION=1\0JOB_REQUEST_X"s, "JOB_REQUEST"));

    for (const Bytes& malformed :
         {"JOB_REQUEST\0a=1"s, "APIVERSION=1"s, "APIVERSION=1\0\0a=1"s, "APIVERSION=1\0JOB_REQUEST\0novalue"s}) {
        EXPECT_FALSE(parseRequest(malformed)) << printable(malformed);
    }
}

TEST(FakeServerPayloads, DescribesTheFirstDifference)
{
    EXPECT_EQ(describeDifference("same", "same"), "");
    const Bytes expected = Bytes(40, 'a') + "X\0tail"s;
    const Bytes actual = Bytes(40, 'a') + "Y\0tail"s;
    const std::string text = describeDifference(expected, actual);
    EXPECT_NE(text.find("first difference at byte 40"), std::string::npos) << text;
    EXPECT_NE(text.find("00000020  61 61 61 61 61 61 61 61 58 00"), std::string::npos) << text;
    EXPECT_NE(text.find("00000020  61 61 61 61 61 61 61 61 59 00"), std::string::npos) << text;
    EXPECT_NE(text.find("aX\\0tail"), std::string::npos) << text;

    const std::string shorter = describeDifference("abc", "ab");
    EXPECT_NE(shorter.find("first difference at byte 2 (expected 3 bytes, received 2)"), std::string::npos) << shorter;
    EXPECT_EQ(printable("a\0\x01\"\n"s), "a\\0\\x01\\\"\\n");
    EXPECT_EQ(printable("abcdef", 3), "abc... (6 bytes in all)");
}

// ---- Frames -----------------------------------------------------------------------------------------

TEST(FakeServerFrames, MatchingExchangePassesAndRecordsTheFrames)
{
    FakeServer server;
    const Bytes question = request("SERVER_SESSION_INIT", {{"userID", "ann"}});
    const Bytes answer = reply("SUCCESS", "<SESSION/>");
    server.exchange(question, answer).expectAnyFrame();
    server.start();

    Client client(server.port());
    ASSERT_TRUE(client.connected);
    const Bytes wire = frame(question);
    // Torn across writes: the server must reassemble the prefix and the payload.
    client.send(wire.substr(0, 2));
    client.send(wire.substr(2, 5));
    client.send(wire.substr(7));
    EXPECT_EQ(client.read(4 + answer.size()), frame(answer));
    client.send(frame(""));

    EXPECT_TRUE(server.verify());
    const std::vector<Bytes> expected{question, ""};
    EXPECT_EQ(server.frames(), expected);
    EXPECT_EQ(server.lastFrame(), "");
    EXPECT_EQ(server.connectionsAccepted(), 1);
}

TEST(FakeServerFrames, MismatchStopsTheScriptAndClosesTheConnection)
{
    FakeServer server;
    server.exchange(request("REP_GET_REPOSITORIES", {{"enableFilter", "All"}}), reply("SUCCESS", "x"));
    server.start();

    Client client(server.port());
    const Bytes sent = request("REP_GET_REPOSITORIES", {{"enableFilter", "Any"}});
    client.send(frame(sent));
    EXPECT_TRUE(client.seesClose()) << "the reply step must not run after a mismatch";

    EXPECT_FALSE(server.finish());
    const std::string report = server.failure();
    EXPECT_NE(report.find("step 1 of 2 (expect frame \"APIVERSION=1\\0REP_GET_REPOSITORIES"), std::string::npos)
        << report;
    EXPECT_NE(report.find("first difference at byte 48"), std::string::npos) << report;
    EXPECT_NE(report.find("|"), std::string::npos) << report;
    EXPECT_EQ(server.frames(), std::vector<Bytes>{sent});

    const ::testing::AssertionResult verdict = server.verify();
    EXPECT_FALSE(verdict);
    EXPECT_NE(std::string(verdict.message()).find("first difference"), std::string::npos);
}

TEST(FakeServerFrames, PredicateStepsAcceptAndReject)
{
    FakeServer server;
    server.expectFrameWhere("a JOB_REQUEST", [](const Bytes& payload) { return isRequestFor(payload, "JOB_REQUEST"); })
        .expectFrameWhere("a JOB_REQUEST", [](const Bytes& payload) { return isRequestFor(payload, "JOB_REQUEST"); });
    server.start();

    Client client(server.port());
    client.send(frame(request("JOB_REQUEST", {{"a", "1"}})) + frame(request("ABORT_JOB_REQUEST")));
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("step 2 of 2 (expect frame where a JOB_REQUEST): the frame does not "
                                    "match; received 30 bytes: \"APIVERSION=1\\0ABORT_JOB_REQUEST\""),
              std::string::npos)
        << server.failure();
    EXPECT_EQ(server.frames().size(), 2u);
}

TEST(FakeServerFrames, LargeFramesTravelBothWays)
{
    Bytes big(300000, '\0');
    for (std::size_t i = 0; i < big.size(); ++i) {
        big[i] = static_cast<char>(i * 7);
    }
    FakeServer server;
    server.exchange(big, big);
    server.start();

    Client client(server.port());
    client.send(frame(big));
    EXPECT_EQ(client.readFrame(), big);
    EXPECT_TRUE(server.verify());
}

TEST(FakeServerFrames, ImpossibleLengthPrefixIsReported)
{
    FakeServer server;
    server.expectAnyFrame();
    server.start();
    Client client(server.port());
    client.send("\xFF\xFF\xFF\xF0"s);
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("announces 4294967280 bytes"), std::string::npos) << server.failure();
}

TEST(FakeServerFrames, ClientClosingInsideAFrameIsReportedWithWhatArrived)
{
    FakeServer server;
    server.expectAnyFrame();
    server.start();
    {
        Client client(server.port());
        client.send("\x00\x00\x00\x0A"
                    "abc"s);
    }
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("the client closed the connection after 3 of 10 bytes of the payload"),
              std::string::npos)
        << server.failure();
    EXPECT_EQ(server.frames(), std::vector<Bytes>{"abc"});
}

// ---- Raw bytes --------------------------------------------------------------------------------------

TEST(FakeServerRaw, RawReadsAreRecordedAndCompared)
{
    FakeServer server;
    server.expectRaw(5).expectRawBytes("xyz").sendRaw("ok").expectRawBytes("123");
    server.start();

    Client client(server.port());
    client.send("helloxyz");
    EXPECT_EQ(client.read(2), "ok");
    client.send("124");
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("step 4 of 4 (expect raw bytes \"123\"): the raw bytes differ: "
                                    "first difference at byte 2"),
              std::string::npos)
        << server.failure();
    const std::vector<Bytes> expected{"hello", "xyz", "124"};
    EXPECT_EQ(server.rawChunks(), expected);
}

// ---- Connections ------------------------------------------------------------------------------------

TEST(FakeServerConnections, CloseAfterATornFrame)
{
    FakeServer server;
    server.sendFrame("whole").sendRaw(frame("torn").substr(0, 6)).closeConnection();
    server.start();

    Client client(server.port());
    EXPECT_EQ(client.readFrame(), "whole");
    EXPECT_EQ(client.read(10), "\x00\x00\x00\x04to"s);
    EXPECT_TRUE(server.verify());
}

TEST(FakeServerConnections, StepAfterCloseHasNoConnection)
{
    FakeServer server;
    server.closeConnection().sendFrame("late");
    server.start();
    Client client(server.port());
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("step 2 of 2 (send frame \"late\"): there is no open connection"),
              std::string::npos)
        << server.failure();
}

TEST(FakeServerConnections, BytesNoStepReadAreAFailure)
{
    FakeServer server;
    server.expectFrame("a").sendFrame("ok").closeConnection();
    server.start();

    Client client(server.port());
    // One write, so the extra frame is already waiting when the server closes.
    client.send(frame("a") + frame("extra"));
    EXPECT_EQ(client.readFrame(), "ok");
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("step 3 of 3 (close the connection): the client sent 9 bytes that "
                                    "no step read: \"\\0\\0\\0\\x05extra\""),
              std::string::npos)
        << server.failure();
}

TEST(FakeServerConnections, ConnectionStaysOpenAfterTheScriptUntilFinish)
{
    FakeServer server;
    server.sendFrame("hello");
    server.start();

    Client client(server.port());
    EXPECT_EQ(client.readFrame(), "hello");
    EXPECT_TRUE(server.waitForScript());
    client.send("late");
    // The server is still holding the connection: what arrives now is unread when it closes.
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("after the last step: the client sent 4 bytes"), std::string::npos)
        << server.failure();
    EXPECT_TRUE(client.seesClose());
}

TEST(FakeServerConnections, AcceptNextServesAReconnectingClient)
{
    FakeServer server;
    server.exchange("one", "1").closeConnection().acceptNext().exchange("two", "2");
    server.start();

    Client first(server.port());
    first.send(frame("one"));
    EXPECT_EQ(first.readFrame(), "1");
    EXPECT_TRUE(first.seesClose());
    Client second(server.port());
    second.send(frame("two"));
    EXPECT_EQ(second.readFrame(), "2");

    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.connectionsAccepted(), 2);
    EXPECT_EQ(server.frames(), (std::vector<Bytes>{"one", "two"}));
}

TEST(FakeServerConnections, UnacceptedConnectionIsAFailure)
{
    FakeServer server;
    server.exchange("one", "1");
    server.start();

    Client first(server.port());
    first.send(frame("one"));
    EXPECT_EQ(first.readFrame(), "1");
    Client intruder(server.port());
    ASSERT_TRUE(intruder.connected);
    EXPECT_FALSE(server.finish());
    EXPECT_EQ(server.failure(), "a client connected but no step accepted the connection");
}

TEST(FakeServerConnections, EmptyScriptWantsNoClient)
{
    {
        FakeServer server;
        server.start();
        EXPECT_TRUE(server.verify());
        EXPECT_EQ(server.connectionsAccepted(), 0);
    }
    FakeServer server;
    server.start();
    Client client(server.port());
    EXPECT_FALSE(server.finish());
}

TEST(FakeServerConnections, ScriptThatWasNeverStartedFails)
{
    FakeServer server;
    server.expectAnyFrame();
    EXPECT_FALSE(server.finish());
    EXPECT_EQ(server.failure(), "the script was never started");
}

TEST(FakeServerConnections, WaitsAreBounded)
{
    FakeServer quiet;
    quiet.setStepTimeout(std::chrono::milliseconds(200));
    quiet.expectAnyFrame();
    quiet.start();
    Client client(quiet.port());
    EXPECT_TRUE(client.seesClose());
    EXPECT_FALSE(quiet.finish());
    EXPECT_NE(quiet.failure().find("timed out after 0 of 4 bytes of the length prefix"), std::string::npos)
        << quiet.failure();

    FakeServer lonely;
    lonely.setStepTimeout(std::chrono::milliseconds(100));
    lonely.sendFrame("anyone?");
    lonely.start();
    EXPECT_FALSE(lonely.finish());
    EXPECT_NE(lonely.failure().find("no client connected within 100 ms"), std::string::npos) << lonely.failure();
}

TEST(FakeServerConnections, ExpectPeerClose)
{
    {
        FakeServer server;
        server.expectPeerClose();
        server.start();
        Client client(server.port());
        client.close();
        EXPECT_TRUE(server.verify());
    }
    FakeServer server;
    server.expectPeerClose();
    server.start();
    Client client(server.port());
    client.send("no");
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("the client sent 2 bytes instead of closing: \"no\""), std::string::npos)
        << server.failure();
}

// ---- Connect-back -----------------------------------------------------------------------------------

TEST(FakeServerConnectBack, SendsTheResultToThePortNamedInTheRequest)
{
    Listener results;
    FakeServer server;
    server.expectAnyFrame().sendFrame(reply("SUCCESS", "queued")).connectBackAndSend("job result");
    server.start();

    Client client(server.port());
    client.send(frame(request("JOB_REQUEST", {{"requesterResultPort", std::to_string(results.port)},
                                              {"requesterHost", "127.0.0.1"},
                                              {"requesterResultPort", "1"}})));
    EXPECT_EQ(client.readFrame(), reply("SUCCESS", "queued"));
    Socket peer = results.accept();
    ASSERT_TRUE(peer.valid());
    ASSERT_TRUE(setReceiveTimeout(peer, std::chrono::seconds(5)));
    char buffer[64];
    std::size_t done = 0;
    while (done < 14) {
        const long got = receiveSome(peer, buffer + done, sizeof buffer - done);
        if (got <= 0) {
            break;
        }
        done += static_cast<std::size_t>(got);
    }
    peer.reset();
    EXPECT_EQ(Bytes(buffer, done), frame("job result"));
    EXPECT_TRUE(server.verify());
}

TEST(FakeServerConnectBack, MissingOrBadPortValueIsReported)
{
    for (const auto& [values, expected] : std::vector<std::pair<Values, std::string>>{
             {{{"requesterHost", "127.0.0.1"}}, "has no value \"requesterResultPort\""},
             {{{"requesterResultPort", "70000"}}, "\"requesterResultPort=70000\" is not a port"},
             {{{"requesterResultPort", "12ab"}}, "\"requesterResultPort=12ab\" is not a port"}}) {
        FakeServer server;
        server.expectAnyFrame().connectBackAndSend("result");
        server.start();
        Client client(server.port());
        client.send(frame(request("JOB_REQUEST", values)));
        EXPECT_FALSE(server.finish());
        EXPECT_NE(server.failure().find(expected), std::string::npos) << server.failure();
    }
}

TEST(FakeServerConnectBack, RefusedPortIsReported)
{
    const ClosedPort closed;
    const std::uint16_t closedPort = closed.port();
    FakeServer server;
    server.connectToPortAndSend(closedPort, "result");
    server.start();
    EXPECT_FALSE(server.finish());
    EXPECT_NE(server.failure().find("connect to port " + std::to_string(closedPort) + " failed"), std::string::npos)
        << server.failure();
}
