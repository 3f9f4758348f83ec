#include "support/fake_server.h"

#include <algorithm>
#include <charconv>
#include <cstdio>
#include <stdexcept>

#include "support/sockets.h"

namespace zeltest {

namespace {

using Clock = std::chrono::steady_clock;

// Far above any command the library sends; a larger prefix means the stream is out of step.
constexpr std::uint32_t kMaxFrameLength = 64u << 20;
constexpr std::size_t kLabelLimit = 48;

std::chrono::milliseconds leftUntil(Clock::time_point deadline)
{
    return std::max(std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now()),
                    std::chrono::milliseconds(0));
}

enum class Io { Ok, Closed, TimedOut, Failed };

struct IoOutcome {
    Io result = Io::Ok;
    std::size_t done = 0;
    int error = 0;
};

// The socket is non-blocking; waits happen here, bounded by the deadline.
IoOutcome readExact(const Socket& socket, char* out, std::size_t count, Clock::time_point deadline)
{
    IoOutcome outcome;
    while (outcome.done < count) {
        const long got = receiveSome(socket, out + outcome.done, count - outcome.done);
        if (got > 0) {
            outcome.done += static_cast<std::size_t>(got);
            continue;
        }
        if (got == 0) {
            outcome.result = Io::Closed;
            return outcome;
        }
        const int error = lastSocketError();
        if (isInterrupted(error)) {
            continue;
        }
        if (isWouldBlock(error)) {
            if (!waitReadable(socket, leftUntil(deadline))) {
                outcome.result = Io::TimedOut;
                return outcome;
            }
            continue;
        }
        outcome.result = Io::Failed;
        outcome.error = error;
        return outcome;
    }
    return outcome;
}

IoOutcome writeAll(const Socket& socket, std::string_view data, Clock::time_point deadline)
{
    IoOutcome outcome;
    while (outcome.done < data.size()) {
        const long sent = sendSome(socket, data.data() + outcome.done, data.size() - outcome.done);
        if (sent > 0) {
            outcome.done += static_cast<std::size_t>(sent);
            continue;
        }
        const int error = sent < 0 ? lastSocketError() : 0;
        if (sent < 0 && isInterrupted(error)) {
            continue;
        }
        if (sent < 0 && isWouldBlock(error)) {
            if (!waitWritable(socket, leftUntil(deadline))) {
                outcome.result = Io::TimedOut;
                return outcome;
            }
            continue;
        }
        outcome.result = Io::Failed;
        outcome.error = error;
        return outcome;
    }
    return outcome;
}

std::string explain(const IoOutcome& outcome, std::size_t wanted, const std::string& what)
{
    const std::string progress = std::to_string(outcome.done) + " of " + std::to_string(wanted) + " bytes of " + what;
    switch (outcome.result) {
    case Io::Ok:
        return "no error";
    case Io::Closed:
        return "the client closed the connection after " + progress;
    case Io::TimedOut:
        return "timed out after " + progress;
    case Io::Failed:
        return "socket error (" + socketErrorText(outcome.error) + ") after " + progress;
    }
    return "unknown outcome";
}

// Reads whatever is waiting; used to find bytes that no step consumed. Every socket of the run is
// non-blocking, so this never waits.
Bytes drainWaiting(const Socket& socket)
{
    Bytes waiting;
    char chunk[4096];
    for (;;) {
        const long got = receiveSome(socket, chunk, sizeof chunk);
        if (got > 0) {
            waiting.append(chunk, static_cast<std::size_t>(got));
            continue;
        }
        if (got < 0 && isInterrupted(lastSocketError())) {
            continue;
        }
        return waiting;
    }
}

bool connectionWaiting(const Socket& listener)
{
    return listener.valid() && waitReadable(listener, std::chrono::milliseconds(0));
}

std::uint32_t decodeLength(const unsigned char prefix[4])
{
    return (std::uint32_t{prefix[0]} << 24) | (std::uint32_t{prefix[1]} << 16) | (std::uint32_t{prefix[2]} << 8) |
           std::uint32_t{prefix[3]};
}

std::optional<std::uint16_t> parsePort(std::string_view text)
{
    unsigned value = 0;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, value);
    if (text.empty() || error != std::errc{} || stop != end || value == 0 || value > 65535) {
        return std::nullopt;
    }
    return static_cast<std::uint16_t>(value);
}

}  // namespace

