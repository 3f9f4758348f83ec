#include "transport/frame_reader.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace zel::wire {

namespace {

// The first reservation for a payload; later ones grow by half, capped at the announced length.
constexpr std::size_t kFirstReservation = 64 * 1024;

}  // namespace

FrameReader::FrameReader(std::uint32_t limit) : limit_(limit) {}

std::size_t FrameReader::wanted() const
{
    switch (state_) {
    case State::Prefix:
        return kLengthPrefixSize - prefixHave_;
    case State::Payload:
        return std::min<std::size_t>(announced_ - received_, kPiece);
    case State::Complete:
    case State::TooLarge:
        break;
    }
    return 0;
}

char* FrameReader::space()
{
    const std::size_t count = wanted();
    if (count == 0) {
        return nullptr;
    }
    if (state_ == State::Prefix) {
        return reinterpret_cast<char*>(prefix_) + prefixHave_;
    }
    reserveFor(received_ + count);
    payload_.resize(received_ + count);
    return payload_.data() + received_;
}

// std::string's own growth at least doubles the capacity, which left up to twice the payload
// allocated. The buffer is grown here by a half at a time into a fresh string reserved to the exact
// size, and the last step stops at the announced length.
void FrameReader::reserveFor(std::size_t needed)
{
    if (payload_.capacity() >= needed) {
        return;
    }
    const std::size_t grown = std::max({needed, payload_.capacity() + payload_.capacity() / 2, kFirstReservation});
    std::string bigger;
    bigger.reserve(std::min<std::size_t>(grown, announced_));
    bigger.append(payload_, 0, received_);
    payload_.swap(bigger);
}

FrameReader::State FrameReader::commit(std::size_t count)
{
    count = std::min(count, wanted());
    if (state_ == State::Prefix) {
        prefixHave_ += count;
        if (prefixHave_ == kLengthPrefixSize) {
            startPayload();
        }
    } else if (state_ == State::Payload) {
        received_ += count;
        if (received_ == announced_) {
            payload_.resize(received_);
            state_ = State::Complete;
        }
    }
    return state_;
}

void FrameReader::startPayload()
{
    announced_ = decodeLength(prefix_);
    if (announced_ > limit_) {
        state_ = State::TooLarge;
    } else {
        state_ = announced_ == 0 ? State::Complete : State::Payload;
    }
}

std::size_t FrameReader::feed(std::string_view bytes)
{
    std::size_t used = 0;
    while (used < bytes.size() && wanted() > 0) {
        const std::size_t count = std::min(wanted(), bytes.size() - used);
        std::memcpy(space(), bytes.data() + used, count);
        commit(count);
        used += count;
    }
    return used;
}

std::string FrameReader::takePayload()
{
    std::string payload;
    if (state_ == State::Complete) {
        payload.swap(payload_);
    }
    reset();
    return payload;
}

void FrameReader::reset()
{
    state_ = State::Prefix;
    prefixHave_ = 0;
    announced_ = 0;
    received_ = 0;
    std::string().swap(payload_);
}

}  // namespace zel::wire
