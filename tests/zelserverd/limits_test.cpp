// What one client can cost the server: deep documents, memory announced but never sent, idle
// and stalled connections, too many connections, and a stop that must not wait on anyone.
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>

#include "net.h"
#include "support/server_fixture.h"
#include "xml.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

// `inner` wrapped in `levels` elements.
std::string nested(int levels, const std::string& inner)
{
    std::string text;
    for (int i = 0; i < levels; ++i)
        text += "<n>";
    text += inner;
    for (int i = 0; i < levels; ++i)
        text += "</n>";
    return text;
}

class Limits : public ServerFixture {
protected:
    // Restarts the server with `settings` added to its [server] section.
    void restartWith(const std::string& settings)
    {
        writeFile(configPath_, readFile(configPath_) + "\n[server]\n" + settings + "\n");
        startServer();
    }
};

// Every command that reads a client's document refuses one nested past the limit, with the
// element it looks for at the bottom, and stays in step.
TEST_F(Limits, DocumentsNestedPastTheLimitAreRefusedEverywhere)
{
    const std::string tooDeep = "XML document is nested deeper than 64 levels";
    const std::string path = R"(<PATH abspath="/x"/>)";
    struct Case {
        std::string keyword;
        Values values;
        std::string expected;  // the reply body
    };
    const std::vector<Case> cases = {
        {"SR_EXISTS", {{"srName", "AREA"}, {"srPath", nested(63, path)}}, "false"},
        {"SR_EXISTS",
         {{"srName", "AREA"}, {"srPath", nested(64, path)}},
         "path value is not a PATH document: " + tooDeep},
        {"REP_ADD_REPOSITORY",
         {{"repositoryObject", nested(64, R"(<REPOSITORY name="r"/>)")}},
         "repositoryObject: " + tooDeep},
        {"REP_ADD_SERVICE", {{"serviceObject", nested(64, R"(<SERVICE name="s"/>)")}}, "serviceObject: " + tooDeep},
        {"SEC_ADD_USERTOKEN",
         {{"userAccountName", "admin"}, {"userTokenObject", nested(64, R"(<USERTOKEN token="t"/>)")}},
         "\"userTokenObject\" holds no USERTOKEN element: " + tooDeep},
        {"JOB_REQUEST",
         {{"keyword", "zeljob"},
          {"request",
           "R/w/w.zlw -XML_PARAMETER <TRANSFORMATION_REQUEST>" + nested(64, "") + "</TRANSFORMATION_REQUEST>"}},
         "request parameters: " + tooDeep},
    };
    auto admin = connectAs("admin");
    for (const Case& c : cases) {
        WireReply reply = admin->command(c.keyword, c.values);
        EXPECT_EQ(reply.body, c.expected) << c.keyword;
    }
    EXPECT_EQ(userOf(*admin), "admin");
}

// A document far deeper than any stack: refused without walking it, and found without recursion.
TEST_F(Limits, MillionLevelDocumentNeitherCrashesParsingNorSearching)
{
    const std::string deep = nested(1000000, "<PATH/>");
    pugi::xml_document doc;
    EXPECT_EQ(zelserverd::parseXml(deep, doc), "XML document is nested deeper than 64 levels");
    ASSERT_TRUE(doc.load_string(deep.c_str()));
    EXPECT_STREQ(zelserverd::findElement(doc, "PATH").name(), "PATH");
}

TEST_F(Limits, AnnouncedFrameCommitsMemoryOnlyAsItsBytesArrive)
{
    int fds[2];
    ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM, 0, fds), 0);
    const std::string bytes = "\x01\x00\x00\x00"s + "APIVERSION=1";  // announces 16 MiB, sends 12 bytes
    ASSERT_EQ(::write(fds[1], bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
    ::close(fds[1]);
    zelserverd::FrameIo io(fds[0], 1u << 30);
    std::string payload;
    EXPECT_EQ(io.readFrame(payload), zelserverd::FrameStatus::Closed);
    EXPECT_LT(payload.capacity(), 1u << 20);
    ::close(fds[0]);
}

TEST_F(Limits, IdleAndStalledConnectionsAreClosed)
{
    restartWith("idle_timeout_seconds = 1\nio_timeout_seconds = 1");
    const std::string request = frame(requestPayload("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}));
    for (const std::string& sent : {""s, request.substr(0, 2), request.substr(0, 9)}) {
        TestClient client;
        ASSERT_TRUE(client.connect(port()));
        ASSERT_TRUE(sent.empty() || client.sendRaw(sent));
        EXPECT_TRUE(client.closedByPeer(10000)) << sent.size() << " bytes sent";
    }
    auto uploader = connectAs("ann");
    ASSERT_TRUE(
        uploader->sendFrame(requestPayload("SR_UPLOAD", {{"srName", "AREA"}, {"srDestPath", pathDocument("u")}})));
    ASSERT_EQ(splitReply(uploader->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(uploader->sendFrame("fileLength=100\0fileCRC=0"s));
    ASSERT_EQ(splitReply(uploader->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(uploader->sendRaw("partial"));
    EXPECT_TRUE(uploader->closedByPeer(10000));
    EXPECT_TRUE(eventually([&] { return entriesOf(areaDir_).empty(); }));
}

TEST_F(Limits, ConnectionsPastTheLimitAreTurnedAway)
{
    restartWith("max_connections = 2");
    auto first = connectAs("ann");
    auto second = std::make_unique<TestClient>();
    ASSERT_TRUE(second->connect(port()));
    TestClient third;
    ASSERT_TRUE(third.connect(port()));
    WireReply refused = splitReply(third.readFrame().value_or(""));
    EXPECT_EQ(refused.status, "ERROR");
    EXPECT_EQ(refused.body, "the server has 2 connections, its limit; try again later");
    EXPECT_TRUE(third.closedByPeer());
    second.reset();
    EXPECT_TRUE(eventually([&] {
        TestClient again;
        return again.connect(port()) && again.signIn("vic", "vicpw").ok();
    }));
    EXPECT_EQ(userOf(*first), "ann");
}

// A client that asks for a large file and never reads it leaves the server blocked in a send;
// stopping cuts it off after a short grace instead of waiting for it.
TEST_F(Limits, StopDoesNotWaitForAClientThatNeverReads)
{
    restartWith("io_timeout_seconds = 3600");
    writeFile(areaDir_ + "/big.bin", std::string(32u << 20, 'x'));
    auto client = connectAs("ann");
    ASSERT_TRUE(
        client->sendFrame(requestPayload("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("big.bin")}})));
    ASSERT_TRUE(client->readFrame().has_value());
    ASSERT_TRUE(client->sendFrame("SUCCESS\0ready_to_transfer"s));
    auto start = std::chrono::steady_clock::now();
    stopServer();
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
}

}  // namespace
}  // namespace zeltest