// ---- Payload builders -------------------------------------------------------------------------------

Bytes request(std::string_view keyword, const Values& values)
{
    Bytes payload("APIVERSION=1");
    payload.push_back('\0');
    payload.append(keyword);
    for (const auto& [name, value] : values) {
        payload.push_back('\0');
        payload.append(name);
        payload.push_back('=');
        payload.append(value);
    }
    return payload;
}

Bytes reply(std::string_view status, std::string_view body)
{
    Bytes payload(status);
    payload.push_back('\0');
    payload.append(body);
    return payload;
}

Bytes fileHeader(std::uint64_t length, std::uint32_t crc)
{
    Bytes payload = "fileLength=" + std::to_string(length);
    payload.push_back('\0');
    payload.append("fileCRC=" + std::to_string(crc));
    return payload;
}

Bytes readyAck() { return reply("SUCCESS", "ready_to_transfer"); }

Bytes frame(std::string_view payload)
{
    const auto length = static_cast<std::uint32_t>(payload.size());
    Bytes wire;
    wire.reserve(4 + payload.size());
    wire.push_back(static_cast<char>((length >> 24) & 0xFF));
    wire.push_back(static_cast<char>((length >> 16) & 0xFF));
    wire.push_back(static_cast<char>((length >> 8) & 0xFF));
    wire.push_back(static_cast<char>(length & 0xFF));
    wire.append(payload);
    return wire;
}

// Bit by bit, without a table: an independent check on the library's table-driven checksum.
std::uint32_t crc32(std::string_view data)
{
    std::uint32_t crc = 0xFFFFFFFFu;
    for (const char c : data) {
        crc ^= static_cast<unsigned char>(c);
        for (int bit = 0; bit < 8; ++bit) {
            crc = (crc >> 1) ^ (0xEDB88320u & (0u - (crc & 1u)));
        }
    }
    return ~crc;
}

// ---- Payload readers --------------------------------------------------------------------------------

std::vector<Bytes> fields(std::string_view payload)
{
    std::vector<Bytes> parts;
    std::size_t start = 0;
    for (;;) {
        const std::size_t nul = payload.find('\0', start);
        if (nul == std::string_view::npos) {
            parts.emplace_back(payload.substr(start));
            return parts;
        }
        parts.emplace_back(payload.substr(start, nul - start));
        start = nul + 1;
    }
}

std::optional<ParsedRequest> parseRequest(std::string_view payload)
{
    static constexpr std::string_view kVersionPrefix = "APIVERSION=";
    const std::vector<Bytes> parts = fields(payload);
    if (parts.size() < 2 || parts[0].rfind(kVersionPrefix, 0) != 0 || parts[1].empty()) {
        return std::nullopt;
    }
    ParsedRequest parsed;
    parsed.version = parts[0].substr(kVersionPrefix.size());
    parsed.keyword = parts[1];
    for (std::size_t i = 2; i < parts.size(); ++i) {
        const std::size_t equals = parts[i].find('=');
        if (equals == Bytes::npos) {
            return std::nullopt;
        }
        parsed.values.emplace_back(parts[i].substr(0, equals), parts[i].substr(equals + 1));
    }
    return parsed;
}

std::optional<Bytes> requestValue(std::string_view payload, std::string_view name)
{
    const std::optional<ParsedRequest> parsed = parseRequest(payload);
    if (!parsed) {
        return std::nullopt;
    }
    for (const auto& [valueName, value] : parsed->values) {
        if (valueName == name) {
            return value;
        }
    }
    return std::nullopt;
}

