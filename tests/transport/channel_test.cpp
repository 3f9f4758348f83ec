// The TCP/IP channel against the scriptable fake server: sign-in, reconnects, plain commands, reply
// classification, uploads, downloads and the result-port exchange, checked byte for byte.

#include "transport/ZELServerTCPIPChannel.h"

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <zelserverapi/IZELServerIdentity.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "platform/net.h"
#include "session/ZELServerConnectionInfo.h"
#include "support/environment.h"
#include "support/fake_server.h"
#include "support/helpers.h"
#include "support/ports.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"
#include "transport/LocalFile.h"
#include "transport/TcpSocket.h"

namespace zel {
namespace {

namespace fs = std::filesystem;
using namespace std::string_literals;
using zeltest::Bytes;
using zeltest::describe;
using zeltest::FakeServer;
using zeltest::pattern;
using zeltest::ProgressLog;
using zeltest::slurp;
using zeltest::Values;

using StatusPtr = std::unique_ptr<IZELServerStatus>;
using RequestPtr = std::unique_ptr<IZELServerRequest>;
using ResponsePtr = std::unique_ptr<IZELServerResponse>;
using InfoPtr = std::unique_ptr<IZELServerConnectionInfo>;

const std::string kSessionDocument = R"(<SESSION security_enabled="true"><IDENTITY id="ann" is_authenticated="true">)"
                                     R"(<ROLES><ROLE name="admin"/><ROLE name="ops"/></ROLES></IDENTITY></SESSION>)";

// What the channel attaches to every request once the sign-in above went through; the root element
// is named after the command.
std::string identityDocument(const std::string& keyword)
{
    return R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><)" + keyword +
           R"(><IDENTITY id="ann" is_authenticated="true"><ROLES><ROLE name="admin"/><ROLE name="ops"/></ROLES></IDENTITY></)" +
           keyword + ">";
}

Bytes firstHandshake()
{
    return zeltest::request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}});
}

Bytes signedIn() { return zeltest::reply("SUCCESS", kSessionDocument); }

class ChannelTest : public ::testing::Test {
protected:
    void TearDown() override { channel.reset(); }

    InfoPtr passwordInfo(const char* user = "ann", const char* password = "pw1", std::uint16_t port = 0) const
    {
        return InfoPtr(new ZELServerConnectionInfo(ZELServerString("127.0.0.1"), port != 0 ? port : server.port(),
                                                   ZELServerString(user), ZELServerString(password)));
    }
    InfoPtr propertyInfo(std::vector<std::string> properties) const
    {
        return InfoPtr(new ZELServerConnectionInfo(ZELServerString("127.0.0.1"), server.port(),
                                                   ZELServerStringArray(std::move(properties))));
    }

    // Opens with ann / pw1; the script must begin with the first handshake.
    void open(const IZELServerStringArray* options = nullptr)
    {
        const StatusPtr status(channel->open(*passwordInfo(), options));
        ASSERT_EQ(status, nullptr) << describe(status.get());
    }

    StatusPtr plain(const std::string& keyword, const Values& values, std::string* body = nullptr)
    {
        const RequestPtr request(channel->createRequest(keyword));
        const ResponsePtr response(channel->createResponse());
        for (const auto& [name, value] : values) {
            request->addValue(name, value);
        }
        StatusPtr status(channel->sendRequest(*request, *response, kPlainRequest));
        if (body != nullptr) {
            response->getBody(*body);
        }
        return status;
    }

    // One transfer on the open channel; the body goes to `body` when given.
    StatusPtr transfer(const std::string& path, unsigned direction, ProgressLog* progress = nullptr,
                       std::string* body = nullptr)
    {
        const RequestPtr request(channel->createRequest("XFER"));
        const ResponsePtr response(channel->createResponse());
        StatusPtr status(channel->transferFile(*request, *response, path, direction, progress));
        if (body != nullptr) {
            response->getBody(*body);
        }
        return status;
    }

    std::string file(const std::string& name, const std::string& content) const
    {
        const fs::path path = dir / name;
        std::ofstream(path, std::ios::binary) << content;
        return path.string();
    }

    FakeServer server;
    std::unique_ptr<ZELServerTCPIPChannel> channel{new ZELServerTCPIPChannel()};
    const zeltest::TempDir scratch{"zel-channel"};
    const fs::path dir{scratch.path()};
};

// ---- Sign-in ----------------------------------------------------------------------------------------

