// Clients that break the protocol lose their own connection and nothing else: no partial file,
// and the server keeps answering everyone.
#include <gtest/gtest.h>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

class Hostile : public ServerFixture {
protected:
    void expectServerStillServes() { EXPECT_EQ(userOf(*connectAs("ann")), "ann"); }

    // A connection that has started an upload to "up.bin" and sent `header` for its content.
    std::unique_ptr<TestClient> uploading(const std::string& header)
    {
        auto client = connectAs("ann");
        EXPECT_TRUE(client->sendFrame(requestPayload(
            "SR_UPLOAD",
            {{"srName", "AREA"}, {"srDestPath", pathDocument("up.bin")}, {"itemFileCRCCheckingEnabled", "true"}})));
        EXPECT_EQ(splitReply(client->readFrame().value_or("")).body, "ready_to_transfer");
        EXPECT_TRUE(client->sendFrame(header));
        return client;
    }
};

TEST_F(Hostile, FramesUpToTheLimitAreReadLargerOnesCloseOnlyThatConnection)
{
    auto bystander = connectAs("vic");
    auto client = connectAs("ann");
    std::string payload = requestPayload("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}});
    payload += "\0pad="s;
    payload.resize(65536, 'p');
    ASSERT_TRUE(client->sendFrame(payload));
    EXPECT_EQ(splitReply(client->readFrame().value_or("")).body, "ann");

    for (auto [prefix, size] :
         {std::pair{"\x00\x01\x00\x01"s, "65537"}, std::pair{"\x7f\xff\xff\xff"s, "2147483647"}}) {
        TestClient greedy;
        ASSERT_TRUE(greedy.connect(port()));
        ASSERT_TRUE(greedy.sendRaw(prefix + "APIVERSION=1"));
        WireReply reply = splitReply(greedy.readFrame().value_or(""));
        EXPECT_EQ(reply.status, "ERROR");
        EXPECT_EQ(reply.body, "request frame of "s + size + " bytes exceeds the limit of 65536 bytes");
        EXPECT_TRUE(greedy.closedByPeer());
    }
    EXPECT_EQ(userOf(*bystander), "vic");
}

TEST_F(Hostile, MalformedRequestsCloseTheConnection)
{
    for (const std::string& payload :
         {""s, "SERVER_SESSION_INIT"s, "APIVERSION=7\0SERVER_SESSION_INIT"s, "APIVERSION=1"s,
          "apiversion=1\0SERVER_SESSION_INIT"s, "APIVERSION=1\0\0clientID="s,
          "APIVERSION=1\0SERVER_SESSION_INIT\0noequals"s, "APIVERSION=1\0SERVER_SESSION_INIT\0=value"s}) {
        TestClient client;
        ASSERT_TRUE(client.connect(port()));
        ASSERT_TRUE(client.sendFrame(payload));
        EXPECT_EQ(splitReply(client.readFrame().value_or("")).body.rfind("malformed request: ", 0), 0u) << payload;
        EXPECT_TRUE(client.closedByPeer());
    }
    expectServerStillServes();
}

TEST_F(Hostile, FrameSplitIntoPiecesIsReassembled)
{
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    std::string bytes = frame(requestPayload("SERVER_SESSION_INIT", {{"userID", "ann"}, {"userPassword", "annpw"}}));
    for (std::size_t i = 0; i < bytes.size(); i += 3)
        ASSERT_TRUE(client.sendRaw(bytes.substr(i, 3)));
    EXPECT_EQ(splitReply(client.readFrame().value_or("")).status, "SUCCESS");
}

TEST_F(Hostile, ClientVanishingMidUploadLeavesNoFile)
{
    {
        auto client = uploading("fileLength=100000\0fileCRC=1"s);
        ASSERT_EQ(splitReply(client->readFrame().value_or("")).body, "ready_to_transfer");
        ASSERT_TRUE(client->sendRaw(std::string(40000, 'x')));
    }
    // The server notices the end of the stream and discards what it had received.
    expectServerStillServes();
    EXPECT_TRUE(eventually([&] { return entriesOf(areaDir_).empty(); }));
}

TEST_F(Hostile, BadFileHeaderClosesTheConnectionWithoutAFile)
{
    for (const std::string& header :
         {"fileLength=abc\0fileCRC=1"s, "APIVERSION=1\0SR_LIST"s, "fileLength=99999999999\0fileCRC=1"s})
        EXPECT_TRUE(uploading(header)->closedByPeer());
    expectServerStillServes();
    EXPECT_TRUE(entriesOf(areaDir_).empty());
}

TEST_F(Hostile, DownloadWithoutAcknowledgementClosesTheConnection)
{
    writeFile(areaDir_ + "/f.txt", "content");
    auto client = connectAs("ann");
    ASSERT_TRUE(
        client->sendFrame(requestPayload("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("f.txt")}})));
    EXPECT_EQ(client->readFrame().value_or(""), "fileLength=7\0fileCRC="s + std::to_string(crc32("content")));
    ASSERT_TRUE(client->sendFrame("ERROR\0no thanks"s));
    EXPECT_TRUE(client->closedByPeer());
    expectServerStillServes();
}

TEST_F(Hostile, ManyClientsAtOnce)
{
    std::vector<std::unique_ptr<TestClient>> clients;
    for (int i = 0; i < 12; ++i)
        clients.push_back(connectAs(i % 2 ? "ann" : "vic"));
    for (int i = 0; i < 12; ++i)
        EXPECT_EQ(userOf(*clients[i]), i % 2 ? "ann" : "vic");
}

TEST_F(Hostile, StopEndsIdleAndTransferringConnectionsWithoutPartialFiles)
{
    auto idle = connectAs("vic");
    auto uploader = uploading("fileLength=1000\0fileCRC=0"s);
    ASSERT_EQ(splitReply(uploader->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(uploader->sendRaw(std::string(10, 'x')));
    stopServer();
    EXPECT_TRUE(idle->closedByPeer());
    EXPECT_TRUE(uploader->closedByPeer());
    EXPECT_TRUE(entriesOf(areaDir_).empty());
    startServer();
    expectServerStillServes();
}

}  // namespace
}  // namespace zeltest