bool isRequestFor(std::string_view payload, std::string_view keyword)
{
    const std::optional<ParsedRequest> parsed = parseRequest(payload);
    return parsed && parsed->keyword == keyword;
}

// ---- Diagnostics ------------------------------------------------------------------------------------

std::string printable(std::string_view data, std::size_t limit)
{
    std::string text;
    const std::size_t shown = std::min(data.size(), limit);
    for (std::size_t i = 0; i < shown; ++i) {
        const auto byte = static_cast<unsigned char>(data[i]);
        switch (byte) {
        case '\0':
            text += "\\0";
            break;
        case '\n':
            text += "\\n";
            break;
        case '\r':
            text += "\\r";
            break;
        case '\t':
            text += "\\t";
            break;
        case '\\':
            text += "\\\\";
            break;
        case '"':
            text += "\\\"";
            break;
        default:
            if (byte >= 0x20 && byte < 0x7F) {
                text.push_back(static_cast<char>(byte));
            } else {
                char escaped[8];
                std::snprintf(escaped, sizeof escaped, "\\x%02X", byte);
                text += escaped;
            }
        }
    }
    if (shown < data.size()) {
        text += "... (" + std::to_string(data.size()) + " bytes in all)";
    }
    return text;
}

std::string hexDump(std::string_view data, std::size_t from, std::size_t to)
{
    to = std::min(to, data.size());
    std::string dump;
    for (std::size_t line = from - from % 16; line < to; line += 16) {
        char text[32];
        std::snprintf(text, sizeof text, "    %08zx ", line);
        dump += text;
        std::string characters;
        for (std::size_t i = line; i < line + 16; ++i) {
            if (i < from || i >= to) {
                dump += "   ";
                characters.push_back(' ');
                continue;
            }
            const auto byte = static_cast<unsigned char>(data[i]);
            std::snprintf(text, sizeof text, " %02X", byte);
            dump += text;
            characters.push_back(byte >= 0x20 && byte < 0x7F ? static_cast<char>(byte) : '.');
        }
        dump += "  |" + characters + "|\n";
    }
    return dump;
}

std::string describeDifference(std::string_view expected, std::string_view actual)
{
    if (expected == actual) {
        return {};
    }
    const std::size_t common = std::min(expected.size(), actual.size());
    std::size_t first = 0;
    while (first < common && expected[first] == actual[first]) {
        ++first;
    }
    const std::size_t from = first >= 32 ? first - first % 16 - 16 : 0;
    const std::size_t to = from + 64;
    std::string text = "first difference at byte " + std::to_string(first) + " (expected " +
                       std::to_string(expected.size()) + " bytes, received " + std::to_string(actual.size()) + ")\n";
    text += "  expected: \"" + printable(expected) + "\"\n";
    text += "  received: \"" + printable(actual) + "\"\n";
    text +=
        "  expected bytes " + std::to_string(from) + ".." + std::to_string(to) + ":\n" + hexDump(expected, from, to);
    text += "  received bytes " + std::to_string(from) + ".." + std::to_string(to) + ":\n" + hexDump(actual, from, to);
    return text;
}

// ---- The run on the worker thread -------------------------------------------------------------------

// State that only the worker thread touches: the current connection and the connect-back ones.
class FakeServer::Run {
public:
    explicit Run(FakeServer& server) : server(server) {}

    bool execute()
    {
        for (index = 0; index < server.steps.size(); ++index) {
            if (!perform(server.steps[index])) {
                return false;
            }
            server.stepDone();
        }
        return true;
    }

    // After a clean script: unread bytes on the connection are a failure of the test.
    void closeAfterScript()
    {
        if (connection.valid()) {
            const Bytes unread = drainWaiting(connection);
            connection.reset();
            if (!unread.empty()) {
                server.fail("after the last step: the client sent " + std::to_string(unread.size()) +
                            " bytes that no step read: \"" + printable(unread) + "\"");
            }
        }
        callbacks.clear();
    }

