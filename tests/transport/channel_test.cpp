// The TCP/IP channel against the scriptable fake server: sign-in, reconnects, reply classification,
// uploads, downloads and the result-port exchange, byte for byte.

#include "transport/ZELServerTCPIPChannel.h"

#include <cstdint>
#include <filesystem>
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
#include "support/sockets.h"
#include "support/wire_table.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"
#include "transport/TcpSocket.h"

namespace zeltest {
namespace {

namespace fs = std::filesystem;
using namespace std::string_literals;
using namespace zel;
using RequestPtr = std::unique_ptr<IZELServerRequest>;
using ResponsePtr = std::unique_ptr<IZELServerResponse>;
using Strings = std::vector<std::string>;
using namespace zel::msg;

// Success for number 0, else that message number (and code, when given).
::testing::AssertionResult gives(const StatusPtr& status, unsigned number, std::optional<unsigned> code = {})
{
    const unsigned actual = status ? status->getMessageNumber() : 0;
    if (actual == number && (!code || !status || status->getCode() == *code)) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "got " << describe(status.get());
}

// Signed in by the fixture's script (SetUp) unless a test runs a server of its own.
class ChannelTest : public SignedInChannelTest {
protected:
    // ann / pw1 without properties; otherwise only the properties.
    static StatusPtr openOn(ZELServerTCPIPChannel& channel, std::uint16_t port, const Strings& properties = {},
                            const Strings& options = {})
    {
        const ZELServerString host("localhost");  // connecting by name
        const std::unique_ptr<IZELServerConnectionInfo> info(
            properties.empty() ? new ZELServerConnectionInfo(host, port, ZELServerString("ann"), ZELServerString("pw1"))
                               : new ZELServerConnectionInfo(host, port, ZELServerStringArray(properties)));
        const ZELServerStringArray optionList(options);
        return StatusPtr(channel.open(*info, options.empty() ? nullptr : &optionList));
    }

    static StatusPtr withBody(IZELServerStatus* status, IZELServerResponse& response, std::string* body)
    {
        if (body != nullptr) {
            response.getBody(*body);
        }
        return StatusPtr(status);
    }

    StatusPtr plain(const std::string& keyword, const Values& values = {}, std::string* body = nullptr)
    {
        const RequestPtr request(channel->createRequest(keyword));
        const ResponsePtr response(channel->createResponse());
        for (const auto& [name, value] : values) {
            request->addValue(name, value);
        }
        return withBody(channel->sendRequest(*request, *response, kPlainRequest), *response, body);
    }

    StatusPtr transfer(const std::string& path, unsigned direction, ProgressLog* progress = nullptr,
                       std::string* body = nullptr)
    {
        const RequestPtr request(channel->createRequest("XFER"));
        const ResponsePtr response(channel->createResponse());
        return withBody(channel->transferFile(*request, *response, path, direction, progress), *response, body);
    }

