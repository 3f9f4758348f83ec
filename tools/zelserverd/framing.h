// The wire format seen from the server: length-prefixed frames, the request text, replies,
// acknowledgements and file headers. Everything here is a pure function over bytes, so the
// parsers can be tested with tables of hostile input without a socket.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace zelserverd {

constexpr std::string_view kSuccess = "SUCCESS";
constexpr std::string_view kError = "ERROR";
constexpr std::string_view kReadyToTransfer = "ready_to_transfer";
constexpr std::string_view kAuthenticationError = "Authentication Error: ";
constexpr std::string_view kAuthorizationError = "Authorization Error: ";

// 4-byte big-endian length followed by the payload: one buffer, so one send() per frame.
std::string encodeFrame(std::string_view payload);
std::uint32_t decodeLength(const unsigned char prefix[4]);

// One parsed command: the keyword and its named values in wire order. A name may occur more than
// once (the result-port exchange sends "requesterResultPort" twice); lookups take the first.
struct Request {
    std::string keyword;
    std::vector<std::pair<std::string, std::string>> values;

    const std::string* find(std::string_view name) const;
    std::string get(std::string_view name, std::string_view fallback = {}) const;
    std::vector<std::string> all(std::string_view name) const;
};

// Parses "APIVERSION=1" NUL keyword {NUL name "=" value}. Returns an explanation on failure.
std::optional<std::string> parseRequest(std::string_view payload, Request& out);

std::string replyPayload(bool success, std::string_view body);
std::string ackPayload();
bool isAck(std::string_view payload);

std::string fileHeaderPayload(std::uint64_t length, std::uint32_t crc);
struct FileHeader {
    std::uint64_t length = 0;
    std::uint32_t crc = 0;
};
// Strict: "fileLength=" decimal NUL "fileCRC=" decimal, the length within 32 bits.
std::optional<FileHeader> parseFileHeader(std::string_view payload);

// CRC-32 of IEEE 802.3 (reflected 0xEDB88320, initial and final complement), fed in pieces.
class Crc32 {
public:
    void update(const void* data, std::size_t size);
    std::uint32_t value() const { return ~state_; }

private:
    std::uint32_t state_ = 0xFFFFFFFFu;
};

}  // namespace zelserverd
