// Clients that break the protocol lose their own connection and nothing else: no partial file,
// and the server keeps answering everyone.
#include <gtest/gtest.h>

#include <filesystem>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

class Hostile : public ServerFixture {
 protected:
  // Names in the area directory, temporary files included.
  std::vector<std::string> areaEntries() {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(areaDir_))
      names.push_back(entry.path().filename().string());
    return names;
  }

  void expectServerStillServes() {
    auto other = connectAs("ann");
    EXPECT_EQ(other->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body,
              "ann");
  }

  std::string uploadRequest() {
    return requestPayload("SR_UPLOAD", {{"srName", "AREA"},
                                        {"srDestPath", pathDocument("up.bin")},
                                        {"itemFileCRCCheckingEnabled", "true"}});
  }
};

TEST_F(Hostile, OversizedLengthPrefixClosesOnlyThatConnection) {
  auto bystander = connectAs("vic");
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  ASSERT_TRUE(client.sendRaw("\x7f\xff\xff\xff"s "APIVERSION=1"));
  std::optional<std::string> reply = client.readFrame();
  ASSERT_TRUE(reply);
  WireReply parts = splitReply(*reply);
  EXPECT_EQ(parts.status, "ERROR");
  EXPECT_EQ(parts.body,
            "request frame of 2147483647 bytes exceeds the limit of 65536 bytes");
  EXPECT_TRUE(client.closedByPeer());
  EXPECT_EQ(bystander->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body,
            "vic");
}

TEST_F(Hostile, FrameAtTheLimitIsStillRead) {
  auto client = connectAs("ann");
  std::string payload = requestPayload("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}});
  payload += "\0pad="s;
  payload.resize(65536, 'p');
  ASSERT_TRUE(client->sendFrame(payload));
  std::optional<std::string> reply = client->readFrame();
  ASSERT_TRUE(reply);
  EXPECT_EQ(splitReply(*reply).body, "ann");
}

TEST_F(Hostile, MalformedRequestsCloseTheConnection) {
  const std::string payloads[] = {
      "SERVER_SESSION_INIT"s,
      "APIVERSION=7\0SERVER_SESSION_INIT"s,
      "APIVERSION=1\0SERVER_SESSION_INIT\0noequals"s,
      ""s,
  };
  for (const std::string& payload : payloads) {
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    ASSERT_TRUE(client.sendFrame(payload));
    std::optional<std::string> reply = client.readFrame();
    ASSERT_TRUE(reply);
    EXPECT_EQ(splitReply(*reply).body.rfind("malformed request: ", 0), 0u);
    EXPECT_TRUE(client.closedByPeer());
  }
  expectServerStillServes();
}

TEST_F(Hostile, FrameSplitIntoPiecesIsReassembled) {
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  std::string bytes = frame(requestPayload("SERVER_SESSION_INIT",
                                           {{"userID", "ann"}, {"userPassword", "annpw"}}));
  for (std::size_t i = 0; i < bytes.size(); i += 3) ASSERT_TRUE(client.sendRaw(bytes.substr(i, 3)));
  std::optional<std::string> reply = client.readFrame();
  ASSERT_TRUE(reply);
  EXPECT_EQ(splitReply(*reply).status, "SUCCESS");
}

TEST_F(Hostile, ClientVanishingMidUploadLeavesNoFile) {
  {
    auto client = connectAs("ann");
    ASSERT_TRUE(client->sendFrame(uploadRequest()));
    ASSERT_EQ(splitReply(client->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(client->sendFrame("fileLength=100000\0fileCRC=1"s));
    ASSERT_EQ(splitReply(client->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(client->sendRaw(std::string(40000, 'x')));
  }
  // The server notices the end of the stream and discards what it had received. Once it
  // serves the next command in order on a new connection, check the directory.
  expectServerStillServes();
  for (int i = 0; i < 50 && !areaEntries().empty(); ++i) ::usleep(20000);
  EXPECT_TRUE(areaEntries().empty());
}

TEST_F(Hostile, BadFileHeaderClosesTheConnectionWithoutAFile) {
  const std::string headers[] = {
      "fileLength=abc\0fileCRC=1"s,
      "APIVERSION=1\0SR_LIST"s,
      "fileLength=99999999999\0fileCRC=1"s,
  };
  for (const std::string& header : headers) {
    auto client = connectAs("ann");
    ASSERT_TRUE(client->sendFrame(uploadRequest()));
    ASSERT_EQ(splitReply(client->readFrame().value_or("")).body, "ready_to_transfer");
    ASSERT_TRUE(client->sendFrame(header));
    EXPECT_TRUE(client->closedByPeer());
  }
  expectServerStillServes();
  EXPECT_TRUE(areaEntries().empty());
}

TEST_F(Hostile, DownloadWithoutAcknowledgementClosesTheConnection) {
  writeFile(areaDir_ + "/f.txt", "content");
  auto client = connectAs("ann");
  ASSERT_TRUE(client->sendFrame(
      requestPayload("SR_DOWNLOAD", {{"srName", "AREA"}, {"srSrcPath", pathDocument("f.txt")}})));
  std::optional<std::string> header = client->readFrame();
  ASSERT_TRUE(header);
  EXPECT_EQ(*header, "fileLength=7\0fileCRC="s + std::to_string(crc32("content")));
  ASSERT_TRUE(client->sendFrame("ERROR\0no thanks"s));
  EXPECT_TRUE(client->closedByPeer());
  expectServerStillServes();
}

TEST_F(Hostile, ManyClientsAtOnce) {
  std::vector<std::unique_ptr<TestClient>> clients;
  for (int i = 0; i < 12; ++i) clients.push_back(connectAs(i % 2 ? "ann" : "vic"));
  for (int i = 0; i < 12; ++i)
    EXPECT_EQ(clients[i]->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body,
              i % 2 ? "ann" : "vic");
}

}  // namespace
}  // namespace zeltest

namespace zeltest {
namespace {

TEST_F(Hostile, StopEndsIdleAndTransferringConnectionsWithoutPartialFiles) {
  auto idle = connectAs("vic");
  auto uploader = connectAs("ann");
  ASSERT_TRUE(uploader->sendFrame(uploadRequest()));
  ASSERT_EQ(splitReply(uploader->readFrame().value_or("")).body, "ready_to_transfer");
  ASSERT_TRUE(uploader->sendFrame("fileLength=1000\0fileCRC=0"s));
  ASSERT_EQ(splitReply(uploader->readFrame().value_or("")).body, "ready_to_transfer");
  ASSERT_TRUE(uploader->sendRaw(std::string(10, 'x')));
  stopServer();
  EXPECT_TRUE(idle->closedByPeer());
  EXPECT_TRUE(uploader->closedByPeer());
  EXPECT_TRUE(areaEntries().empty());
  startServer();
  expectServerStillServes();
}

}  // namespace
}  // namespace zeltest
