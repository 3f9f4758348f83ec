#include "transport/wire_format.h"

#include <vector>

#include "api/conversions.h"
#include "api/text_split.h"

namespace zel::wire {

namespace {

constexpr std::string_view kNul("\0", 1);
constexpr std::string_view kLengthPrefix = "fileLength=";
constexpr std::string_view kCrcPrefix = "fileCRC=";
constexpr std::string_view kAuthenticationPrefix = "Authentication Error: ";
constexpr std::string_view kAuthorizationPrefix = "Authorization Error: ";

void appendLength(std::string& out, std::uint32_t length)
{
    out.push_back(static_cast<char>((length >> 24) & 0xFF));
    out.push_back(static_cast<char>((length >> 16) & 0xFF));
    out.push_back(static_cast<char>((length >> 8) & 0xFF));
    out.push_back(static_cast<char>(length & 0xFF));
}

// A minus sign is refused: a length read as its wrapped-around value would announce gigabytes.
std::optional<std::uint32_t> headerNumber(std::string_view text, std::string_view prefix)
{
    if (text.size() < prefix.size()) {
        return std::nullopt;
    }
    return toUInt32AnyBase(text.substr(prefix.size()));
}

std::optional<std::string> encodeFrameOf(std::string_view first, std::string_view second)
{
    const std::uint64_t length = std::uint64_t{first.size()} + second.size();
    if (length > kMaxPayload) {
        return std::nullopt;
    }
    std::string frame;
    frame.reserve(kLengthPrefixSize + static_cast<std::size_t>(length));
    appendLength(frame, static_cast<std::uint32_t>(length));
    frame.append(first);
    frame.append(second);
    return frame;
}

}  // namespace

std::optional<std::string> encodeFrame(std::string_view payload) { return encodeFrameOf(payload, {}); }

std::uint32_t decodeLength(const unsigned char (&prefix)[kLengthPrefixSize])
{
    return (std::uint32_t{prefix[0]} << 24) | (std::uint32_t{prefix[1]} << 16) | (std::uint32_t{prefix[2]} << 8) |
           std::uint32_t{prefix[3]};
}

std::string versionHeader()
{
    std::string header = "APIVERSION=" + decimalText(kApiVersion);
    header.append(kNul);
    return header;
}

std::optional<std::string> encodeCommandFrame(std::string_view requestText)
{
    return encodeFrameOf(versionHeader(), requestText);
}

std::string acknowledgement()
{
    std::string payload(kSuccess);
    payload.append(kNul);
    payload.append(kReadyToTransfer);
    return payload;
}

std::optional<Reply> splitReply(std::string_view payload)
{
    std::vector<std::string> parts;
    if (splitOnce(payload, kNul, 2, parts) != 2) {
        return std::nullopt;
    }
    return Reply{std::move(parts[0]), std::move(parts[1])};
}

std::string noFileReply()
{
    std::string payload(kSuccess);
    payload.append(kNul);
    payload.append("false");
    return payload;
}

std::string encodeFileHeader(FileHeader header)
{
    std::string payload(kLengthPrefix);
    payload.append(decimalText(header.length));
    payload.append(kNul);
    payload.append(kCrcPrefix);
    payload.append(decimalText(header.crc));
    return payload;
}

FileHeaderReading parseFileHeader(std::string_view payload)
{
    FileHeaderReading reading;
    const std::optional<Reply> parts = splitReply(payload);
    if (!parts) {
        return reading;
    }
    const std::optional<std::uint32_t> length = headerNumber(parts->status, kLengthPrefix);
    const std::optional<std::uint32_t> crc = headerNumber(parts->body, kCrcPrefix);
    if (!length || !crc) {
        reading.outcome = HeaderParse::Unusable;
        return reading;
    }
    reading.outcome = HeaderParse::Header;
    reading.header = FileHeader{*length, *crc};
    return reading;
}

ServerError classifyServerError(std::string_view body)
{
    if (body.starts_with(kAuthenticationPrefix)) {
        return {ServerErrorKind::Authentication, std::string(body.substr(kAuthenticationPrefix.size()))};
    }
    if (body.starts_with(kAuthorizationPrefix)) {
        return {ServerErrorKind::Authorization, std::string(body.substr(kAuthorizationPrefix.size()))};
    }
    return {ServerErrorKind::Plain, std::string(body)};
}

AckReading readAcknowledgement(std::string_view payload)
{
    AckReading reading;
    std::optional<Reply> reply = splitReply(payload);
    if (!reply) {
        return reading;
    }
    if (reply->status == kSuccess && reply->body == kReadyToTransfer) {
        reading.outcome = AckOutcome::Ready;
        return reading;
    }
    reading.outcome = AckOutcome::Refused;
    reading.body = std::move(reply->body);
    return reading;
}

}  // namespace zel::wire
