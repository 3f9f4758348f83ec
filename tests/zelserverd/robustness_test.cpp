// Clients that break the protocol, vanish, stall, pile up, nest documents deeply or guess passwords
// lose their own connection and nothing else: no partial file, and the server keeps answering
// everyone; a stop waits for no one.
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <thread>

#include "net.h"
#include "support/server_fixture.h"
#include "xml.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

class Robustness : public ServerFixture {
protected:
    void expectServerStillServes() { EXPECT_EQ(userOf(*connectAs("ann")), "ann"); }
    // A connection of ann's that has started an upload to the area's "up.bin" with `header`.
    std::unique_ptr<TestClient> uploading(const std::string& header, const std::string& expected = "ready_to_transfer")
    {
        auto client = connectAs("ann");
        Values values{
            {"srName", "AREA"}, {"srDestPath", pathDocument("up.bin")}, {"itemFileCRCCheckingEnabled", "true"}};
        EXPECT_EQ(client->startUpload("SR_UPLOAD", values, header).body, expected);
        return client;
    }
};

// `inner` wrapped in `levels` elements.
std::string nested(int levels, const std::string& inner)
{
    std::string open, close;
    for (int i = 0; i < levels; ++i) {
        open += "<n>";
        close += "</n>";
    }
    return open + inner + close;
}

TEST_F(Robustness, FramesUpToTheLimitAreReadLargerOnesCloseOnlyThatConnection)
{
    auto bystander = connectAs("vic");
    auto client = connectAs("ann");
    std::string payload = requestPayload("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}});
    payload += "\0pad="s;
    payload.resize(65536, 'p');
    ASSERT_TRUE(client->sendFrame(payload));
    EXPECT_EQ(client->readReply().body, "ann");
    for (auto [prefix, size] :
         {std::pair{"\x00\x01\x00\x01"s, "65537"}, std::pair{"\x7f\xff\xff\xff"s, "2147483647"}}) {
        TestClient greedy;
        ASSERT_TRUE(greedy.connect(port()));
        ASSERT_TRUE(greedy.sendRaw(prefix + "APIVERSION=1"));
        WireReply reply = greedy.readReply();
        EXPECT_EQ(reply.status, "ERROR");
        EXPECT_EQ(reply.body, "request frame of "s + size + " bytes exceeds the limit of 65536 bytes");
        EXPECT_TRUE(greedy.closedByPeer());
    }
    EXPECT_EQ(userOf(*bystander), "vic");
}

TEST_F(Robustness, MalformedRequestsCloseTheConnectionAndSplitFramesAreReassembled)
{
    for (const std::string& payload :
         {""s, "SERVER_SESSION_INIT"s, "APIVERSION=7\0SERVER_SESSION_INIT"s, "APIVERSION=1"s,
          "apiversion=1\0SERVER_SESSION_INIT"s, "APIVERSION=1\0\0clientID="s,
          "APIVERSION=1\0SERVER_SESSION_INIT\0noequals"s, "APIVERSION=1\0SERVER_SESSION_INIT\0=value"s}) {
        TestClient client;
        ASSERT_TRUE(client.connect(port()));
        ASSERT_TRUE(client.sendFrame(payload));
        EXPECT_EQ(client.readReply().body.rfind("malformed request: ", 0), 0u) << payload;
        EXPECT_TRUE(client.closedByPeer());
    }
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    std::string bytes = frame(requestPayload("SERVER_SESSION_INIT", {{"userID", "ann"}, {"userPassword", "annpw"}}));
    for (std::size_t i = 0; i < bytes.size(); i += 3)
        ASSERT_TRUE(client.sendRaw(bytes.substr(i, 3)));
    EXPECT_EQ(client.readReply().status, "SUCCESS");
}

// A client that vanishes in the middle of an upload leaves nothing behind. The partial file lies in
// the server's own folder for temporaries, never beside the user's files, and what a crash leaves
// there is swept at the next start.
TEST_F(Robustness, VanishedUploadsLeaveNoFile)
{
    spew(areaDir_ + "/.zelserverd-notes", "a user's own file");
    auto shared = uploading("fileLength=100000\0fileCRC=1"s);
    ASSERT_TRUE(shared->sendRaw(std::string(40000, 'x')));
    auto item = connectAs("admin");
    ASSERT_EQ(item->startUpload("REP_ADD_ITEM", {{"repositoryName", "REPO"}, {"itemName", "cut.zds"}},
                                "fileLength=100\0fileCRC=0"s)
                  .body,
              "ready_to_transfer");
    ASSERT_TRUE(item->sendRaw("only part"));
    EXPECT_TRUE(eventually([&] { return entriesOf(dataDir_ + "/tmp").size() == 2; }));
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{".zelserverd-notes"});
    WireReply listed = connectAs("vic")->command("SR_LIST", {{"srName", "AREA"}, {"srPath", pathDocument("")}});
    EXPECT_NE(listed.body.find("name=\".zelserverd-notes\""), std::string::npos) << listed.body;
    shared.reset();
    item.reset();
    expectServerStillServes();
    EXPECT_TRUE(eventually([&] { return entriesOf(dataDir_ + "/tmp").empty() && storedFiles() == 0; }));
    EXPECT_EQ(admin_->command("REP_ITEMEXISTS", {{"repositoryName", "REPO"}, {"itemName", "cut.zds"}}).body, "false");
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{".zelserverd-notes"});
    spew(dataDir_ + "/tmp/.zelserverd-crashed", "left by a crash");
    startServer();
    EXPECT_TRUE(entriesOf(dataDir_ + "/tmp").empty());
}

