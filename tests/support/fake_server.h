#pragma once
// A scriptable server on loopback for the wire tests of the channel and of every manager.
//
// It speaks the framing (4-byte big-endian length, then the payload) with its own socket code and
// its own encoder and decoder, and includes nothing from the library, so that a misunderstanding of
// the protocol cannot hide by being shared between the library and its tests.
//
// Usage:
//     zeltest::FakeServer server;
//     server.expectFrame(zeltest::request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}}))
//         .sendFrame(zeltest::reply("SUCCESS", sessionDocument));
//     server.start();
//     ... let the code under test connect to 127.0.0.1:server.port() ...
//     EXPECT_TRUE(server.verify());      // waits for the script, ends the run, reports the first mismatch
//     EXPECT_EQ(server.frames().size(), 1u);
//
// The steps run in order on one thread. The first step that needs a connection accepts the first
// one; later connections are taken only by acceptNext(). Every wait is bounded by the step time-out,
// so a broken test fails instead of hanging. On the first failure the script stops and every
// connection is closed at once, which releases a client blocked in a read. After the last step the
// connection stays open until finish() (or the hold time-out), so the client can go on using it.
// Bytes that the client sent but no step read are reported as a failure when the connection closes,
// and so is a connection that the client made but the script never accepted.

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "support/sockets.h"

namespace zeltest {

// A byte string; NUL bytes are ordinary bytes. Write literals with `using namespace
// std::string_literals;` and "A\0B"s so that the embedded NULs are kept.
using Bytes = std::string;

// Name/value pairs of a request, in wire order.
using Values = std::vector<std::pair<std::string, std::string>>;

// ---- Payload builders -------------------------------------------------------------------------------

// "APIVERSION=1" NUL keyword, then NUL name "=" value for each pair.
Bytes request(std::string_view keyword, const Values& values = {});
// status NUL body.
Bytes reply(std::string_view status, std::string_view body);
// "fileLength=" length NUL "fileCRC=" crc, both decimal.
Bytes fileHeader(std::uint64_t length, std::uint32_t crc);
// "SUCCESS" NUL "ready_to_transfer".
Bytes readyAck();
// The 4-byte big-endian length followed by the payload: what goes on the wire for one frame.
Bytes frame(std::string_view payload);
// CRC-32 as zip and zlib compute it, for file headers of test content.
std::uint32_t crc32(std::string_view data);

// ---- Payload readers --------------------------------------------------------------------------------

// The payload split at every NUL (an empty payload gives one empty field).
std::vector<Bytes> fields(std::string_view payload);

struct ParsedRequest {
    Bytes version;  // the text after "APIVERSION="
    Bytes keyword;
    Values values;  // every NUL-separated "name=value" after the keyword, in order
};
// Reads a command payload; nullopt when it does not start with "APIVERSION=" or has no keyword.
std::optional<ParsedRequest> parseRequest(std::string_view payload);
// Value of the first field "name=..." after the keyword of a command payload.
std::optional<Bytes> requestValue(std::string_view payload, std::string_view name);
// True for a command payload whose keyword is exactly `keyword`.
bool isRequestFor(std::string_view payload, std::string_view keyword);

// ---- Diagnostics ------------------------------------------------------------------------------------

// C-style escaped text (\0, \n, \xNN), cut after `limit` bytes with a note of the full size.
std::string printable(std::string_view data, std::size_t limit = 512);
// Offset, 16 bytes in hex and their printable characters per line, for [from, to).
std::string hexDump(std::string_view data, std::size_t from, std::size_t to);
// Where two byte strings first differ, with both hex dumps around that offset; empty when equal.
std::string describeDifference(std::string_view expected, std::string_view actual);

// ---- The server -------------------------------------------------------------------------------------

class FakeServer {
public:
    using Predicate = std::function<bool(const Bytes& payload)>;
    using Milliseconds = std::chrono::milliseconds;

    // Listens on 127.0.0.1 at a port the system chooses; throws std::runtime_error when it cannot.
    FakeServer();
    // Ends the run (as finish()) and joins the thread.
    ~FakeServer();

    FakeServer(const FakeServer&) = delete;
    FakeServer& operator=(const FakeServer&) = delete;

    std::uint16_t port() const { return listenPort; }

    // Bound on every wait of one step (accept, read, write, connect). Default 5 s.
    void setStepTimeout(Milliseconds timeout);
    // How long the connection is kept open after the last step when finish() does not come first.
    // Default 10 s.
    void setHoldTimeout(Milliseconds timeout);