TEST_F(ChannelTest, FirstHandshakeIsByteExact)
{
    server
        .expectRawBytes("\x00\x00\x00\x46"
                        "APIVERSION=1\0SERVER_SESSION_INIT\0clientID=\0userID=ann\0userPassword=pw1"s)
        .sendFrame(signedIn());
    server.start();
    open();
    EXPECT_TRUE(server.verify());

    IZELServerIdentity* identity = channel->getIdentity();
    ASSERT_NE(identity, nullptr);
    EXPECT_TRUE(identity->isAuthenticated());
    ZELServerString id;
    identity->getId(id);
    EXPECT_EQ(id.str(), "ann");
    ZELServerStringArray roles;
    identity->getRoles(roles);
    EXPECT_EQ(roles.items(), (std::vector<std::string>{"admin", "ops"}));
}

TEST_F(ChannelTest, LaterRequestCarriesTheIdentityDocumentAndTheClientId)
{
    server
        .expectFrame(zeltest::request("SERVER_SESSION_INIT",
                                      {{"clientID", "tool-7"}, {"userID", "ann"}, {"userPassword", "pw1"}}))
        .sendFrame(signedIn())
        .expectFrame(zeltest::request("SERVER_SESSION_GET_PROP",
                                      {{"identityObject", identityDocument("SERVER_SESSION_GET_PROP")},
                                       {"clientID", "tool-7"},
                                       {"sessionPropName", "version"}}))
        .sendFrame(zeltest::reply("SUCCESS", "2.1"));
    server.start();
    const ZELServerStringArray options({"IGNORED", "x", "CLIENT_ID", "tool-7"});
    open(&options);
    std::string body;
    const StatusPtr status = plain("SERVER_SESSION_GET_PROP", {{"sessionPropName", "version"}}, &body);
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(body, "2.1");
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, SignInValuesFollowTheAuthenticationKind)
{
    struct Case {
        const char* name;
        std::vector<std::string> properties;
        Values values;
    };
    const Case cases[] = {
        {"token", {"USER_TOKEN", "tok-1"}, {{"clientID", ""}, {"userToken", "tok-1"}}},
        {"single sign-on",
         {"SSO_AUTH_DATA", "sso=1", "USER_TOKEN", "ignored"},
         {{"clientID", ""}, {"ssoAuthData", "sso=1"}}},
        {"single sign-on with empty data", {"SSO_AUTH_DATA", ""}, {{"clientID", ""}, {"ssoAuthData", ""}}},
        {"other properties", {"SOMETHING", "x"}, {{"clientID", ""}, {"userID", ""}, {"userPassword", ""}}},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        FakeServer caseServer;
        caseServer.expectFrame(zeltest::request("SERVER_SESSION_INIT", c.values)).sendFrame(signedIn());
        caseServer.start();
        const InfoPtr info(new ZELServerConnectionInfo(ZELServerString("127.0.0.1"), caseServer.port(),
                                                       ZELServerStringArray(c.properties)));
        ZELServerTCPIPChannel caseChannel;
        const StatusPtr status(caseChannel.open(*info, nullptr));
        EXPECT_EQ(status, nullptr) << describe(status.get());
        EXPECT_TRUE(caseServer.verify());
    }
}

TEST_F(ChannelTest, SingleSignOnReplyReplacesTheIdentity)
{
    server.expectAnyFrame().sendFrame(zeltest::reply(
        "SUCCESS",
        R"(<SESSION><SSO_IDENTITY id="sam" is_authenticated="yes" state="IN_PROGRESS" auth_data="next"/></SESSION>)"));
    server.start();
    const StatusPtr status(channel->open(*propertyInfo({"SSO_AUTH_DATA", "first"}), nullptr));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    auto* sso = dynamic_cast<IZELServerSingleSignOnIdentity*>(channel->getIdentity());
    ASSERT_NE(sso, nullptr);
    EXPECT_EQ(sso->getState(), 1u);
    ZELServerString data;
    sso->takeAuthData(data);
    EXPECT_EQ(data.str(), "next");
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, RefusedOrUnreadableSignIn)
{
    struct Case {
        const char* name;
        Bytes reply;
        unsigned number;
        unsigned code;
    };
    const Case cases[] = {
        {"not authenticated", zeltest::reply("SUCCESS", R"(<S><IDENTITY id="ann" is_authenticated="false"/></S>)"),
         msg::kSignInRefused, 0},
        {"no identity in the reply", zeltest::reply("SUCCESS", "<S/>"), msg::kSignInRefused, 0},
        {"body is no XML", zeltest::reply("SUCCESS", "welcome"), msg::kSignInRefused, 0},
        {"server refuses", zeltest::reply("ERROR", "Authentication Error: bad password"), msg::kServerError, 1},
        {"reply without body", "SUCCESS\0"s, msg::kReplyWithoutBody, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        FakeServer caseServer;
        caseServer.expectFrame(firstHandshake()).sendFrame(c.reply);
        caseServer.start();
        ZELServerTCPIPChannel caseChannel;
        const StatusPtr status(caseChannel.open(*passwordInfo("ann", "pw1", caseServer.port()), nullptr));
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), c.number) << describe(status.get());
        EXPECT_EQ(status->getCode(), c.code) << describe(status.get());
        // Every refusal leaves an empty identity to ask, never none.
        ASSERT_NE(caseChannel.getIdentity(), nullptr);
        EXPECT_FALSE(caseChannel.getIdentity()->isAuthenticated());
        EXPECT_TRUE(caseServer.verify());
    }
}

