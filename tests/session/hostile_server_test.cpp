// The session through the exported entry points against the scriptable fake server. First a server
// that lies, stalls, never answers or hangs up: every case ends in a status, in bounded time and
// memory, a connection left in the middle of a message is given up, and a download that does not
// complete leaves the caller's file as it was. Then sign-in, the managers in each state, session
// properties and the factories.

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

// Replies too large, torn or late: the bound holds before any content is read, a time-out ends the
// step that waited with the socket's code, and a connection left mid-frame is given up.
TEST_F(HostileSessionTest, OversizedTornAndLateRepliesEndInAStatus)
{
    enum Then { kWait, kClose, kResultPort };  // kResultPort: a transacted job, whose result never comes
    const struct {
        const char* name;
        const char* limit;  // a property and its value
        const char* value;
        Bytes served;  // sent after the command has been read
        Then then;
        unsigned number;
        unsigned code;
        const char* inMessage;
        bool dropped;  // the connection is given up: the next command finds none
    } cases[] = {
        {"prefix announcing 4 GiB", "", "", "\xFF\xFF\xFF\xF0SUCCESS\0"s + std::string(4096, 'x'), kWait, 393604, 0,
         "4294967280 bytes, more than the 67108864", true},
        {"one byte over the limit", "MAX_REPLY_BYTES", "100", frame("SUCCESS\0"s + std::string(93, 'x')), kWait, 393604,
         0, "101 bytes, more than the 100", true},
        {"exactly the limit", "MAX_REPLY_BYTES", "100", frame("SUCCESS\0"s + std::string(92, 'x')), kWait, 0, 0, "",
         false},
        {"torn inside the payload", "", "", frame("SUCCESS\0body"s).substr(0, 9), kClose, 393608, 392008, "", false},
        {"no answer", "IO_TIMEOUT", "0.2", "", kWait, 393608, kTimedOut, "", true},
        {"stalled frame", "IO_TIMEOUT", "0.2", frame("SUCCESS\0body"s).substr(0, 7), kWait, 393608, kTimedOut, "",
         true},
        {"no result", "RESULT_PORT_TIMEOUT", "0.2", frame("SUCCESS\0queued"s), kResultPort, 393618, kTimedOut, "",
         false},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        FakeServer server;
        server.exchange(firstHandshake(), signedIn()).expectAnyFrame().sendRaw(c.served);
        if (c.then == kClose) {
            server.closeConnection();
        }
        signIn(server, {{c.limit, c.value}});
        unsigned unused = 0;
        const Outcome got = c.then == kResultPort ? outcome(transactJob(*session, "", unused)) : sessionProperty();
        EXPECT_EQ(got.number, c.number) << got.message;
        EXPECT_EQ(got.code, c.code) << got.message;
        EXPECT_NE(got.message.find(c.inMessage), std::string::npos) << got.message;
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

TEST_F(HostileSessionTest, LimitPropertiesAreReadToTheMillisecondOrRefusedBeforeConnecting)
{
    const std::pair<const char*, const char*> refused[] = {
        {"CONNECT_TIMEOUT", "-1"},  {"IO_TIMEOUT", "abc"},
        {"IO_TIMEOUT", "1.2345"},   {"RESULT_PORT_TIMEOUT", "3e1"},
        {"MAX_REPLY_BYTES", "0"},   {"IO_TIMEOUT", "2000001"},
        {"CONNECT_TIMEOUT", " 30"}, {"MAX_REPLY_BYTES", "4294967296"}};
    for (const auto& [name, value] : refused) {
        const Outcome got = init(1, {{name, value}});
        EXPECT_EQ(got.number, 393617u) << value;
        EXPECT_NE(got.message.find(name), std::string::npos) << got.message;
    }
    const std::pair<const char*, std::uint32_t> read[] = {
        {"0", 0}, {"0.25", 250}, {"0.001", 1}, {"2000000", 2000000000}};
    for (const auto& [text, milliseconds] : read) {
        EXPECT_EQ(zel::secondsAsMilliseconds(text), milliseconds) << text;
    }
}

// Each download of the library, and the source its refusal names.
const std::pair<Call, const char*> kDownloads[] = {
    {downloadSharedFile, "/in/a.txt"}, {getItem, "plan.zlw"}, {getItemResource, "notes.txt"}, {getLogFile, "job 42"}};

TEST_F(HostileSessionTest, FailedDownloadsLeaveTheDestinationAsItWas)
{
    const struct {
        const char* name;
        Bytes first;        // the server's answer to the command; none: it offers the file
        const char* final;  // the server's answer after the content
        unsigned number;
        const char* inMessage;  // "<source>" stands for the download's source
        unsigned received;
    } cases[] = {
        {"refused in place of the file", reply("ERROR", "no such file"), "", 393625, "no such file", 0},
        {"no file header", reply("SUCCESS", "false"), "", 393638, "<source>", 0},
        {"final answer false", "", "false", 0, "", 0},
        {"final answer neither", "", "maybe", 393604, "maybe", 0},
        {"complete", "", "true", 0, "", 1},
    };
    for (const auto& [call, source] : kDownloads) {
        for (const auto& c : cases) {
            SCOPED_TRACE(std::string(source) + ": " + c.name);
            const TempDir folder("zel-download");
            const std::filesystem::path destination = folder.path() / "kept.txt";
            spew(destination, "old");
            FakeServer server;
            server.exchange(firstHandshake(), signedIn()).expectAnyFrame();
            if (c.first.empty()) {
                server.sendFrame(fileHeader(5, crc32("fresh"))).expectFrame(readyAck()).sendRaw("fresh");
                server.expectFrame(readyAck()).sendFrame(reply("SUCCESS", c.final));
            } else {
                server.sendFrame(c.first);
            }
            signIn(server);
            unsigned received = 7;
            const Outcome got = outcome(call(*session, destination.string(), received));
            EXPECT_EQ(got.number, c.number) << got.message;
            const std::string expected = c.inMessage == std::string("<source>") ? source : c.inMessage;
            EXPECT_NE(got.message.find(expected), std::string::npos) << got.message;
            EXPECT_EQ(received, c.received);
            EXPECT_EQ(slurp(destination), c.received == 1 ? "fresh" : "old");
            EXPECT_EQ(std::distance(std::filesystem::directory_iterator(folder.path()), {}), 1) << "no temporary file";
            EXPECT_TRUE(server.verify());
        }
    }
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

// ---- A server that hangs up in the middle of its answer. For each kind of exchange the connection is
// closed after every possible number of answer bytes: the call must come back with a status, an
// existing destination file must stay as it was, and the session must work again after a new init.

// One step of the server's side: read a frame, read raw bytes, or write bytes as they are.
struct Step {
    enum { Read, ReadRaw, Write } kind;
    Bytes bytes = {};
};

Step readFrame() { return {Step::Read}; }
Step answer(const Bytes& payload) { return {Step::Write, frame(payload)}; }

const std::string kContent = "zlw-bytes";

IZELServerStatus* repositoryExists(IZELServerSession& s, const std::string&, unsigned& found)
{
    Texts t(s);
    return s.getRepositoryManager()->repositoryExists(t("R"), found);
}

IZELServerStatus* listRepositories(IZELServerSession& s, const std::string&, unsigned&)
{
    return s.getRepositoryManager()->getRepositories(nullptr, *zelServerOwn(s, s.createRepositoryVector()));
}

// Uploads a new file beside `file`.
IZELServerStatus* addItem(IZELServerSession& s, const std::string& file, unsigned&)
{
    spew(file + ".zlw", kContent);
    Texts t(s);
    return zelServerOwn(s, s.createRepository())->addItem(t("a.zlw"), t(file + ".zlw"));
}

const struct {
    const char* name;
    std::vector<Step> cut;  // the exchange whose answer is cut, after the sign-in
    Call call;              // null: the sign-in itself is cut
} kKinds[] = {
    {"sign-in", {readFrame(), answer(signedIn())}, nullptr},
    {"plain", {readFrame(), answer(reply("SUCCESS", "true"))}, repositoryExists},
    {"list", {readFrame(), answer(reply("SUCCESS", R"(<R><REPOSITORY name="A"/></R>)"))}, listRepositories},
    {"upload",
     {readFrame(),
      answer(readyAck()),
      readFrame(),
      answer(readyAck()),
      {Step::ReadRaw, kContent},
      answer(reply("SUCCESS", "true"))},
     addItem},
    // Every download shares this answer and its reading: the file header, the content, the final "true".
    {"download",
     {readFrame(),
      answer(fileHeader(kContent.size(), crc32(kContent))),
      readFrame(),
      {Step::Write, kContent},
      readFrame(),
      answer(reply("SUCCESS", "true"))},
     getItem},
    // Only the answer on the command's own connection: after all of it the library waits for the
    // server's call on the result port, which no hang-up ends.
    {"result port", {readFrame(), answer(reply("SUCCESS", "queued"))}, transactJob},
};

// The script of one case: the sign-in, the cut exchange up to `offset` answer bytes, then the
// hang-up, and a second connection for the new sign-in and one plain command.
void script(FakeServer& server, const std::vector<Step>& cut, bool signInFirst, std::size_t offset)
{
    if (signInFirst) {
        server.exchange(firstHandshake(), signedIn());
    }
    for (const Step& step : cut) {
        if (step.kind == Step::Read) {
            server.expectAnyFrame();
        } else if (step.kind == Step::ReadRaw) {
            server.expectRaw(step.bytes);
        } else if (offset < step.bytes.size()) {
            server.sendRaw(step.bytes.substr(0, offset));
            break;
        } else {
            server.sendRaw(step.bytes);
            offset -= step.bytes.size();
        }
    }
    server.closeConnection().acceptNext().exchange(firstHandshake(), signedIn());
    server.expectAnyFrame().sendFrame(reply("SUCCESS", "true"));
}

TEST_F(HostileSessionTest, CutAnswersEndInAStatusKeepTheDestinationAndTheSessionSignsInAgain)
{
    for (const auto& kind : kKinds) {
        std::size_t answerBytes = 0;
        for (const Step& step : kind.cut) {
            answerBytes += step.kind == Step::Write ? step.bytes.size() : 0;
        }
        for (std::size_t offset = 0; offset < answerBytes; ++offset) {
            SCOPED_TRACE(std::string(kind.name) + ", hang-up after " + std::to_string(offset) + " bytes");
            const TempDir folder("zel-cut");
            const std::string kept = (folder.path() / "kept").string();
            spew(kept, "old contents");
            FakeServer server;
            script(server, kind.cut, kind.call != nullptr, offset);
            server.start();
            ZEL_destroyServerSession(&session);
            ZEL_createServerSession(&session);
            unsigned number = init(server.port()).number;
            unsigned unused = 0;
            if (kind.call != nullptr && number == 0) {
                number = outcome(kind.call(*session, kept, unused)).number;
            }
            unsigned found = 0;
            const bool held = number != 0 && slurp(kept) == "old contents" && init(server.port()).number == 0 &&
                              outcome(repositoryExists(*session, "", found)).number == 0 && found == 1;
            EXPECT_TRUE(held) << "status " << number << ", file \"" << slurp(kept) << "\"";
            server.finish();
            if (!held) {
                break;  // one report per kind
            }
        }
    }
}

// ---- The session in each state, its properties and factories

bool hasManagers(IZELServerSession& session)
{
    const int made = (session.getTransformationManager() != nullptr) + (session.getRepositoryManager() != nullptr) +
                     (session.getSecurityManager() != nullptr) + (session.getMountPointManager() != nullptr);
    EXPECT_TRUE(made == 0 || made == 4) << made << " of 4 managers";
    return made == 4;
}

TEST_F(HostileSessionTest, FailedInitsLeaveNoManagersAndARefusedSignInKeepsTheConnection)
{
    EXPECT_EQ(sessionProperty().number, 393622u) << "before init";
    Texts t(*session);
    const auto web = zelServerOwn(*session, session->createConnectionInfo(t("http://h:1"), t("ann"), t("pw1")));
    EXPECT_EQ(outcome(session->init(*web, nullptr)).number, 393639u);
    EXPECT_EQ(init(1).number, 393601u);
    EXPECT_FALSE(hasManagers(*session));
    EXPECT_EQ(outcome(session->disconnect()).number, 0u) << "disconnect without a connection is harmless";

    // A refusal keeps the connection until disconnect; a sign-in without an identity leaves an
    // unauthenticated one.
    FakeServer server;
    server.exchange(firstHandshake(), reply("ERROR", "Authentication Error: bad password")).expectPeerClose();
    server.acceptNext().exchange(firstHandshake(), reply("SUCCESS", "<S/>"));
    server.start();
    EXPECT_EQ(init(server.port()).number, 393625u);
    EXPECT_EQ(outcome(session->disconnect()).number, 0u);
    EXPECT_EQ(init(server.port()).number, 393631u);
    ASSERT_NE(session->getIdentity(), nullptr);
    EXPECT_FALSE(session->getIdentity()->isAuthenticated());
    EXPECT_TRUE(server.verify());
}

TEST_F(HostileSessionTest, SessionPropertiesCarryTheIdentityAndTheClientIdOfTheOptions)
{
    const std::string identity =
        R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><SERVER_SESSION_GET_PROP>)"
        R"(<IDENTITY id="ann" is_authenticated="true"><ROLES/></IDENTITY></SERVER_SESSION_GET_PROP>)";
    const Bytes property =
        request("SERVER_SESSION_GET_PROP",
                {{"identityObject", identity}, {"clientID", "tool-7"}, {"sessionPropName", "BUILD"}});
    FakeServer server;
    server
        .exchange(request("SERVER_SESSION_INIT", {{"clientID", "tool-7"}, {"userID", "ann"}, {"userPassword", "pw1"}}),
                  signedIn())
        .exchange(property, reply("SUCCESS", "24\0x"s))
        .expectPeerClose();
    server.start();
    const auto options = zelServerOwn(*session, session->createStringArray());
    options->appendTokens("CLIENT_ID;tool-7", ";");
    ASSERT_EQ(outcome(session->init(PropertyConnection(server.port(), {}), options.get())).number, 0u);
    EXPECT_TRUE(hasManagers(*session));

    std::string value;
    EXPECT_EQ(sessionProperty(&value).number, 0u);
    EXPECT_EQ(value, "24\0x"s) << "the body is copied whole";
    EXPECT_EQ(outcome(session->disconnect()).number, 0u);
    EXPECT_EQ(outcome(session->disconnect()).number, 393622u);
    EXPECT_EQ(sessionProperty().number, 393622u);
    unsigned received = 7;
    EXPECT_EQ(outcome(getItem(*session, "x", received)).number, 393622u);
    EXPECT_TRUE(hasManagers(*session)) << "disconnect keeps the objects";
    EXPECT_TRUE(server.verify());
}

// A factory hands out a live object that its destroy operation takes back, leaving null (the
// factories the end-to-end suites and zelctl use are left to them).
template <class T>
void roundTrip(IZELServerSession& session, T* (IZELServerSession::*create)(), void (IZELServerSession::*destroy)(T**))
{
    T* object = (session.*create)();
    EXPECT_NE(object, nullptr);
    (session.*destroy)(&object);
    EXPECT_EQ(object, nullptr);
}

TEST_F(HostileSessionTest, EveryFactoryMakesAnObjectItsDestroyTakesBack)
{
    IZELServerSession& s = *session;
    using S = IZELServerSession;
    roundTrip<IZELServerWorkspaceSummary>(s, &S::createWorkspaceSummary, &S::destroyWorkspaceSummary);
    roundTrip<IZELServerWorkspaceService>(s, &S::createWorkspaceService, &S::destroyWorkspaceService);
    roundTrip<IZELServerVector<IZELServerResource>>(s, &S::createResourceVector, &S::destroyResourceVector);
    roundTrip<IZELServerVector<IZELServerProperty>>(s, &S::createPropertyVector, &S::destroyPropertyVector);
    roundTrip<IZELServerVector<IZELServerMountPoint>>(s, &S::createMountPointVector, &S::destroyMountPointVector);
    IZELServerSession* none = nullptr;
    ZEL_destroyServerSession(&none);
    session->destroyString(nullptr);
}

}  // namespace
}  // namespace zeltest
