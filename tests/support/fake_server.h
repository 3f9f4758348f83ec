#pragma once
// A scriptable server on loopback for the wire tests. It frames, encodes and decodes with its own
// code and includes nothing from the library, so that a misunderstanding of the protocol cannot hide
// by being shared between the library and its tests.
//
// The steps run in order on one thread; the first step that needs a connection accepts the first
// one, later ones only acceptNext(). Every wait is bounded (5 s a step). On the first failure the
// script stops and every connection closes at once, releasing a client blocked in a read. After the
// last step the connection stays open until finish() (at most 10 s). Bytes the client sent that no
// step read fail the run, and so does a connection that the script never accepted.

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

// A byte string; NUL bytes are ordinary bytes (write literals as "A\0B"s).
using Bytes = std::string;
// Name/value pairs of a request, in wire order.
using Values = std::vector<std::pair<std::string, std::string>>;

// "APIVERSION=1" NUL keyword, then NUL name "=" value for each pair.
Bytes request(std::string_view keyword, const Values& values = {});
// status NUL body.
Bytes reply(std::string_view status, std::string_view body);
// "fileLength=" length NUL "fileCRC=" crc, both decimal.
Bytes fileHeader(std::uint64_t length, std::uint32_t crc);
// "SUCCESS" NUL "ready_to_transfer".
Bytes readyAck();
// The 4-byte big-endian length followed by the payload: one frame as it goes on the wire.
Bytes frame(std::string_view payload);
// CRC-32 as zip and zlib compute it.
std::uint32_t crc32(std::string_view data);

struct ParsedRequest {
    Bytes keyword;
    Values values;  // every "name=value" after the keyword, in order
};
// nullopt when the payload does not start with "APIVERSION=", has no keyword or a field without "=".
std::optional<ParsedRequest> parseRequest(std::string_view payload);

// C-style escaped text (\0, \n, \xNN), cut after `limit` bytes with a note of the full size.
std::string printable(std::string_view data, std::size_t limit = 512);

class FakeServer {
public:
    using Predicate = std::function<bool(const Bytes& payload)>;

    // Listens on 127.0.0.1 at a port the system chooses; throws std::runtime_error when it cannot.
    FakeServer();
    ~FakeServer() { finish(); }
    FakeServer(const FakeServer&) = delete;
    FakeServer& operator=(const FakeServer&) = delete;

    std::uint16_t port() const { return listenPort; }

    // Script steps, added before start(); each returns the server for chaining.
    // Reads one frame whose payload must equal `payload` byte for byte, or that `predicate` accepts.
    FakeServer& expectFrame(Bytes payload);
    FakeServer& expectFrameWhere(std::string what, Predicate predicate);
    FakeServer& expectAnyFrame();
    // Reads exactly `bytes`, unframed (file content).
    FakeServer& expectRaw(Bytes bytes);
    // Waits until the client closes the connection; a byte arriving first is a failure.
    FakeServer& expectPeerClose();
    // Sends one frame in one write, or bytes as they are (a torn frame, file content, garbage).
    FakeServer& sendFrame(Bytes payload);
    FakeServer& sendRaw(Bytes bytes);
    FakeServer& closeConnection();
    // Closes the current connection when still open and accepts the next one.
    FakeServer& acceptNext();
    // Connects to the port named by "requesterResultPort" in the last frame received, from
    // `sourceAddress` (a dotted IPv4 address of this machine) when given, and sends one frame on that
    // connection, which stays open until the run ends.
    FakeServer& connectBackAndSend(Bytes payload, std::string sourceAddress = "");
    // expectFrame(expected), then sendFrame(answer).
    FakeServer& exchange(Bytes expected, Bytes answer);

    // Starts the thread that runs the script; once, after the steps.
    void start();
    // Waits for the script, closes every connection, joins the thread and checks for unaccepted
    // connections. Safe to call more than once. True when nothing failed.
    bool finish();
    // finish(), as an assertion result that carries the first failure.
    ::testing::AssertionResult verify();

private:
    class Run;
    // One step: what it is for reports, and what it does on the worker thread.
    struct Step {
        std::string what;
        std::function<bool(Run&)> act;
    };

    FakeServer& add(std::string what, std::function<bool(Run&)> act);
    void fail(std::string message);
    std::string failure() const;

    Socket listener;
    std::uint16_t listenPort = 0;
    std::vector<Step> steps;
    std::thread worker;
    bool finished = false;

    mutable std::mutex mutex;
    std::condition_variable changed;
    bool releaseRequested = false;
    std::string firstFailure;
};

}  // namespace zeltest