// ---- Connection -------------------------------------------------------------------------------------

TEST_F(ChannelTest, ConnectFailureKeepsTheFailedSocketUntilTheNextOpen)
{
    const zeltest::ClosedPort closed;
    const StatusPtr failed(channel->open(*passwordInfo("ann", "pw1", closed.port()), nullptr));
    ASSERT_NE(failed, nullptr);
    EXPECT_EQ(failed->getMessageNumber(), msg::kConnectFailed);
    EXPECT_EQ(failed->getCode(), static_cast<unsigned>(SOCK_CONNECT_FAILED));
    EXPECT_EQ(channel->getIdentity(), nullptr);

    // The failed socket is replaced by the next open.
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    server.start();
    open();
    EXPECT_TRUE(server.verify());

    // A failed socket is still a socket to close.
    ZELServerTCPIPChannel other;
    EXPECT_NE(StatusPtr(other.open(*passwordInfo("ann", "pw1", closed.port()), nullptr)), nullptr);
    EXPECT_EQ(StatusPtr(other.close()), nullptr);
    const StatusPtr second(other.close());
    ASSERT_NE(second, nullptr);
    EXPECT_EQ(second->getMessageNumber(), msg::kNotConnected);
}

TEST_F(ChannelTest, ReconnectsWhenTheServerDroppedTheConnection)
{
    const Bytes secondHandshake =
        zeltest::request("SERVER_SESSION_INIT", {{"identityObject", identityDocument("SERVER_SESSION_INIT")},
                                                 {"clientID", ""},
                                                 {"userID", "ann"},
                                                 {"userPassword", "pw1"}});
    server.expectFrame(firstHandshake())
        .sendFrame(signedIn())
        .closeConnection()
        .acceptNext()
        .expectFrame(secondHandshake)
        .sendFrame(signedIn());
    server.start();
    open();
    ASSERT_TRUE(server.waitForSteps(3));
    IZELServerIdentity* before = channel->getIdentity();
    open();
    EXPECT_EQ(channel->getIdentity(), before);
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.connectionsAccepted(), 2);
}

TEST_F(ChannelTest, OpenOnALiveConnectionRepeatsOnlyTheHandshake)
{
    server.expectFrame(firstHandshake())
        .sendFrame(signedIn())
        .expectFrameWhere("a second handshake with the identity",
                          [](const Bytes& payload) {
                              const auto parsed = zeltest::parseRequest(payload);
                              return parsed && parsed->keyword == "SERVER_SESSION_INIT" && parsed->values.size() == 4 &&
                                     parsed->values[0].first == "identityObject";
                          })
        .sendFrame(signedIn());
    server.start();
    open();
    open();
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.connectionsAccepted(), 1);
}

TEST_F(ChannelTest, CloseDropsTheConnection)
{
    server.expectFrame(firstHandshake()).sendFrame(signedIn()).expectPeerClose();
    server.start();
    open();
    EXPECT_EQ(StatusPtr(channel->close()), nullptr);
    EXPECT_TRUE(server.verify());
    const StatusPtr again(channel->close());
    ASSERT_NE(again, nullptr);
    EXPECT_EQ(again->getMessageNumber(), msg::kNotConnected);
    // The identity outlives the connection.
    EXPECT_NE(channel->getIdentity(), nullptr);
}

