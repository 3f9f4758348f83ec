#pragma once
// Reads one frame (4-byte big-endian length, then the payload) out of bytes handed to it as they
// arrive, without a socket: the channel feeds it from the connection, tests and the fuzzer from
// memory.
//
// A length above the limit is refused as soon as the prefix is complete, before any payload byte is
// taken. Below the limit the payload buffer still grows only with the bytes that actually arrive, so
// a prefix that announces much and then stalls costs nothing; when the frame is complete the buffer
// holds exactly the payload. The reader never asks for more bytes than the frame holds, so a caller
// that reads exactly wanted() bytes never takes a byte of what follows the frame (file content).
//
//     FrameReader reader(limit);
//     while (reader.wanted() > 0) {
//         char* space = reader.space();          // room for wanted() bytes
//         ... receive exactly reader.wanted() bytes into space ...
//         reader.commit(reader.wanted());
//     }
//     if (reader.state() == FrameReader::State::Complete) use(reader.takePayload());

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "transport/wire_format.h"

namespace zel::wire {

// The largest reply payload accepted when the connection sets no "MAX_REPLY_BYTES": 64 MiB, which
// holds a list of about 300,000 entries.
inline constexpr std::uint32_t kDefaultMaxReplyBytes = 64u << 20;

class FrameReader {
public:
    enum class State {
        Prefix,    // the length prefix is not complete yet
        Payload,   // the prefix is in; payload bytes are missing
        Complete,  // the whole frame is in: takePayload()
        TooLarge,  // the prefix announced more than the limit; nothing more is taken
    };

    // `limit`: the largest payload accepted, in bytes.
    explicit FrameReader(std::uint32_t limit = kDefaultMaxReplyBytes);

    State state() const { return state_; }
    // The payload length the prefix announced; 0 until the prefix is complete.
    std::uint32_t announced() const { return announced_; }
    std::uint32_t limit() const { return limit_; }
    // Bytes held for the payload so far.
    std::size_t reserved() const { return payload_.capacity(); }

    // How many bytes the reader takes next: the rest of the prefix, or the next piece of the payload
    // (at most kPiece bytes, never beyond the frame's end). 0 when complete or refused.
    std::size_t wanted() const;

    // Room for wanted() bytes, valid until the next call on the reader; null when wanted() is 0.
    // Growing the buffer may throw std::bad_alloc.
    char* space();
    // Records that the first `count` bytes of space() were filled (at most wanted()).
    State commit(std::size_t count);

    // Copies as much of `bytes` as the frame takes and returns how many bytes were used; the rest
    // belongs to whatever follows the frame.
    std::size_t feed(std::string_view bytes);

    // The payload of a complete frame; the reader is then ready for the next frame.
    std::string takePayload();
    // Back to an empty reader, keeping the limit.
    void reset();

    // The payload is received in pieces of this size, so the buffer runs at most this far ahead of
    // the bytes that arrived.
    static constexpr std::size_t kPiece = 256 * 1024;

private:
    void startPayload();
    void reserveFor(std::size_t needed);

    std::uint32_t limit_;
    State state_ = State::Prefix;
    unsigned char prefix_[kLengthPrefixSize] = {};
    std::size_t prefixHave_ = 0;
    std::uint32_t announced_ = 0;
    std::string payload_;  // its size is the room handed out; received_ bytes of it are filled
    std::size_t received_ = 0;
};

}  // namespace zel::wire
