// A minimal client for the server's tests, written from the wire format alone. Every read is
// bounded by a poll time-out so a misbehaving server fails a test instead of hanging it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "support/fake_server.h"

namespace zeltest {

struct WireReply {
    std::string status;  // "SUCCESS", "ERROR", or "" when no reply came
    std::string body;
    bool ok() const { return status == "SUCCESS"; }
};

// A request with an empty client ID before `values`.
std::string requestPayload(const std::string& keyword, Values values);
WireReply splitReply(const std::string& payload);
// A "PATH" document for shared resource commands.
std::string pathDocument(const std::string& path);

struct Download {
    WireReply reply;  // the final reply, or the frame that replaced the file header
    bool gotFile = false;
    std::string content;
};

class TestClient {
public:
    bool connect(std::uint16_t port);
    bool sendRaw(const std::string& bytes);
    bool sendFrame(const std::string& payload) { return sendRaw(frame(payload)); }
    std::optional<std::string> readFrame(int timeoutMs = 5000);
    WireReply readReply() { return splitReply(readFrame().value_or("")); }
    // True when the server closed the connection (end of stream within the time-out).
    bool closedByPeer(int timeoutMs = 5000);

    WireReply command(const std::string& keyword, const Values& values = {});
    WireReply signIn(const std::string& user, const std::string& password);
    // The whole upload sequence; stops where the server answers with something else than an
    // acknowledgement and returns that. `announcedCrc` overrides the true CRC.
    WireReply upload(const std::string& keyword, const Values& values, const std::string& content,
                     std::optional<std::uint32_t> announcedCrc = std::nullopt);
    // Starts an upload with `header` for its file header (content left to the caller); the reply to
    // the header, or the refusal of the request.
    WireReply startUpload(const std::string& keyword, const Values& values, const std::string& header);
    Download download(const std::string& keyword, const Values& values);

private:
    bool recvExact(char* data, std::size_t size, int timeoutMs);

    Socket socket_;
};

}  // namespace zeltest