TEST_F(ChannelTest, SendAndReceiveFailuresCarryTheSocketCode)
{
    server.expectFrame(firstHandshake()).sendFrame(signedIn()).expectAnyFrame().closeConnection();
    server.start();
    open();
    const StatusPtr received = plain("PING", {});
    ASSERT_NE(received, nullptr);
    EXPECT_EQ(received->getMessageNumber(), msg::kReceiveFailed);
    EXPECT_NE(std::string(received->getMessage()).find("392008"), std::string::npos) << describe(received.get());
    EXPECT_EQ(received->getCode(), static_cast<unsigned>(SOCK_RECEIVE_FAILED));
    EXPECT_TRUE(server.verify());

    ASSERT_EQ(StatusPtr(channel->close()), nullptr);
    const StatusPtr closed = plain("PING", {});
    ASSERT_NE(closed, nullptr);
    EXPECT_EQ(closed->getMessageNumber(), msg::kNotConnected) << describe(closed.get());
}

// ---- Plain commands and replies ---------------------------------------------------------------------

TEST_F(ChannelTest, RepliesAreClassifiedByTheirStatusWord)
{
    struct Case {
        const char* name;
        Bytes reply;
        unsigned number;  // 0: success
        unsigned code;
        std::string message;  // the text, or for the unusable replies a part of it
        std::string body;     // the response body afterwards (a new response: empty after a failure)
    };
    const Case cases[] = {
        {"success", "SUCCESS\0<R/>"s, 0, 0, "", "<R/>"},
        {"success keeps NULs in the body", "SUCCESS\0a\0b"s, 0, 0, "", "a\0b"s},
        {"success after leading NULs", "\0SUCCESS\0x"s, 0, 0, "", "x"},
        {"authorization error", "ERROR\0Authorization Error: no rights"s, msg::kServerError, 2, "no rights",
         "Authorization Error: no rights"},
        {"authentication error", "ERROR\0Authentication Error: expired"s, msg::kServerError, 1, "expired",
         "Authentication Error: expired"},
        {"prefix not at the start", "ERROR\0Sorry. Authentication Error: x"s, msg::kServerError, 0,
         "Sorry. Authentication Error: x", "Sorry. Authentication Error: x"},
        {"plain error", "ERROR\0disk full"s, msg::kServerError, 0, "disk full", "disk full"},
        {"no NUL", "SUCCESS"s, msg::kReplyWithoutBody, 0, "SUCCESS", ""},
        {"empty body", "SUCCESS\0"s, msg::kReplyWithoutBody, 0, "SUCCESS", ""},
        {"only NULs after the word", "ERROR\0\0"s, msg::kReplyWithoutBody, 0, "ERROR", ""},
        {"empty reply", ""s, msg::kReplyWithoutBody, 0, "", ""},
        {"unknown status word", "MAYBE\0later"s, msg::kUnexpectedReply, 0, "MAYBE", ""},
        {"status word in lower case", "success\0x"s, msg::kUnexpectedReply, 0, "success", ""},
    };
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    for (const Case& c : cases) {
        server
            .expectFrame(zeltest::request(
                "CMD", {{"identityObject", identityDocument("CMD")}, {"clientID", ""}, {"case", c.name}}))
            .sendFrame(c.reply);
    }
    server.start();
    open();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        std::string body = "not read";
        const StatusPtr status = plain("CMD", {{"case", c.name}}, &body);
        if (c.number == 0) {
            EXPECT_EQ(status, nullptr) << describe(status.get());
        } else {
            ASSERT_NE(status, nullptr);
            EXPECT_EQ(status->getMessageNumber(), c.number) << describe(status.get());
            EXPECT_EQ(status->getCode(), c.code) << describe(status.get());
            const std::string message = status->getMessage();
            if (c.number == msg::kServerError) {
                EXPECT_EQ(message, c.message);
            } else {
                EXPECT_NE(message.find(c.message), std::string::npos) << message;
            }
        }
        EXPECT_EQ(body, c.body) << zeltest::printable(body);
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, RequestTextThatIsNotUtf8IsSentAsUtf8FromLatin1)
{
    server.expectFrame(firstHandshake())
        .sendFrame(signedIn())
        .expectFrame(zeltest::request(
            "CMD", {{"identityObject", identityDocument("CMD")}, {"clientID", ""}, {"name", "caf\xC3\xA9"}}))
        .sendFrame(zeltest::reply("SUCCESS", "1"))
        .expectFrame(zeltest::request(
            "CMD", {{"identityObject", identityDocument("CMD")}, {"clientID", ""}, {"name", "caf\xC3\xA9"}}))
        .sendFrame(zeltest::reply("SUCCESS", "2"));
    server.start();
    open();
    EXPECT_EQ(plain("CMD", {{"name", "caf\xE9"}}), nullptr);
    EXPECT_EQ(plain("CMD", {{"name", "caf\xC3\xA9"}}), nullptr);
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, RefusedArgumentsSendNothing)
{
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    server.start();
    open();
    const RequestPtr request(channel->createRequest("CMD"));
    const ResponsePtr response(channel->createResponse());

    const StatusPtr type(channel->sendRequest(*request, *response, 3));
    ASSERT_NE(type, nullptr);
    EXPECT_EQ(type->getMessageNumber(), msg::kServerError);
    EXPECT_STREQ(type->getMessage(), "Unknown request type");

    const std::string path = file("f", "x");
    const StatusPtr direction(channel->transferFile(*request, *response, path, 2, nullptr));
    ASSERT_NE(direction, nullptr);
    EXPECT_EQ(direction->getMessageNumber(), msg::kServerError);
    EXPECT_STREQ(direction->getMessage(), "Invalid transfer direction");

    LocalFile upload(path, LocalFile::Mode::Read);
    LocalFile download((dir / "g").string(), LocalFile::Mode::Write);
    const StatusPtr both(channel->exchange(*request, *response, &upload, &download, nullptr));
    ASSERT_NE(both, nullptr);
    EXPECT_EQ(both->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(both->getCode(), 0u);
    EXPECT_STREQ(both->getMessage(), "Invalid arguments to method.");

    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);
}