    void abandon()
    {
        connection.reset();
        callbacks.clear();
    }

private:
    Clock::time_point deadline() const { return Clock::now() + server.stepTimeout; }

    std::string label(const Step& step) const
    {
        switch (step.kind) {
        case Kind::ExpectFrame:
            return "expect frame \"" + printable(step.data, kLabelLimit) + "\"";
        case Kind::ExpectFrameWhere:
            return "expect frame where " + step.name;
        case Kind::ExpectRaw:
            return "expect " + std::to_string(step.count) + " raw bytes";
        case Kind::ExpectRawBytes:
            return "expect raw bytes \"" + printable(step.data, kLabelLimit) + "\"";
        case Kind::ExpectPeerClose:
            return "expect the client to close";
        case Kind::SendFrame:
            return "send frame \"" + printable(step.data, kLabelLimit) + "\"";
        case Kind::SendRaw:
            return "send " + std::to_string(step.data.size()) + " raw bytes";
        case Kind::Close:
            return "close the connection";
        case Kind::AcceptNext:
            return "accept the next connection";
        case Kind::ConnectBack:
            return "connect back to the port in \"" + step.name + "\"" +
                   (step.source.empty() ? std::string() : " from " + step.source) + " and send a frame";
        case Kind::ConnectToPort:
            return "connect to port " + std::to_string(step.port) + " and send a frame";
        }
        return "unknown step";
    }

    bool stepFailed(const std::string& detail)
    {
        const Step& step = server.steps[index];
        server.fail("step " + std::to_string(index + 1) + " of " + std::to_string(server.steps.size()) + " (" +
                    label(step) + "): " + detail);
        return false;
    }

    bool perform(const Step& step)
    {
        switch (step.kind) {
        case Kind::ExpectFrame:
        case Kind::ExpectFrameWhere:
            return expectFrame(step);
        case Kind::ExpectRaw:
        case Kind::ExpectRawBytes:
            return expectRaw(step);
        case Kind::ExpectPeerClose:
            return expectPeerClose();
        case Kind::SendFrame:
            return send(frame(step.data), "the frame");
        case Kind::SendRaw:
            return send(step.data, "the raw bytes");
        case Kind::Close:
            return ensureConnection() && closeChecked();
        case Kind::AcceptNext:
            return (!connection.valid() || closeChecked()) && acceptConnection();
        case Kind::ConnectBack:
            return connectBack(step);
        case Kind::ConnectToPort:
            return connectAndSend(step.port, step.data, step.source);
        }
        return stepFailed("unknown step kind");
    }

    bool acceptConnection()
    {
        const Clock::time_point until = deadline();
        for (;;) {
            if (!waitReadable(server.listener, leftUntil(until))) {
                return stepFailed("no client connected within " + std::to_string(server.stepTimeout.count()) + " ms");
            }
            Socket accepted = acceptFrom(server.listener);
            if (accepted.valid()) {
                connection = std::move(accepted);
                break;
            }
            const int error = lastSocketError();
            if (!isWouldBlock(error) && !isInterrupted(error) && !isConnectionAborted(error)) {
                return stepFailed("accept failed: " + socketErrorText(error));
            }
        }
        if (!setNonBlocking(connection, true)) {
            return stepFailed("cannot make the connection non-blocking");
        }
        everAccepted = true;
        const std::lock_guard<std::mutex> lock(server.mutex);
        ++server.accepted;
        return true;
    }

    bool ensureConnection()
    {
        if (connection.valid()) {
            return true;
        }
        if (everAccepted) {
            return stepFailed("there is no open connection (an earlier step closed it)");
        }
        return acceptConnection();
    }

    bool closeChecked()
    {
        const Bytes unread = drainWaiting(connection);
        connection.reset();
        if (!unread.empty()) {
            return stepFailed("the client sent " + std::to_string(unread.size()) + " bytes that no step read: \"" +
                              printable(unread) + "\"");
        }
        return true;
    }

