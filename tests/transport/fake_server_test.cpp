// What the wire tests trust of the fake server: its encoder writes the protocol's bytes, and a
// client that sends anything other than the script (other bytes, extra bytes, an extra connection)
// fails the test instead of passing unseen.

#include "support/fake_server.h"

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/sockets.h"

using namespace std::string_literals;
using namespace zeltest;

namespace {

// Blocking client with a receive time-out, so that a broken server fails the test instead of hanging.
class Client {
public:
    explicit Client(std::uint16_t port) : socket(connectToLoopback(port))
    {
        EXPECT_TRUE(socket.valid() && setReceiveTimeout(socket, std::chrono::seconds(5)));
    }
    void send(std::string_view bytes) { ASSERT_TRUE(sendAll(socket, bytes)); }
    Bytes read(std::size_t count)
    {
        Bytes bytes(count, '\0');
        std::size_t done = 0;
        for (long got = 1; done < count && got > 0; done += got > 0 ? static_cast<std::size_t>(got) : 0) {
            got = receiveSome(socket, bytes.data() + done, count - done);
        }
        bytes.resize(done);
        return bytes;
    }

private:
    Socket socket;
};

TEST(FakeServerPayloads, BuildersWriteTheProtocolsBytes)
{
    const Bytes payload =
        request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}});
    EXPECT_EQ(payload, "APIVERSION=1\0SERVER_SESSION_INIT\0clientID=\0userID=ann\0userPassword=pw1"s);
    EXPECT_EQ(frame(payload).substr(0, 4), "\x00\x00\x00\x46"s);
    EXPECT_EQ(frame(Bytes(0x01022C, 'p')).substr(0, 4), "\x00\x01\x02\x2C"s);
    EXPECT_EQ(reply("ERROR", ""), "ERROR\0"s);
    EXPECT_EQ(fileHeader(131073, 4294967295u), "fileLength=131073\0fileCRC=4294967295"s);
    EXPECT_EQ(readyAck(), "SUCCESS\0ready_to_transfer"s);
    EXPECT_EQ(crc32("123456789"), 0xCBF43926u);

    const auto parsed = parseRequest("APIVERSION=1\0JOB_REQUEST\0a=1\0b=x=y\0a=2"s);
    ASSERT_TRUE(parsed);
    EXPECT_EQ(parsed->keyword, "JOB_REQUEST");
    EXPECT_EQ(parsed->values, (Values{{"a", "1"}, {"b", "x=y"}, {"a", "2"}}));
    EXPECT_EQ(requestValue("APIVERSION=1\0JOB_REQUEST\0a=1\0a=2"s, "a"), "1");
    for (const Bytes& malformed : {"JOB_REQUEST\0a=1"s, "APIVERSION=1\0\0a=1"s, "APIVERSION=1\0JOB\0novalue"s}) {
        EXPECT_FALSE(parseRequest(malformed)) << printable(malformed);
    }
}

TEST(FakeServerScript, TornFramesAreReassembledAndAnswered)
{
    FakeServer server;
    const Bytes question = request("SERVER_SESSION_INIT", {{"userID", "ann"}});
    server.exchange(question, reply("SUCCESS", "<SESSION/>"));
    server.start();
    Client client(server.port());
    const Bytes wire = frame(question);
    client.send(wire.substr(0, 2));
    client.send(wire.substr(2));
    EXPECT_EQ(client.read(4 + 18), frame(reply("SUCCESS", "<SESSION/>")));
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames(), std::vector<Bytes>{question});
}

TEST(FakeServerScript, AnythingOffScriptFailsTheRun)
{
    using Clients = std::vector<std::unique_ptr<Client>>;
    const auto run = [](auto script, auto act) {
        FakeServer server;
        script(server);
        server.start();
        Clients clients;  // kept open until the run ends
        act(server.port(), clients);
        EXPECT_FALSE(server.finish());
        return server.failure();
    };
    const auto connect = [](Clients& clients, std::uint16_t port) -> Client& {
        return *clients.emplace_back(std::make_unique<Client>(port));
    };
    EXPECT_NE(run(
                  [](FakeServer& s) {
                      s.exchange(request("A", {{"f", "All"}}), "x");
                  },
                  [&](std::uint16_t port, Clients& c) {
                      connect(c, port).send(frame(request("A", {{"f", "Any"}})));
                  })
                  .find("first difference at byte 18"),
              std::string::npos);
    EXPECT_NE(run([](FakeServer& s) { s.expectFrame("a").sendFrame("ok").closeConnection(); },
                  [&](std::uint16_t port, Clients& c) {
                      connect(c, port).send(frame("a") + frame("extra"));
                      c[0]->read(6);
                  })
                  .find("the client sent 9 bytes that no step read"),
              std::string::npos);
    EXPECT_EQ(run([](FakeServer& s) { s.exchange("one", "1"); },
                  [&](std::uint16_t port, Clients& c) {
                      connect(c, port).send(frame("one"));
                      c[0]->read(5);
                      connect(c, port);
                  }),
              "a client connected but no step accepted the connection");
}

}  // namespace