// ---- Uploads ----------------------------------------------------------------------------------------

TEST_F(ChannelTest, UploadSendsHeaderAndContentBetweenTwoAcknowledgements)
{
    const struct {
        std::size_t size;
        std::vector<std::string> progress;
    } cases[] = {
        {13, {"total 13", "start", "at 0", "finish"}},
        {0, {"total 0", "start", "finish"}},
        {300000, {"total 300000", "start", "at 0", "at 131072", "at 262144", "finish"}},
    };
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    for (const auto& c : cases) {
        const std::string content = pattern(c.size);
        server.expectFrame(zeltest::request("XFER", {{"identityObject", identityDocument("XFER")}, {"clientID", ""}}))
            .sendFrame(zeltest::readyAck())
            .expectFrame("fileLength=" + std::to_string(c.size) + "\0fileCRC="s +
                         std::to_string(zeltest::crc32(content)))
            .sendFrame(zeltest::readyAck());
        if (c.size > 0) {
            server.expectRawBytes(content);
        }
        server.sendFrame(zeltest::reply("SUCCESS", "stored"));
    }
    server.start();
    open();
    for (const auto& c : cases) {
        ProgressLog progress;
        std::string body;
        const StatusPtr status = transfer(file("up", pattern(c.size)), kUpload, &progress, &body);
        EXPECT_EQ(status, nullptr) << describe(status.get());
        EXPECT_EQ(body, "stored");
        EXPECT_EQ(progress.calls, c.progress);
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, UploadStopsAtARefusedAcknowledgement)
{
    struct Case {
        const char* name;
        bool atSecond;
        Bytes answer;
        unsigned number;
        unsigned code;
    };
    const Case cases[] = {
        {"first refused", false, "ERROR\0Authorization Error: read only"s, msg::kServerError, 2},
        {"first not ready", false, "SUCCESS\0later"s, msg::kServerError, 0},
        {"second without NUL", true, "SUCCESS"s, msg::kReplyWithoutBody, 0},
        {"second refused", true, "ERROR\0quota"s, msg::kServerError, 0},
    };
    const std::string path = file("f", "data");
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        FakeServer caseServer;
        caseServer.expectFrame(firstHandshake()).sendFrame(signedIn()).expectAnyFrame();
        if (c.atSecond) {
            caseServer.sendFrame(zeltest::readyAck()).expectFrame(zeltest::fileHeader(4, zeltest::crc32("data")));
        }
        caseServer.sendFrame(c.answer);
        caseServer.start();
        ZELServerTCPIPChannel caseChannel;
        ASSERT_EQ(StatusPtr(caseChannel.open(*passwordInfo("ann", "pw1", caseServer.port()), nullptr)), nullptr);
        const RequestPtr request(caseChannel.createRequest("UP"));
        const ResponsePtr response(caseChannel.createResponse());
        const StatusPtr status(caseChannel.transferFile(*request, *response, path, kUpload, nullptr));
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), c.number) << describe(status.get());
        EXPECT_EQ(status->getCode(), c.code) << describe(status.get());
        EXPECT_TRUE(caseServer.verify());
    }
}