    bool readFrame(Bytes& payload)
    {
        const Clock::time_point until = deadline();
        unsigned char prefix[4];
        const IoOutcome head = readExact(connection, reinterpret_cast<char*>(prefix), 4, until);
        if (head.result != Io::Ok) {
            return stepFailed(explain(head, 4, "the length prefix"));
        }
        const std::uint32_t length = decodeLength(prefix);
        if (length > kMaxFrameLength) {
            return stepFailed("the length prefix announces " + std::to_string(length) +
                              " bytes, more than any frame can be: " +
                              hexDump(std::string_view(reinterpret_cast<char*>(prefix), 4), 0, 4));
        }
        payload.assign(length, '\0');
        const IoOutcome body = readExact(connection, payload.data(), length, until);
        if (body.result != Io::Ok) {
            payload.resize(body.done);
            server.recordFrame(payload);
            return stepFailed(explain(body, length, "the payload") + "; received so far: \"" + printable(payload) +
                              "\"");
        }
        server.recordFrame(payload);
        return true;
    }

    bool expectFrame(const Step& step)
    {
        Bytes payload;
        if (!ensureConnection() || !readFrame(payload)) {
            return false;
        }
        if (step.kind == Kind::ExpectFrame) {
            if (payload != step.data) {
                return stepFailed("the frame differs from the expected one: " + describeDifference(step.data, payload));
            }
            return true;
        }
        if (!step.predicate(payload)) {
            return stepFailed("the frame does not match; received " + std::to_string(payload.size()) + " bytes: \"" +
                              printable(payload) + "\"\n" + hexDump(payload, 0, 64));
        }
        return true;
    }

    bool expectRaw(const Step& step)
    {
        if (!ensureConnection()) {
            return false;
        }
        const std::size_t count = step.kind == Kind::ExpectRaw ? step.count : step.data.size();
        Bytes bytes(count, '\0');
        const IoOutcome outcome = readExact(connection, bytes.data(), count, deadline());
        bytes.resize(outcome.done);
        server.recordRaw(bytes);
        if (outcome.result != Io::Ok) {
            return stepFailed(explain(outcome, count, "raw content"));
        }
        if (step.kind == Kind::ExpectRawBytes && bytes != step.data) {
            return stepFailed("the raw bytes differ: " + describeDifference(step.data, bytes));
        }
        return true;
    }

    bool expectPeerClose()
    {
        if (!ensureConnection()) {
            return false;
        }
        char byte = 0;
        const IoOutcome outcome = readExact(connection, &byte, 1, deadline());
        switch (outcome.result) {
        case Io::Closed:
            connection.reset();
            return true;
        case Io::Failed:
            if (isConnectionReset(outcome.error)) {
                connection.reset();
                return true;
            }
            return stepFailed(explain(outcome, 0, "anything"));
        case Io::TimedOut:
            return stepFailed("the client did not close the connection within " +
                              std::to_string(server.stepTimeout.count()) + " ms");
        case Io::Ok:
            break;
        }
        const Bytes rest = std::string(1, byte) + drainWaiting(connection);
        return stepFailed("the client sent " + std::to_string(rest.size()) + " bytes instead of closing: \"" +
                          printable(rest) + "\"");
    }

    bool send(std::string_view bytes, const std::string& what)
    {
        if (!ensureConnection()) {
            return false;
        }
        const IoOutcome outcome = writeAll(connection, bytes, deadline());
        if (outcome.result != Io::Ok) {
            return stepFailed("could not send " + what + ": " + explain(outcome, bytes.size(), what));
        }
        return true;
    }

    bool connectBack(const Step& step)
    {
        const Bytes last = server.lastFrame();
        const std::optional<Bytes> value = requestValue(last, step.name);
        if (!value) {
            return stepFailed("the last frame received has no value \"" + step.name + "\": \"" + printable(last) +
                              "\"");
        }
        const std::optional<std::uint16_t> port = parsePort(*value);
        if (!port) {
            return stepFailed("\"" + step.name + "=" + printable(*value) + "\" is not a port");
        }
        return connectAndSend(*port, step.data, step.source);
    }

