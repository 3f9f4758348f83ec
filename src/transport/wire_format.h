#pragma once
// The bytes of the wire protocol without a socket: frames, the command payload, reply splitting,
// file headers and the classification of the server's error texts. The channel only moves what
// these functions build and hands what it received to them.
//
// A frame is a 4-byte big-endian payload length followed by the payload (no terminator; NUL bytes
// are ordinary bytes). Replies and file headers are two texts joined by a NUL.

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace zel::wire {

// The API version every command announces.
inline constexpr std::uint32_t kApiVersion = 1;
// File content moves in pieces of at most this many bytes, through one reused buffer.
inline constexpr std::size_t kChunkSize = 131072;
inline constexpr std::size_t kLengthPrefixSize = 4;
// The largest payload a 32-bit length prefix can announce.
inline constexpr std::uint64_t kMaxPayload = 0xFFFFFFFFull;

inline constexpr std::string_view kSuccess = "SUCCESS";
inline constexpr std::string_view kError = "ERROR";
inline constexpr std::string_view kReadyToTransfer = "ready_to_transfer";

// ---- Frames ---------------------------------------------------------------------------------------

// Length prefix and payload in one buffer, ready for a single send. Nullopt when the payload is too
// long for the prefix.
std::optional<std::string> encodeFrame(std::string_view payload);

// The payload length announced by a 4-byte prefix.
std::uint32_t decodeLength(const unsigned char (&prefix)[kLengthPrefixSize]);

// "APIVERSION=1" and a NUL: what every command payload starts with.
std::string versionHeader();

// The frame of one command: prefix, version header, request text. Nullopt when too long.
std::optional<std::string> encodeCommandFrame(std::string_view requestText);

// The payload "SUCCESS" NUL "ready_to_transfer": the side that is to receive a file says it is ready.
std::string acknowledgement();

// ---- Replies --------------------------------------------------------------------------------------

struct Reply {
    std::string status;
    std::string body;
};

// Status word and body of a reply payload: leading NULs are skipped, the word runs to the next NUL,
// and the body is everything behind that NUL, verbatim (NULs included). Nullopt when there is no
// NUL behind the word, or when nothing but NULs follows it: a reply must carry a non-empty body.
std::optional<Reply> splitReply(std::string_view payload);

// The reply that stands in for a download the server had no file for: "SUCCESS" NUL "false".
std::string noFileReply();

// ---- File headers ---------------------------------------------------------------------------------

struct FileHeader {
    std::uint32_t length = 0;
    std::uint32_t crc = 0;
};

// "fileLength=" length NUL "fileCRC=" crc, both unsigned decimal.
std::string encodeFileHeader(FileHeader header);

enum class HeaderParse {
    Header,       // both numbers read
    NotTwoParts,  // the payload does not split into two texts (see splitReply)
    Unusable,     // two texts, but a prefix is missing or a number does not convert
};

struct FileHeaderReading {
    HeaderParse outcome = HeaderParse::NotTwoParts;
    FileHeader header;
};

// Reads a file header. The prefixes are cut off by their length and never compared, so that a header
// reads exactly as the server's own reader takes it: only the numbers carry meaning. The numbers are unsigned 32-bit through
// the shared conversion (leading blanks, "0x" hexadecimal, an all-zero fraction and trailing blanks
// allowed); a sign of minus, any other trailing text, an empty text or an overflow make the header
// unusable.
FileHeaderReading parseFileHeader(std::string_view payload);

// ---- Acknowledgements and errors ------------------------------------------------------------------

// How the server's "ERROR" text is reported: the kind becomes the status's secondary code (getCode)
// under message number 393625, so a caller tells a refused sign-in from missing rights without
// reading the text.
enum class ServerErrorKind : unsigned {
    Plain = 0,
    Authentication = 1,
    Authorization = 2,
};

struct ServerError {
    ServerErrorKind kind = ServerErrorKind::Plain;
    std::string message;
};

// "Authentication Error: " or "Authorization Error: " at the very start of the body selects the
// kind and is removed; anywhere else it is ordinary text and the whole body is the message.
ServerError classifyServerError(std::string_view body);

enum class AckOutcome {
    Ready,        // "SUCCESS" with body exactly "ready_to_transfer"
    NotTwoParts,  // no usable split (see splitReply)
    Refused,      // anything else: the body is the server's error text
};

struct AckReading {
    AckOutcome outcome = AckOutcome::NotTwoParts;
    std::string body;  // the reply body when Refused
};

AckReading readAcknowledgement(std::string_view payload);

}  // namespace zel::wire
