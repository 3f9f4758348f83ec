#include "support/fake_server.h"

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <stdexcept>

namespace zeltest {

namespace {

using std::chrono::milliseconds;

constexpr milliseconds kStepTimeout{5000};
constexpr milliseconds kHoldTimeout{10000};
// Far above any command the library sends; a larger prefix means the stream is out of step.
constexpr std::uint32_t kMaxFrameLength = 64u << 20;

// Reads whatever is waiting without blocking: the bytes that no step consumed.
Bytes drainWaiting(const Socket& socket)
{
    Bytes waiting;
    char chunk[4096];
    for (long got = 0; waitReadable(socket, milliseconds(0)) && (got = receiveSome(socket, chunk, sizeof chunk)) > 0;) {
        waiting.append(chunk, static_cast<std::size_t>(got));
    }
    return waiting;
}

}  // namespace

Bytes request(std::string_view keyword, const Values& values)
{
    Bytes payload = "APIVERSION=1" + std::string(1, '\0') + std::string(keyword);
    for (const auto& [name, value] : values) {
        payload += '\0' + name + '=' + value;
    }
    return payload;
}

Bytes reply(std::string_view status, std::string_view body) { return std::string(status) + '\0' + std::string(body); }

Bytes fileHeader(std::uint64_t length, std::uint32_t crc)
{
    return "fileLength=" + std::to_string(length) + '\0' + "fileCRC=" + std::to_string(crc);
}

Bytes readyAck() { return reply("SUCCESS", "ready_to_transfer"); }

Bytes frame(std::string_view payload)
{
    const auto length = static_cast<std::uint32_t>(payload.size());
    Bytes wire;
    for (int shift = 24; shift >= 0; shift -= 8) {
        wire.push_back(static_cast<char>((length >> shift) & 0xFF));
    }
    return wire.append(payload);
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

std::optional<ParsedRequest> parseRequest(std::string_view payload)
{
    std::vector<Bytes> parts;
    for (std::size_t start = 0, nul = 0; nul != std::string_view::npos; start = nul + 1) {
        nul = payload.find('\0', start);
        parts.emplace_back(payload.substr(start, nul == std::string_view::npos ? nul : nul - start));
    }
    if (parts.size() < 2 || parts[0].rfind("APIVERSION=", 0) != 0 || parts[1].empty()) {
        return std::nullopt;
    }
    ParsedRequest parsed{parts[1], {}};
    for (std::size_t i = 2; i < parts.size(); ++i) {
        const std::size_t equals = parts[i].find('=');
        if (equals == Bytes::npos) {
            return std::nullopt;
        }
        parsed.values.emplace_back(parts[i].substr(0, equals), parts[i].substr(equals + 1));
    }
    return parsed;
}

std::string printable(std::string_view data, std::size_t limit)
{
    std::string text;
    for (const char c : data.substr(0, limit)) {
        const auto byte = static_cast<unsigned char>(c);
        char escaped[8] = {c, 0};
        if (byte < 0x20 || byte >= 0x7F || c == '\\' || c == '"') {
            std::snprintf(escaped, sizeof escaped, byte == 0 ? "\\0" : "\\x%02X", byte);
        }
        text += escaped;
    }
    return limit < data.size() ? text + "... (" + std::to_string(data.size()) + " bytes in all)" : text;
}

// ---- The run on the worker thread -------------------------------------------------------------------

// What only the worker thread touches: the current connection and the connect-back ones. Every
// operation returns false after recording why it failed.
class FakeServer::Run {
public:
    Run(FakeServer& server, std::size_t index) : server(server), index(index) {}

    bool failed(const std::string& detail)
    {
        server.fail(index < server.steps.size()
                        ? "step " + std::to_string(index + 1) + " (" + server.steps[index].what + "): " + detail
                        : "after the last step: " + detail);
        return false;
    }

    bool accept()
    {
        if (!waitReadable(server.listener, kStepTimeout)) {
            return failed("no client connected");
        }
        connection = acceptFrom(server.listener);
        // Winsock hands a listener's non-blocking mode on to the accepted socket.
        if (!connection.valid() || !setNonBlocking(connection, false) || !setSendTimeout(connection, kStepTimeout)) {
            return failed("accept failed");
        }
        everAccepted = true;
        return true;
    }

    // The current connection; the first one is accepted when no step took one yet.
    bool connected()
    {
        if (connection.valid()) {
            return true;
        }
        return everAccepted ? failed("there is no open connection (an earlier step closed it)") : accept();
    }

    bool read(Bytes& out, std::size_t count, const std::string& what)
    {
        out.assign(count, '\0');
        for (std::size_t done = 0; done < count;) {
            const long got =
                waitReadable(connection, kStepTimeout) ? receiveSome(connection, out.data() + done, count - done) : -1;
            if (got <= 0) {
                out.resize(done);
                return failed(std::string(got == 0 ? "the client closed the connection" : "timed out or failed") +
                              " after " + std::to_string(done) + " of " + std::to_string(count) + " bytes of " + what +
                              ": \"" + printable(out) + "\"");
            }
            done += static_cast<std::size_t>(got);
        }
        return true;
    }

    bool readFrame(Bytes& payload)
    {
        Bytes prefix;
        if (!connected() || !read(prefix, 4, "the length prefix")) {
            return false;
        }
        std::uint32_t length = 0;
        for (const char byte : prefix) {
            length = (length << 8) | static_cast<unsigned char>(byte);
        }
        if (length > kMaxFrameLength) {
            return failed("the length prefix announces " + std::to_string(length) + " bytes");
        }
        const bool complete = read(payload, length, "the payload");
        lastFrame = payload;
        return complete;
    }

    bool send(const Bytes& bytes)
    {
        for (std::size_t done = 0; done < bytes.size();) {
            const long sent = sendSome(connection, bytes.data() + done, bytes.size() - done);
            if (sent <= 0) {
                return failed("could not send");
            }
            done += static_cast<std::size_t>(sent);
        }
        return true;
    }

    bool close()
    {
        const Bytes unread = drainWaiting(connection);
        connection.reset();
        return unread.empty() || failed("the client sent " + std::to_string(unread.size()) +
                                        " bytes that no step read: \"" + printable(unread) + "\"");
    }

    bool peerClosed()
    {
        char byte = 0;
        if (!waitReadable(connection, kStepTimeout)) {
            return failed("the client did not close the connection");
        }
        // A reset counts as a close too.
        if (receiveSome(connection, &byte, 1) <= 0) {
            connection.reset();
            return true;
        }
        return failed("the client sent \"" + printable(byte + drainWaiting(connection)) + "\" instead of closing");
    }

    bool connectBack(const std::string& source, const Bytes& payload)
    {
        unsigned long port = 0;
        if (const std::optional<ParsedRequest> parsed = parseRequest(lastFrame)) {
            for (const auto& [name, value] : parsed->values) {
                port = port == 0 && name == "requesterResultPort" ? std::strtoul(value.c_str(), nullptr, 10) : port;
            }
        }
        if (port == 0 || port > 65535) {
            return failed("the last frame received names no result port: \"" + printable(lastFrame) + "\"");
        }
        Socket peer = openTcpSocket();
        const std::optional<std::uint32_t> from = parseDottedAddress(source.empty() ? "0.0.0.0" : source);
        if (!from || !bindTo(peer, *from, 0) || !connectTo(peer, kLoopback, static_cast<std::uint16_t>(port)) ||
            !setSendTimeout(peer, kStepTimeout)) {
            return failed("cannot connect back");
        }
        std::swap(peer, connection);
        const bool sent = send(frame(payload));
        std::swap(peer, connection);
        callbacks.push_back(std::move(peer));
        return sent;
    }

    // After a clean script, bytes that no step read are a failure of the test.
    void end(bool clean)
    {
        if (clean && connection.valid()) {
            close();
        }
        connection.reset();
        callbacks.clear();
    }

    FakeServer& server;
    std::size_t index;
    Socket connection;
    Bytes lastFrame;  // the payload of the last frame received, for connect-backs
    bool everAccepted = false;
    std::vector<Socket> callbacks;
};

// ---- The server -------------------------------------------------------------------------------------

FakeServer::FakeServer() : listener(listenOnLoopback(16))
{
    // Non-blocking, so that a client that gave up between the wait and the accept cannot block it.
    const bool usable = listener.valid() && setNonBlocking(listener, true);
    const std::optional<std::uint16_t> port = usable ? localPort(listener) : std::nullopt;
    if (!port) {
        throw std::runtime_error("fake server: cannot listen");
    }
    listenPort = *port;
}

FakeServer& FakeServer::add(std::string what, std::function<bool(Run&)> act)
{
    steps.push_back({std::move(what), std::move(act)});
    return *this;
}

FakeServer& FakeServer::expectFrame(Bytes payload)
{
    return add("expect frame \"" + printable(payload, 48) + "\"", [payload](Run& run) {
        Bytes got;
        return run.readFrame(got) && (got == payload || run.failed("the frame differs: received \"" + printable(got) +
                                                                   "\", expected \"" + printable(payload) + "\""));
    });
}

FakeServer& FakeServer::expectFrameWhere(std::string what, Predicate predicate)
{
    return add("expect frame where " + what, [predicate](Run& run) {
        Bytes got;
        return run.readFrame(got) &&
               (predicate(got) || run.failed("the frame does not match: \"" + printable(got) + "\""));
    });
}

FakeServer& FakeServer::expectAnyFrame()
{
    return expectFrameWhere("(any)", [](const Bytes&) { return true; });
}

FakeServer& FakeServer::expectRaw(Bytes bytes)
{
    return add("expect raw bytes \"" + printable(bytes, 48) + "\"", [bytes](Run& run) {
        Bytes got;
        return run.connected() && run.read(got, bytes.size(), "raw content") &&
               (got == bytes || run.failed("the raw bytes differ: \"" + printable(got) + "\""));
    });
}

FakeServer& FakeServer::expectPeerClose()
{
    return add("expect the client to close", [](Run& run) { return run.connected() && run.peerClosed(); });
}

FakeServer& FakeServer::sendFrame(Bytes payload)
{
    return add("send frame \"" + printable(payload, 48) + "\"",
               [wire = frame(payload)](Run& run) { return run.connected() && run.send(wire); });
}

FakeServer& FakeServer::sendRaw(Bytes bytes)
{
    return add("send " + std::to_string(bytes.size()) + " raw bytes",
               [bytes](Run& run) { return run.connected() && run.send(bytes); });
}

FakeServer& FakeServer::closeConnection()
{
    return add("close the connection", [](Run& run) { return run.connected() && run.close(); });
}

FakeServer& FakeServer::acceptNext()
{
    return add("accept the next connection",
               [](Run& run) { return (!run.connection.valid() || run.close()) && run.accept(); });
}

FakeServer& FakeServer::connectBackAndSend(Bytes payload, std::string sourceAddress)
{
    return add("connect back " + sourceAddress, [=](Run& run) { return run.connectBack(sourceAddress, payload); });
}

FakeServer& FakeServer::exchange(Bytes expected, Bytes answer)
{
    return expectFrame(std::move(expected)).sendFrame(std::move(answer));
}

void FakeServer::start()
{
    worker = std::thread([this] {
        Run run(*this, 0);
        while (run.index < steps.size() && steps[run.index].act(run)) {
            ++run.index;
        }
        std::unique_lock<std::mutex> lock(mutex);
        // After a failure the connections close at once, so that a blocked client sees the end.
        if (firstFailure.empty()) {
            changed.wait_for(lock, kHoldTimeout, [this] { return releaseRequested; });
        }
        const bool clean = firstFailure.empty();
        lock.unlock();
        run.end(clean);
    });
}

bool FakeServer::finish()
{
    if (finished) {
        return failure().empty();
    }
    finished = true;
    if (!worker.joinable() && !steps.empty()) {
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
    if (listener.valid() && waitReadable(listener, milliseconds(0))) {
        fail("a client connected but no step accepted the connection");
    }
    // Later connects are refused instead of waiting in the backlog of a server nobody serves.
    listener.reset();
    return failure().empty();
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

std::string FakeServer::failure() const
{
    const std::lock_guard<std::mutex> lock(mutex);
    return firstFailure;
}

}  // namespace zeltest