    bool connectAndSend(std::uint16_t port, const Bytes& payload, const std::string& source)
    {
        Socket peer = openTcpSocket();
        if (!peer.valid() || !setNonBlocking(peer, true)) {
            return stepFailed("socket failed: " + socketErrorText(lastSocketError()));
        }
        if (!source.empty()) {
            const std::optional<std::uint32_t> local = parseDottedAddress(source);
            if (!local) {
                return stepFailed("\"" + source + "\" is not a dotted IPv4 address");
            }
            if (!bindTo(peer, *local, 0)) {
                return stepFailed("cannot leave from " + source + ": " + socketErrorText(lastSocketError()));
            }
        }
        const Clock::time_point until = deadline();
        const std::string target = "connect to port " + std::to_string(port);
        if (!connectTo(peer, kLoopback, port)) {
            const int error = lastSocketError();
            if (!isConnectInProgress(error)) {
                return stepFailed(target + " failed: " + socketErrorText(error));
            }
            if (!waitWritable(peer, leftUntil(until))) {
                return stepFailed(target + " timed out");
            }
            const std::optional<int> outcome = pendingError(peer);
            if (!outcome || *outcome != 0) {
                return stepFailed(target + " failed: " + socketErrorText(outcome ? *outcome : lastSocketError()));
            }
        }
        const IoOutcome outcome = writeAll(peer, frame(payload), until);
        if (outcome.result != Io::Ok) {
            return stepFailed("could not send the frame: " + explain(outcome, payload.size() + 4, "the frame"));
        }
        callbacks.push_back(std::move(peer));
        return true;
    }

    FakeServer& server;
    std::size_t index = 0;
    Socket connection;
    bool everAccepted = false;
    std::vector<Socket> callbacks;
};

// ---- The server -------------------------------------------------------------------------------------

FakeServer::FakeServer() : listener(listenOnLoopback(16))
{
    std::optional<std::uint16_t> port;
    if (listener.valid() && setNonBlocking(listener, true)) {
        port = localPort(listener);
    }
    if (!port) {
        throw std::runtime_error("fake server: cannot listen: " + socketErrorText(lastSocketError()));
    }
    listenPort = *port;
}

FakeServer::~FakeServer() { finish(); }

void FakeServer::setStepTimeout(Milliseconds timeout) { stepTimeout = timeout; }

void FakeServer::setHoldTimeout(Milliseconds timeout) { holdTimeout = timeout; }

FakeServer& FakeServer::add(Step step)
{
    if (started) {
        throw std::logic_error("fake server: steps must be added before start()");
    }
    steps.push_back(std::move(step));
    return *this;
}

FakeServer& FakeServer::expectFrame(Bytes payload) { return add({Kind::ExpectFrame, std::move(payload), {}, {}}); }

FakeServer& FakeServer::expectFrameWhere(std::string what, Predicate predicate)
{
    return add({Kind::ExpectFrameWhere, {}, std::move(what), std::move(predicate)});
}

FakeServer& FakeServer::expectAnyFrame()
{
    return expectFrameWhere("(any)", [](const Bytes&) { return true; });
}

FakeServer& FakeServer::expectRaw(std::size_t count) { return add({Kind::ExpectRaw, {}, {}, {}, count}); }

FakeServer& FakeServer::expectRawBytes(Bytes bytes) { return add({Kind::ExpectRawBytes, std::move(bytes), {}, {}}); }

FakeServer& FakeServer::expectPeerClose() { return add({Kind::ExpectPeerClose, {}, {}, {}}); }

FakeServer& FakeServer::sendFrame(Bytes payload) { return add({Kind::SendFrame, std::move(payload), {}, {}}); }

FakeServer& FakeServer::sendRaw(Bytes bytes) { return add({Kind::SendRaw, std::move(bytes), {}, {}}); }