TEST_F(Robustness, BadFileHeadersAndMissingAcknowledgementsCloseTheConnectionWithoutAFile)
{
    for (const std::string& header :
         {"fileLength=abc\0fileCRC=1"s, "APIVERSION=1\0SR_LIST"s, "fileLength=99999999999\0fileCRC=1"s})
        EXPECT_TRUE(uploading(header, "")->closedByPeer());
    spew(areaDir_ + "/f.txt", "content");
    auto client = connectAs("ann");
    ASSERT_TRUE(
        client->sendFrame(requestPayload("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("f.txt")}})));
    EXPECT_EQ(client->readFrame().value_or(""), "fileLength=7\0fileCRC="s + std::to_string(crc32("content")));
    ASSERT_TRUE(client->sendFrame("ERROR\0no thanks"s));
    EXPECT_TRUE(client->closedByPeer());
    expectServerStillServes();
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{"f.txt"});
}

// Every command that reads a client's document refuses one nested past the limit, with the element
// it looks for at the bottom, and stays in step.
TEST_F(Robustness, DocumentsNestedPastTheLimitAreRefusedEverywhere)
{
    const std::string tooDeep = "XML document is nested deeper than 64 levels";
    const std::string path = R"(<PATH abspath="/x"/>)";
    const std::vector<std::pair<std::pair<std::string, Values>, std::string>> cases = {
        {{"SR_EXISTS", {{"srName", "AREA"}, {"srPath", nested(63, path)}}}, "false"},
        {{"SR_EXISTS", {{"srName", "AREA"}, {"srPath", nested(64, path)}}},
         "path value is not a PATH document: " + tooDeep},
        {{"REP_ADD_REPOSITORY", {{"repositoryObject", nested(64, R"(<REPOSITORY name="r"/>)")}}},
         "repositoryObject: " + tooDeep},
        {{"REP_ADD_SERVICE", {{"serviceObject", nested(64, R"(<SERVICE name="s"/>)")}}}, "serviceObject: " + tooDeep},
        {{"SEC_ADD_USERTOKEN",
          {{"userAccountName", "admin"}, {"userTokenObject", nested(64, R"(<USERTOKEN token="t"/>)")}}},
         "\"userTokenObject\" holds no USERTOKEN element: " + tooDeep},
        {{"JOB_REQUEST",
          {{"keyword", "zeljob"},
           {"request",
            "R/w/w.zlw -XML_PARAMETER <TRANSFORMATION_REQUEST>" + nested(64, "") + "</TRANSFORMATION_REQUEST>"}}},
         "request parameters: " + tooDeep},
    };
    for (const auto& [request, expected] : cases)
        EXPECT_EQ(admin_->command(request.first, request.second).body, expected) << request.first;
    EXPECT_EQ(userOf(*admin_), "admin");

    // A document far deeper than any stack: refused without walking it, and found without recursion.
    const std::string deep = nested(1000000, "<PATH/>");
    pugi::xml_document doc;
    EXPECT_EQ(zelserverd::parseXml(deep, doc), tooDeep);
    ASSERT_TRUE(doc.load_string(deep.c_str()));
    EXPECT_STREQ(zelserverd::findElement(doc, "PATH").name(), "PATH");
}

TEST_F(Robustness, AnnouncedFrameCommitsMemoryOnlyAsItsBytesArrive)
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

TEST_F(Robustness, SurplusIdleAndStalledConnectionsAreClosed)
{
    // The administrator's connection and two more make three, the limit.
    restartWith("max_connections = 3");
    auto first = connectAs("ann");
    auto second = std::make_unique<TestClient>();
    ASSERT_TRUE(second->connect(port()));
    TestClient third;
    ASSERT_TRUE(third.connect(port()));
    WireReply refused = third.readReply();
    EXPECT_EQ(refused.status, "ERROR");
    EXPECT_EQ(refused.body, "the server has 3 connections, its limit; try again later");
    EXPECT_TRUE(third.closedByPeer());
    second.reset();
    EXPECT_TRUE(eventually([&] {
        TestClient again;
        return again.connect(port()) && again.signIn("vic", "vicpw").ok();
    }));
    EXPECT_EQ(userOf(*first), "ann");
    first.reset();

    restartWith("idle_timeout_seconds = 1\nio_timeout_seconds = 1");
    const std::string request = frame(requestPayload("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}));
    for (const std::string& sent : {""s, request.substr(0, 2), request.substr(0, 9)}) {
        TestClient client;
        ASSERT_TRUE(client.connect(port()));
        ASSERT_TRUE(sent.empty() || client.sendRaw(sent));
        EXPECT_TRUE(client.closedByPeer(10000)) << sent.size() << " bytes sent";
    }
    auto uploader = uploading("fileLength=100\0fileCRC=0"s);
    ASSERT_TRUE(uploader->sendRaw("partial"));
    EXPECT_TRUE(uploader->closedByPeer(10000));
    EXPECT_TRUE(eventually([&] { return entriesOf(areaDir_).empty(); }));
}

TEST_F(Robustness, RepeatedSignInFailuresLockTheAccountAndTheAddressForAWhile)
{
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    for (int i = 0; i < 6; ++i)
        EXPECT_EQ(client.signIn("ann", "guess").body, "Authentication Error: invalid user name or password") << i;
    for (const char* user : {"ann", "vic"})
        EXPECT_EQ(client.signIn(user, std::string(user) + "pw").body,
                  "Authentication Error: too many failed sign-ins for this account or from this address; try "
                  "again in 1 seconds");
    std::this_thread::sleep_for(std::chrono::milliseconds(1100));
    EXPECT_TRUE(client.signIn("ann", "annpw").ok());
    EXPECT_TRUE(client.signIn("vic", "vicpw").ok());
}

// Stopping ends idle and transferring connections without partial files, and does not wait for a
// client that asked for a large file and never reads it (the server blocked in a send).
TEST_F(Robustness, StopWaitsForNoOne)
{
    restartWith("io_timeout_seconds = 3600");
    spew(areaDir_ + "/big.bin", std::string(32u << 20, 'x'));
    auto idle = connectAs("vic");
    auto uploader = uploading("fileLength=1000\0fileCRC=0"s);
    ASSERT_TRUE(uploader->sendRaw(std::string(10, 'x')));
    auto reader = connectAs("ann");
    ASSERT_TRUE(
        reader->sendFrame(requestPayload("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("big.bin")}})));
    ASSERT_TRUE(reader->readFrame().has_value());
    ASSERT_TRUE(reader->sendFrame(readyAck()));
    auto start = std::chrono::steady_clock::now();
    stopServer();
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
    EXPECT_TRUE(idle->closedByPeer());
    EXPECT_TRUE(uploader->closedByPeer());
    EXPECT_EQ(entriesOf(areaDir_), std::vector<std::string>{"big.bin"});
    startServer();
    expectServerStillServes();
}

}  // namespace
}  // namespace zeltest
