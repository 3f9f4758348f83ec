// The frame reader without a socket: whole, torn, oversized and trailing input, fed at once and one
// byte at a time, and what its buffer holds while a large frame arrives.

#include "transport/frame_reader.h"

#include <string>

#include <gtest/gtest.h>

namespace zel::wire {
namespace {

using namespace std::string_literals;
using State = FrameReader::State;

TEST(FrameReader, ReadsExactlyOneFrameWhateverThePieces)
{
    struct Case {
        const char* name;
        std::string input;
        std::uint32_t limit;
        State state;
        std::size_t used;  // bytes the reader took
        std::string payload;
    };
    const Case cases[] = {
        {"empty frame", "\0\0\0\0"s, 10, State::Complete, 4, ""},
        {"payload with NULs", "\0\0\0\003a\0b"s, 10, State::Complete, 7, "a\0b"s},
        {"bytes behind the frame stay", "\0\0\0\002okNEXT"s, 10, State::Complete, 6, "ok"},
        {"prefix torn", "\0\0"s, 10, State::Prefix, 2, ""},
        {"payload torn", "\0\0\0\005abc"s, 10, State::Payload, 7, ""},
        {"exactly the limit", "\0\0\0\003abc"s, 3, State::Complete, 7, "abc"},
        {"over the limit, content never taken", "\0\0\0\004abcd"s, 3, State::TooLarge, 4, ""},
        {"4 GiB announced", "\377\377\377\360SUCCESS"s, kDefaultMaxReplyBytes, State::TooLarge, 4, ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        FrameReader whole(c.limit);
        EXPECT_EQ(whole.feed(c.input), c.used);
        FrameReader bytewise(c.limit);
        std::size_t used = 0;
        for (char byte : c.input) {
            used += bytewise.feed(std::string(1, byte));
        }
        EXPECT_EQ(used, c.used);
        for (FrameReader* reader : {&whole, &bytewise}) {
            EXPECT_EQ(reader->state(), c.state);
            EXPECT_EQ(reader->wanted(), c.state == State::Prefix || c.state == State::Payload ? 2u : 0u);
            EXPECT_EQ(reader->takePayload(), c.payload);
            EXPECT_EQ(reader->state(), State::Prefix) << "ready for the next frame";
        }
    }
}

// A lying prefix costs only what arrives; a finished frame keeps exactly its payload.
TEST(FrameReader, BufferFollowsTheBytesThatArrived)
{
    const std::uint32_t announced = 8u << 20;
    FrameReader reader;
    reader.feed("\0\x80\0\0"s + std::string(1u << 20, 'x'));
    EXPECT_EQ(reader.state(), State::Payload);
    EXPECT_LE(reader.reserved(), 2u * (1u << 20));

    reader.feed(std::string(announced - (1u << 20), 'y'));
    ASSERT_EQ(reader.state(), State::Complete);
    EXPECT_EQ(reader.reserved(), announced);
    const std::string payload = reader.takePayload();
    EXPECT_EQ(payload.size(), announced);
    EXPECT_EQ(payload.capacity(), announced);
}

}  // namespace
}  // namespace zel::wire