FakeServer& FakeServer::closeConnection() { return add({Kind::Close, {}, {}, {}}); }

FakeServer& FakeServer::acceptNext() { return add({Kind::AcceptNext, {}, {}, {}}); }

FakeServer& FakeServer::connectBackAndSend(Bytes payload, std::string portValueName)
{
    return add({Kind::ConnectBack, std::move(payload), std::move(portValueName), {}});
}

FakeServer& FakeServer::connectToPortAndSend(std::uint16_t port, Bytes payload)
{
    return add({Kind::ConnectToPort, std::move(payload), {}, {}, 0, port});
}

FakeServer& FakeServer::connectBackFromAndSend(std::string sourceAddress, Bytes payload, std::string portValueName)
{
    Step step{Kind::ConnectBack, std::move(payload), std::move(portValueName), {}};
    step.source = std::move(sourceAddress);
    return add(std::move(step));
}

FakeServer& FakeServer::exchange(Bytes expected, Bytes answer)
{
    expectFrame(std::move(expected));
    return sendFrame(std::move(answer));
}

void FakeServer::start()
{
    if (started) {
        throw std::logic_error("fake server: start() called twice");
    }
    started = true;
    worker = std::thread([this] { runScript(); });
}

void FakeServer::runScript()
{
    Run run(*this);
    const bool completed = run.execute();
    {
        const std::lock_guard<std::mutex> lock(mutex);
        scriptDone = true;
    }
    changed.notify_all();
    if (!completed) {
        // Close at once, so that a client blocked in a read sees the end instead of waiting for ever.
        run.abandon();
        return;
    }
    {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait_for(lock, holdTimeout, [this] { return releaseRequested; });
    }
    run.closeAfterScript();
}

bool FakeServer::waitForScript()
{
    if (!started) {
        return passed();
    }
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this] { return scriptDone; });
    return firstFailure.empty();
}

bool FakeServer::waitForSteps(std::size_t count)
{
    if (!started) {
        return count == 0;
    }
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this, count] { return stepsDone >= count || scriptDone; });
    return stepsDone >= count;
}

bool FakeServer::finish()
{
    if (finished) {
        return passed();
    }
    finished = true;
    if (!started && !steps.empty()) {
        fail("the script was never started");
    }
    if (worker.joinable()) {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            releaseRequested = true;
        }
        changed.notify_all();
        worker.join();
    }
    if (connectionWaiting(listener)) {
        fail("a client connected but no step accepted the connection");
    }
    // Later connects are refused instead of waiting in the backlog of a server nobody serves.
    listener.reset();
    return passed();
}

::testing::AssertionResult FakeServer::verify()
{
    if (finish()) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "fake server: " << failure();
}

void FakeServer::fail(std::string message)
{
    const std::lock_guard<std::mutex> lock(mutex);
    if (firstFailure.empty()) {
        firstFailure = std::move(message);
    }
}

void FakeServer::recordFrame(Bytes payload)
{
    const std::lock_guard<std::mutex> lock(mutex);
    receivedFrames.push_back(std::move(payload));
}

void FakeServer::recordRaw(Bytes bytes)
{
    const std::lock_guard<std::mutex> lock(mutex);
    receivedRaw.push_back(std::move(bytes));
}

void FakeServer::stepDone()
{
    {
        const std::lock_guard<std::mutex> lock(mutex);
        ++stepsDone;
    }
    changed.notify_all();
}

bool FakeServer::passed() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return firstFailure.empty();
}

std::string FakeServer::failure() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return firstFailure;
}

std::vector<Bytes> FakeServer::frames() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return receivedFrames;
}

Bytes FakeServer::lastFrame() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return receivedFrames.empty() ? Bytes() : receivedFrames.back();
}

std::vector<Bytes> FakeServer::rawChunks() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return receivedRaw;
}

int FakeServer::connectionsAccepted() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return accepted;
}

}  // namespace zeltest