    // Script steps; each returns the server for chaining. Call them before start().

    // Reads one frame; its payload must equal `payload` byte for byte.
    FakeServer& expectFrame(Bytes payload);
    // Reads one frame; `predicate` must accept its payload. `what` names the expectation in reports.
    FakeServer& expectFrameWhere(std::string what, Predicate predicate);
    // Reads one frame of any content.
    FakeServer& expectAnyFrame();
    // Reads `count` unframed bytes (file content); they are kept in rawChunks().
    FakeServer& expectRaw(std::size_t count);
    // Reads unframed bytes that must equal `bytes`.
    FakeServer& expectRawBytes(Bytes bytes);
    // Waits until the client closes the connection; any byte arriving first is a failure.
    FakeServer& expectPeerClose();
    // Sends one frame (prefix and payload in one write).
    FakeServer& sendFrame(Bytes payload);
    // Sends bytes as they are (a torn frame, file content, garbage).
    FakeServer& sendRaw(Bytes bytes);
    // Closes the current connection.
    FakeServer& closeConnection();
    // Closes the current connection when still open and accepts the next one.
    FakeServer& acceptNext();
    // Connects to 127.0.0.1 at the port named by the value `portValueName` of the last frame
    // received (a command payload) and sends one frame with `payload` on that new connection, which
    // stays open until the run ends.
    FakeServer& connectBackAndSend(Bytes payload, std::string portValueName = "requesterResultPort");
    // The same with a port given directly.
    FakeServer& connectToPortAndSend(std::uint16_t port, Bytes payload);
    // As connectBackAndSend, but the connection leaves from `sourceAddress` (a dotted IPv4 address
    // of this machine, e.g. "127.0.0.2"), bound before connecting, so that the client sees a caller
    // with that address.
    FakeServer& connectBackFromAndSend(std::string sourceAddress, Bytes payload,
                                       std::string portValueName = "requesterResultPort");
    // Shorthand for expectFrame(expected) followed by sendFrame(answer).
    FakeServer& exchange(Bytes expected, Bytes answer);

    // Starts the thread that runs the script. Call once, after the steps.
    void start();
    // Waits until every step has run or one failed; the connection stays open. Returns passed().
    bool waitForScript();
    // Waits until the first `count` steps have run (or the script ended early); lets a test act
    // only after, say, the server has closed the connection. Returns whether they all ran.
    bool waitForSteps(std::size_t count);
    // Waits for the script, closes every connection, joins the thread and checks for unaccepted
    // connections. Safe to call more than once. Returns passed().
    bool finish();
    // finish(), as an assertion result that carries the failure report.
    ::testing::AssertionResult verify();

    bool passed() const;
    // Description of the first failure; empty when none.
    std::string failure() const;

    // Every frame payload received, in order, matched or not, across all connections.
    std::vector<Bytes> frames() const;
    // The last frame payload received; empty when none.
    Bytes lastFrame() const;
    // Every unframed read, one entry per expectRaw/expectRawBytes step.
    std::vector<Bytes> rawChunks() const;
    // How many connections the script accepted.
    int connectionsAccepted() const;

private:
    enum class Kind {
        ExpectFrame,
        ExpectFrameWhere,
        ExpectRaw,
        ExpectRawBytes,
        ExpectPeerClose,
        SendFrame,
        SendRaw,
        Close,
        AcceptNext,
        ConnectBack,
        ConnectToPort,
    };

    struct Step {
        Kind kind;
        Bytes data;
        std::string name;
        Predicate predicate;
        std::size_t count = 0;
        std::uint16_t port = 0;
        std::string source = {};  // connect-back steps: local address to leave from; empty for any
    };

    class Run;
    friend class Run;

    FakeServer& add(Step step);
    void recordFrame(Bytes payload);
    void recordRaw(Bytes bytes);
    void stepDone();
    void fail(std::string message);
    void runScript();

    Socket listener;
    std::uint16_t listenPort = 0;
    Milliseconds stepTimeout{5000};
    Milliseconds holdTimeout{10000};
    std::vector<Step> steps;
    std::thread worker;
    bool started = false;
    bool finished = false;

    mutable std::mutex mutex;
    std::condition_variable changed;
    bool scriptDone = false;
    bool releaseRequested = false;
    std::string firstFailure;
    std::vector<Bytes> receivedFrames;
    std::vector<Bytes> receivedRaw;
    int accepted = 0;
    std::size_t stepsDone = 0;
};

}  // namespace zeltest