TEST_F(ChannelTest, LocalFileProblemsSendNothing)
{
    const std::string huge = file("huge", "");
    std::error_code error;
    fs::resize_file(huge, std::uint64_t{1} << 32, error);  // 4 GiB do not fit the header
    const struct {
        std::string path;
        unsigned direction;
        unsigned number;
    } cases[] = {
        {(dir / "missing").string(), kUpload, msg::kLocalFileRead},
        {dir.string(), kUpload, msg::kLocalFileRead},
        {error ? (dir / "missing").string() : huge, kUpload, msg::kLocalFileRead},
        {(dir / "no" / "such" / "dir" / "f").string(), kDownload, msg::kLocalFileWrite},
    };
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    server.start();
    open();
    for (const auto& c : cases) {
        ProgressLog progress;
        const StatusPtr status = transfer(c.path, c.direction, &progress);
        ASSERT_NE(status, nullptr) << c.path;
        EXPECT_EQ(status->getMessageNumber(), c.number) << describe(status.get());
        EXPECT_NE(std::string(status->getMessage()).find(c.path), std::string::npos) << describe(status.get());
        EXPECT_TRUE(progress.calls.empty());
    }
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);
}

// ---- Downloads --------------------------------------------------------------------------------------

TEST_F(ChannelTest, DownloadReceivesTheFileBetweenTwoAcknowledgements)
{
    const struct {
        Bytes header;  // the announced checksum is not checked; the prefixes are cut by length only
        std::string content;
        std::vector<std::string> progress;
    } cases[] = {
        {zeltest::fileHeader(300000, zeltest::crc32(pattern(300000))),
         pattern(300000),
         {"total 300000", "start", "at 0", "at 131072", "at 262144", "finish"}},
        {"size_bytes:0x3\0fileCRC=12345"s, "abc", {"total 3", "start", "at 0", "finish"}},
        {zeltest::fileHeader(0, 0), "", {"total 0", "start", "finish"}},
    };
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    for (const auto& c : cases) {
        server.expectFrame(zeltest::request("XFER", {{"identityObject", identityDocument("XFER")}, {"clientID", ""}}))
            .sendFrame(c.header)
            .expectFrame(zeltest::readyAck());
        if (!c.content.empty()) {
            server.sendRaw(c.content);
        }
        server.expectFrame(zeltest::readyAck()).sendFrame(zeltest::reply("SUCCESS", "true"));
    }
    server.start();
    open();
    for (const auto& c : cases) {
        const std::string path = file("down", "old content");
        ProgressLog progress;
        std::string body;
        const StatusPtr status = transfer(path, kDownload, &progress, &body);
        EXPECT_EQ(status, nullptr) << describe(status.get());
        EXPECT_EQ(body, "true");
        EXPECT_EQ(slurp(path), c.content);
        EXPECT_EQ(progress.calls, c.progress);
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, DownloadWithoutAFileGivesFalseAndReadsNothingMore)
{
    const std::string path = (dir / "down").string();
    server.expectFrame(firstHandshake())
        .sendFrame(signedIn())
        .expectAnyFrame()
        .sendFrame(zeltest::reply("SUCCESS", "nothing to send"))
        // The connection is still in step for the next command.
        .expectFrame(zeltest::request("NEXT", {{"identityObject", identityDocument("NEXT")}, {"clientID", ""}}))
        .sendFrame(zeltest::reply("SUCCESS", "fine"));
    server.start();
    open();
    ProgressLog progress;
    std::string body;
    const StatusPtr status = transfer(path, kDownload, &progress, &body);
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(body, "false");
    EXPECT_TRUE(progress.calls.empty());
    std::string next;
    EXPECT_EQ(plain("NEXT", {}, &next), nullptr);
    EXPECT_EQ(next, "fine");
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, DownloadHeaderWithoutTwoPartsIsAnUnusableReply)
{
    server.expectFrame(firstHandshake()).sendFrame(signedIn()).expectAnyFrame().sendFrame("fileLength=3"s);
    server.start();
    open();
    const StatusPtr status = transfer((dir / "d").string(), kDownload);
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kReplyWithoutBody);
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, DownloadThatFailsToWriteStillReadsEverythingThenReports)
{
    // Only POSIX systems have a device that takes the open but refuses every write; Windows has no
    // file that fails mid-stream on demand.
    if (!fs::exists("/dev/full")) {
        GTEST_SKIP() << "no /dev/full here";
    }
    const std::string content = pattern(300000);
    server.expectFrame(firstHandshake())
        .sendFrame(signedIn())
        .expectAnyFrame()
        .sendFrame(zeltest::fileHeader(content.size(), 0))
        .expectFrame(zeltest::readyAck())
        .sendRaw(content)
        .expectFrame(zeltest::readyAck())
        .sendFrame(zeltest::reply("SUCCESS", "true"))
        .expectAnyFrame()
        .sendFrame(zeltest::reply("SUCCESS", "still in step"));
    server.start();
    open();
    const StatusPtr status = transfer("/dev/full", kDownload);
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kLocalFileWrite) << describe(status.get());
    std::string next;
    EXPECT_EQ(plain("NEXT", {}, &next), nullptr);
    EXPECT_EQ(next, "still in step");
    EXPECT_TRUE(server.verify());
}