    StatusPtr resultPort(const Strings& directives, std::string* body = nullptr)
    {
        const RequestPtr request(
            channel->createRequest("JOB", ZELServerStringArray(directives), ZELServerStringArray()));
        const ResponsePtr response(channel->createResponse());
        return withBody(channel->sendRequest(*request, *response, kResultPortRequest), *response, body);
    }
};

// ---- Sign-in and connection -------------------------------------------------------------------------

// The first handshake on the wire as it is, byte for byte; later requests carry the identity with its
// roles and the client identifier, and a second open on the live connection repeats the handshake
// with them, keeping the identity object.
TEST_F(ChannelTest, HandshakesAreByteExactAndLaterRequestsCarryIdentityAndClientId)
{
    const std::string identity =
        R"(<IDENTITY id="ann" is_authenticated="true"><ROLES><ROLE name="admin"/><ROLE name="ops"/></ROLES></IDENTITY>)";
    const Bytes welcome = reply("SUCCESS", "<SESSION>" + identity + "</SESSION>");
    const auto signedIn = [&](const std::string& keyword, Values values) {
        values.insert(values.begin(), {{"identityObject", xmlDocument(keyword, identity)}, {"clientID", "tool-7"}});
        return request(keyword, values);
    };
    FakeServer first;
    first
        .expectRaw("\x00\x00\x00\x4C"
                   "APIVERSION=1\0SERVER_SESSION_INIT\0clientID=tool-7\0userID=ann\0userPassword=pw1"s)
        .sendFrame(welcome)
        .exchange(signedIn("SERVER_SESSION_GET_PROP", {{"sessionPropName", "version"}}), reply("SUCCESS", "2.1"))
        .exchange(signedIn("SERVER_SESSION_INIT", {{"userID", "ann"}, {"userPassword", "pw1"}}), welcome)
        .start();
    ASSERT_TRUE(gives(openOn(*channel, first.port(), {}, {"IGNORED", "x", "CLIENT_ID", "tool-7"}), 0));
    std::string body;
    EXPECT_TRUE(gives(plain("SERVER_SESSION_GET_PROP", {{"sessionPropName", "version"}}, &body), 0));
    EXPECT_EQ(body, "2.1");
    ZELServerStringArray roles;
    IZELServerIdentity* const before = channel->getIdentity();
    before->getRoles(roles);
    EXPECT_EQ(roles.items(), (Strings{"admin", "ops"}));
    EXPECT_TRUE(gives(openOn(*channel, first.port(), {}, {"CLIENT_ID", "tool-7"}), 0));
    EXPECT_EQ(channel->getIdentity(), before);
    EXPECT_TRUE(first.verify());
}

TEST_F(ChannelTest, SignInValuesFollowTheAuthenticationKindAndRefusalsLeaveAnEmptyIdentity)
{
    const Values password{{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}};
    const Bytes sso =
        reply("SUCCESS", R"(<S><SSO_IDENTITY id="sam" is_authenticated="true" state="IN_PROGRESS"/></S>)");
    const struct {
        Strings properties;  // none: ann / pw1
        Values values;
        Bytes answer;
        unsigned number;
        unsigned code;
    } cases[] = {
        {{"SSO_AUTH_DATA", "s=1", "USER_TOKEN", "no"}, {{"clientID", ""}, {"ssoAuthData", "s=1"}}, sso, 0, 0},
        {{"SOMETHING", "x"}, {{"clientID", ""}, {"userID", ""}, {"userPassword", ""}}, kSignedIn, 0, 0},
        {{}, password, reply("SUCCESS", R"(<S><IDENTITY id="a" is_authenticated="false"/></S>)"), kSignInRefused, 0},
        {{}, password, reply("SUCCESS", "<S/>"), kSignInRefused, 0},
        {{}, password, reply("SUCCESS", "welcome"), kSignInRefused, 0},
        {{}, password, reply("ERROR", "Authentication Error: no"), kServerError, 1},
        {{}, password, "SUCCESS\0"s, kReplyWithoutBody, 0},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(printable(c.answer));
        FakeServer caseServer;
        caseServer.exchange(request("SERVER_SESSION_INIT", c.values), c.answer).start();
        ZELServerTCPIPChannel caseChannel;
        EXPECT_TRUE(gives(openOn(caseChannel, caseServer.port(), c.properties), c.number, c.code));
        ASSERT_NE(caseChannel.getIdentity(), nullptr);
        EXPECT_EQ(caseChannel.getIdentity()->isAuthenticated(), c.number == 0);
        EXPECT_EQ(dynamic_cast<IZELServerSingleSignOnIdentity*>(caseChannel.getIdentity()) != nullptr, c.answer == sso);
        EXPECT_TRUE(caseServer.verify());
    }
}

TEST_F(ChannelTest, ConnectFailureThenCloseAndFailuresOfAnOpenConnection)
{
    const ClosedPort closed;
    EXPECT_TRUE(gives(openOn(*channel, closed.port()), kConnectFailed, SOCK_CONNECT_FAILED));
    EXPECT_EQ(channel->getIdentity(), nullptr);

    // The failed socket is replaced by the next open; close hangs up.
    server.expectPeerClose();
    signIn();
    EXPECT_TRUE(gives(StatusPtr(channel->close()), 0));
    EXPECT_TRUE(server.verify());
    EXPECT_TRUE(gives(plain("PING"), kNotConnected));
    // The identity outlives the connection.
    EXPECT_NE(channel->getIdentity(), nullptr);

    // A failed socket is still a socket to close, once.
    EXPECT_TRUE(gives(openOn(*channel, closed.port()), kConnectFailed));
    EXPECT_TRUE(gives(StatusPtr(channel->close()), 0));
    EXPECT_TRUE(gives(StatusPtr(channel->close()), kNotConnected));
}

// ---- Plain commands and replies ---------------------------------------------------------------------

TEST_F(ChannelTest, RepliesAreClassifiedByTheirStatusWord)
{
    const struct {
        const char* name;
        Bytes answer;
        unsigned number;
        unsigned code;
        std::string message;  // for the unusable replies a part of it
        std::string body;     // the response body afterwards: empty after a failure
    } cases[] = {
        {"success", "SUCCESS\0a\0b"s, 0, 0, "", "a\0b"s},
        {"authorization error", "ERROR\0Authorization Error: no rights"s, kServerError, 2, "no rights",
         "Authorization Error: no rights"},
        {"no NUL", "SUCCESS"s, kReplyWithoutBody, 0, "SUCCESS", ""},
        {"unknown status word", "success\0x"s, kUnexpectedReply, 0, "success", ""},
    };
    for (const auto& c : cases) {
        server.exchange(command("CMD", {{"case", c.name}}), c.answer);
    }
    signIn();
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        std::string body = "not read";
        const StatusPtr status = plain("CMD", {{"case", c.name}}, &body);
        EXPECT_TRUE(gives(status, c.number, c.code));
        if (status != nullptr) {
            const std::string message = status->getMessage();
            EXPECT_TRUE(c.number == kServerError ? message == c.message : message.find(c.message) != std::string::npos)
                << message;
        }
        EXPECT_EQ(body, c.body) << printable(body);
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, RequestTextThatIsNotUtf8IsSentAsUtf8FromLatin1)
{
    server.exchange(command("CMD", {{"name", "caf\xC3\xA9"}}), reply("SUCCESS", "1"))
        .exchange(command("CMD", {{"name", "caf\xC3\xA9"}}), reply("SUCCESS", "2"));
    signIn();
    EXPECT_TRUE(gives(plain("CMD", {{"name", "caf\xE9"}}), 0));
    EXPECT_TRUE(gives(plain("CMD", {{"name", "caf\xC3\xA9"}}), 0));
    EXPECT_TRUE(server.verify());
}

// ---- Uploads ----------------------------------------------------------------------------------------

TEST_F(ChannelTest, UploadSendsHeaderAndContentBetweenTwoAcknowledgements)
{
    const struct {
        std::size_t size;
        Strings progress;
    } cases[] = {
        {0, {"total 0", "start", "finish"}},
        {300000, {"total 300000", "start", "at 0", "at 131072", "at 262144", "finish"}},
    };
    for (const auto& c : cases) {
        const std::string content = pattern(c.size);
        server.exchange(command("XFER"), readyAck()).exchange(fileHeader(c.size, crc32(content)), readyAck());
        if (c.size > 0) {
            server.expectRaw(content);
        }
        server.sendFrame(reply("SUCCESS", "stored"));
    }
    signIn();
    for (const auto& c : cases) {
        ProgressLog progress;
        std::string body;
        EXPECT_TRUE(gives(transfer(file("up", pattern(c.size)), kUpload, &progress, &body), 0));
        EXPECT_EQ(body, "stored");
        EXPECT_EQ(progress.calls, c.progress);
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, UploadStopsAtARefusedAcknowledgementAndStaysInStep)
{
    const struct {
        bool atSecond;
        Bytes answer;
        unsigned number;
        unsigned code;
    } cases[] = {
        {false, "ERROR\0Authorization Error: read only"s, kServerError, 2},
        {false, "SUCCESS\0later"s, kServerError, 0},
        {true, "SUCCESS"s, kReplyWithoutBody, 0},
        {true, "ERROR\0quota"s, kServerError, 0},
    };
    for (const auto& c : cases) {
        server.expectFrame(command("XFER"));
        if (c.atSecond) {
            server.sendFrame(readyAck()).expectFrame(fileHeader(4, crc32("data")));
        }
        server.sendFrame(c.answer);
    }
    signIn();
    const std::string path = file("f", "data");
    for (const auto& c : cases) {
        EXPECT_TRUE(gives(transfer(path, kUpload), c.number, c.code)) << printable(c.answer);
    }
    EXPECT_TRUE(server.verify());
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
        {(dir / "missing").string(), kUpload, kLocalFileRead},
        {error ? (dir / "missing").string() : huge, kUpload, kLocalFileRead},
        {(dir / "no" / "such" / "dir" / "f").string(), kDownload, kLocalFileWrite},
    };
    signIn();
    for (const auto& c : cases) {
        ProgressLog progress;
        const StatusPtr status = transfer(c.path, c.direction, &progress);
        EXPECT_TRUE(gives(status, c.number));
        EXPECT_NE(std::string(status->getMessage()).find(c.path), std::string::npos) << describe(status.get());
        EXPECT_TRUE(progress.calls.empty());
    }
    EXPECT_TRUE(server.verify());
}

// ---- Downloads --------------------------------------------------------------------------------------

// The file arrives beside the destination and replaces it only when it came whole and the exchange
// succeeded; a failure leaves what the destination held, no temporary file stays, and the connection
// stays in step for the next row.
TEST_F(ChannelTest, DownloadReplacesTheDestinationOnlyAfterAWholeSuccessfulExchange)
{
    const struct {
        const char* name;
        Bytes first;  // the answer to the command
        Bytes last;   // after the content, when `first` offers a file
        unsigned number;
        const char* content;  // what the destination holds afterwards
        std::string body;
        Strings progress;
    } cases[] = {
        {"no file", reply("SUCCESS", "nothing to send"), "", 0, "old", "false", {}},
        {"refused after the file",
         fileHeader(5, crc32("fresh")),
         reply("ERROR", "disk full"),
         kServerError,
         "old",
         "disk full",
         {"total 5", "start", "at 0", "finish"}},
        {"complete",
         fileHeader(5, crc32("fresh")),
         reply("SUCCESS", "true"),
         0,
         "fresh",
         "true",
         {"total 5", "start", "at 0", "finish"}},
        {"unusable header", "fileLength=3"s, "", kReplyWithoutBody, "old", "", {}},
    };
    for (const auto& c : cases) {
        server.exchange(command("XFER"), c.first);
        if (!c.last.empty()) {
            server.expectFrame(readyAck()).sendRaw("fresh").exchange(readyAck(), c.last);
        }
    }
    signIn();
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string destination = file("kept", "old");
        ProgressLog progress;
        std::string body = "not read";
        EXPECT_TRUE(gives(transfer(destination, kDownload, &progress, &body), c.number));
        EXPECT_EQ(slurp(destination), c.content);
        EXPECT_EQ(std::distance(fs::directory_iterator(dir), {}), 1) << "no temporary file";
        EXPECT_EQ(body, c.body);
        EXPECT_EQ(progress.calls, c.progress);
    }
    EXPECT_TRUE(server.verify());
}

// ---- Result port ------------------------------------------------------------------------------------

// The bound port and this machine's address lead the values; a port the caller names is the one
// listened on, and is sent again behind them.
TEST_F(ChannelTest, ResultPortListensWhereAskedAndTakesTheResultFromTheServersCall)
{
    const std::string wanted = std::to_string(releasedPort());
    TcpSocket probe("127.0.0.1", 9);  // only for its localHostAddress; the connect may fail
    char host[50] = {};
    probe.localHostAddress(host, sizeof host);
    const Bytes result = "<RESULT id=\"7\"/>\0tail"s;
    server
        .exchange(command("JOB", {{"requesterResultPort", wanted},
                                  {"requesterHost", host},
                                  {"requesterResultPort", wanted},
                                  {"tag", "x"}}),
                  reply("SUCCESS", "queued"))
        .connectBackAndSend(result);
    signIn();
    std::string body;
    EXPECT_TRUE(gives(resultPort({"requesterResultPort", wanted, "tag", "x"}, &body), 0));
    EXPECT_EQ(body, result) << printable(body);
    EXPECT_TRUE(server.verify());
}

TEST_F(ChannelTest, ResultPortCallersOutsideTheTrustedListAreSkipped)
{
    // "localhost" in the list stands for this machine's own name.
    const std::string name = platform::localHostName(296);
    const std::vector<platform::Ipv4Address> addresses =
        name.empty() ? std::vector<platform::Ipv4Address>{} : platform::resolveIPv4(name.c_str());
    const std::string own = addresses.empty() ? "" : platform::dottedAddress(addresses.front());
    const struct {
        const char* trusted;
        std::string from;
    } cases[] = {{"10.255.255.1  127.0.0.1", "127.0.0.1"}, {"localhost", own}};
    for (const auto& c : cases) {
        if (c.from.empty() || c.from == "127.0.0.2") {
            continue;  // this machine's name does not resolve to a usable address
        }
        SCOPED_TRACE(c.trusted);
        FakeServer caseServer;
        caseServer.exchange(kHandshake, kSignedIn)
            .expectAnyFrame()
            .sendFrame(reply("SUCCESS", "queued"))
            .connectBackAndSend("from a stranger", "127.0.0.2")
            .connectBackAndSend("trusted", c.from)
            .start();
        channel.reset(new ZELServerTCPIPChannel());
        ASSERT_TRUE(gives(openOn(*channel, caseServer.port(), {}, {"TRUSTED_HOST_NAMES", c.trusted}), 0));
        std::string body;
        EXPECT_TRUE(gives(resultPort({}, &body), 0));
        EXPECT_EQ(body, "trusted");
        EXPECT_TRUE(caseServer.verify());
    }
}

TEST_F(ChannelTest, ResultPortThatCannotBeOpenedSendsNothing)
{
    // A port another socket listens on cannot be bound again.
    std::uint16_t busyPort = 0;
    TcpSocket busy(busyPort);
    ASSERT_EQ(busy.errorCode, 0);
    signIn();
    const struct {
        std::string port;
        unsigned number;
    } cases[] = {
        {std::to_string(busyPort), kResultPortAcceptFailed},
        {"not a port", kInvalidArgument},
        {"65536", kInvalidArgument},
    };
    for (const auto& c : cases) {
        EXPECT_TRUE(gives(resultPort({"requesterResultPort", c.port}), c.number)) << c.port;
    }
    EXPECT_TRUE(server.verify());
}

// ---- Time-outs --------------------------------------------------------------------------------------

// A server that stops reading holds a send up only for IO_TIMEOUT, and a result port where only
// untrusted callers come is given up after RESULT_PORT_TIMEOUT.
TEST_F(ChannelTest, SendsAndTheResultPortWaitOnlyAsLongAsTheTimeOuts)
{
    FakeServer own;
    own.exchange(request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", ""}, {"userPassword", ""}}), kSignedIn)
        .expectAnyFrame()
        .sendFrame(reply("SUCCESS", "queued"))
        .connectBackAndSend("from a stranger")
        .start();
    ASSERT_TRUE(gives(openOn(*channel, own.port(), {"IO_TIMEOUT", "0.3", "RESULT_PORT_TIMEOUT", "0.3"},
                             {"TRUSTED_HOST_NAMES", "10.255.255.1"}),
                      0));
    EXPECT_TRUE(gives(resultPort({}), kResultPortAcceptFailed));
    // Far more than the socket buffers take while nobody reads.
    EXPECT_TRUE(gives(plain("CMD", {{"big", std::string(64u << 20, 'b')}}), kSendFailed, SOCK_TIMED_OUT));
}

}  // namespace
}  // namespace zeltest