// ---- Result port ------------------------------------------------------------------------------------

std::string localAddress()
{
    TcpSocket probe("127.0.0.1", 9);  // only for its localHostAddress; the connect may fail
    char text[50] = {};
    probe.localHostAddress(text, sizeof text);
    return text;
}

// The values of a result-port request after the identity: the client id, the bound port, this
// machine's address, then `rest`. The bound port is returned through `port`.
FakeServer::Predicate resultPortRequest(Values rest, std::string* port = nullptr)
{
    return [rest, port](const Bytes& payload) {
        const auto parsed = zeltest::parseRequest(payload);
        if (!parsed || parsed->keyword != "JOB" || parsed->values.size() != 4 + rest.size()) {
            return false;
        }
        const Values& v = parsed->values;
        if (v[0].first != "identityObject" || v[1] != std::make_pair(std::string("clientID"), std::string()) ||
            v[2].first != "requesterResultPort" || v[2].second.empty() ||
            v[3] != std::make_pair(std::string("requesterHost"), localAddress())) {
            return false;
        }
        if (port != nullptr) {
            *port = v[2].second;
        }
        return Values(v.begin() + 4, v.end()) == rest;
    };
}

TEST_F(ChannelTest, ResultPortExchangeTakesTheResultFromTheServersCall)
{
    const std::string wanted = std::to_string(zeltest::releasedPort());
    const struct {
        const char* name;
        std::vector<std::string> directives;
        std::vector<std::string> notifications;
        Values rest;        // after the bound port and this machine's address
        std::string bound;  // the port listened on; empty: any but 0
    } cases[] = {
        {"directives and notifications",
         {"tag", "x", "odd"},
         {"SUCCESS_TOPIC", "done", "FAILURE_TOPIC", "failed"},
         {{"tag", "x"}, {"notificationMsg", "SUCCESS_TOPIC:done"}, {"notificationMsg", "FAILURE_TOPIC:failed"}},
         ""},
        {"the caller's port 0 is sent again behind the bound one",
         {"requesterResultPort", "0", "tag", "y"},
         {},
         {{"requesterResultPort", "0"}, {"tag", "y"}},
         ""},
        {"a requested port is listened on",
         {"requesterResultPort", wanted},
         {},
         {{"requesterResultPort", wanted}},
         wanted},
    };
    const Bytes result = "<RESULT id=\"7\"/>\0tail"s;
    std::string bound[std::size(cases)];
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    for (std::size_t i = 0; i < std::size(cases); ++i) {
        server.expectFrameWhere(cases[i].name, resultPortRequest(cases[i].rest, &bound[i]))
            .sendFrame(zeltest::reply("SUCCESS", "queued"))
            .connectBackAndSend(result);
    }
    server.start();
    open();
    for (std::size_t i = 0; i < std::size(cases); ++i) {
        SCOPED_TRACE(cases[i].name);
        const RequestPtr request(channel->createRequest("JOB", ZELServerStringArray(cases[i].directives),
                                                        ZELServerStringArray(cases[i].notifications)));
        const ResponsePtr response(channel->createResponse());
        const StatusPtr status(channel->sendRequest(*request, *response, kResultPortRequest));
        EXPECT_EQ(status, nullptr) << describe(status.get());
        std::string body;
        response->getBody(body);
        EXPECT_EQ(body, result) << zeltest::printable(body);
    }
    EXPECT_TRUE(server.verify());
    for (std::size_t i = 0; i < std::size(cases); ++i) {
        EXPECT_TRUE(cases[i].bound.empty() ? bound[i] != "0" : bound[i] == cases[i].bound) << bound[i];
    }
}

TEST_F(ChannelTest, ResultPortCallersOutsideTheTrustedListAreSkipped)
{
    // "localhost" in the list stands for this machine's own name.
    const std::string name = platform::localHostName(296);
    const std::vector<platform::Ipv4Address> addresses =
        name.empty() ? std::vector<platform::Ipv4Address>{} : platform::resolveIPv4(name.c_str());
    const std::string own = addresses.empty() ? "127.0.0.2" : platform::dottedAddress(addresses.front());
    const struct {
        const char* trusted;
        std::string from;
    } cases[] = {{"10.255.255.1  127.0.0.1", "127.0.0.1"}, {"localhost", own}};
    for (const auto& c : cases) {
        if (c.from == "127.0.0.2") {
            continue;  // this machine's name does not resolve to a usable address
        }
        SCOPED_TRACE(c.trusted);
        FakeServer caseServer;
        caseServer.expectFrame(firstHandshake())
            .sendFrame(signedIn())
            .expectAnyFrame()
            .sendFrame(zeltest::reply("SUCCESS", "queued"))
            .connectBackFromAndSend("127.0.0.2", "from a stranger")
            .connectBackFromAndSend(c.from, "trusted");
        caseServer.start();
        ZELServerTCPIPChannel caseChannel;
        const ZELServerStringArray options({"TRUSTED_HOST_NAMES", c.trusted});
        ASSERT_EQ(StatusPtr(caseChannel.open(*passwordInfo("ann", "pw1", caseServer.port()), &options)), nullptr);
        const RequestPtr request(caseChannel.createRequest("JOB", ZELServerStringArray(), ZELServerStringArray()));
        const ResponsePtr response(caseChannel.createResponse());
        const StatusPtr status(caseChannel.sendRequest(*request, *response, kResultPortRequest));
        EXPECT_EQ(status, nullptr) << describe(status.get());
        std::string body;
        response->getBody(body);
        EXPECT_EQ(body, "trusted");
        EXPECT_TRUE(caseServer.verify());
    }
}

TEST_F(ChannelTest, ResultPortServerErrorEndsTheExchangeBeforeAnyCall)
{
    server.expectFrame(firstHandshake())
        .sendFrame(signedIn())
        .expectAnyFrame()
        .sendFrame(zeltest::reply("ERROR", "Authorization Error: no jobs for you"));
    server.start();
    open();
    const RequestPtr request(channel->createRequest("JOB", ZELServerStringArray(), ZELServerStringArray()));
    const ResponsePtr response(channel->createResponse());
    const StatusPtr status(channel->sendRequest(*request, *response, kResultPortRequest));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 2u);
    EXPECT_STREQ(status->getMessage(), "no jobs for you");
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, ResultPortThatCannotBeOpenedSendsNothing)
{
    // A port another socket listens on cannot be bound again.
    std::uint16_t busyPort = 0;
    TcpSocket busy(busyPort);
    ASSERT_EQ(busy.errorCode, 0);
    server.expectFrame(firstHandshake()).sendFrame(signedIn());
    server.start();
    open();
    struct Case {
        std::string port;
        unsigned number;
    };
    const Case cases[] = {
        {std::to_string(busyPort), msg::kResultPortAcceptFailed},
        {"not a port", msg::kInvalidArgument},
        {"65536", msg::kInvalidArgument},
        {"-1", msg::kInvalidArgument},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.port);
        const RequestPtr request(channel->createRequest("JOB", ZELServerStringArray({"requesterResultPort", c.port}),
                                                        ZELServerStringArray()));
        const ResponsePtr response(channel->createResponse());
        const StatusPtr status(channel->sendRequest(*request, *response, kResultPortRequest));
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), c.number) << describe(status.get());
    }
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);
}

}  // namespace
}  // namespace zel
