// The wire bytes without a socket: reply splitting, file headers,
// acknowledgements and the classification of the server's error texts.

#include "transport/wire_format.h"

#include <cstdint>
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "support/fake_server.h"

namespace zel::wire {
namespace {

using namespace std::string_literals;
using zeltest::printable;

TEST(WireReply, SplitsIntoStatusWordAndBody)
{
    struct Case {
        const char* name;
        std::string payload;
        std::optional<Reply> expected;
    };
    const Case cases[] = {
        {"plain", "SUCCESS\0<R/>"s, Reply{"SUCCESS", "<R/>"}},
        {"body starting with NUL kept verbatim", "SUCCESS\0\0x"s, Reply{"SUCCESS", "\0x"s}},
        {"leading NULs skipped, NULs in the body kept", "\0\0SUCCESS\0a\0b"s, Reply{"SUCCESS", "a\0b"s}},
        {"no NUL", "SUCCESS"s, std::nullopt},
        {"nothing after the NUL", "SUCCESS\0"s, std::nullopt},
        {"only NULs after the word", "SUCCESS\0\0\0"s, std::nullopt},
    };
    for (const Case& c : cases) {
        const std::optional<Reply> reply = splitReply(c.payload);
        ASSERT_EQ(reply.has_value(), c.expected.has_value()) << c.name;
        if (reply) {
            EXPECT_EQ(reply->status, c.expected->status) << c.name;
            EXPECT_EQ(reply->body, c.expected->body) << c.name << ": " << printable(reply->body);
        }
    }
}

TEST(WireFileHeader, Parses)
{
    struct Case {
        const char* name;
        std::string payload;
        HeaderParse outcome;
        std::uint32_t length = 0;
        std::uint32_t crc = 0;
    };
    const Case cases[] = {
        {"largest", "fileLength=4294967295\0fileCRC=4294967295"s, HeaderParse::Header, 0xFFFFFFFFu, 0xFFFFFFFFu},
        {"hexadecimal", "fileLength=0x1F\0fileCRC=0XfF"s, HeaderParse::Header, 31, 255},
        {"plus sign", "fileLength=+7\0fileCRC=8"s, HeaderParse::Header, 7, 8},
        {"prefixes cut by length", "XXXXXXXXXXX5\0YYYYYYYY6"s, HeaderParse::Header, 5, 6},
        {"leading NULs skipped", "\0\0fileLength=3\0fileCRC=4"s, HeaderParse::Header, 3, 4},
        {"length overflows", "fileLength=4294967296\0fileCRC=1"s, HeaderParse::Unusable},
        {"empty length", "fileLength=\0fileCRC=1"s, HeaderParse::Unusable},
        {"trailing text", "fileLength=12abc\0fileCRC=1"s, HeaderParse::Unusable},
        {"minus sign", "fileLength=-1\0fileCRC=1"s, HeaderParse::Unusable},
        {"length part shorter than its prefix", "short\0fileCRC=1"s, HeaderParse::Unusable},
        {"more fields behind the crc", "fileLength=1\0fileCRC=1\0junk"s, HeaderParse::Unusable},
        {"no NUL", "fileLength=12"s, HeaderParse::NotTwoParts},
        {"nothing after the NUL", "fileLength=12\0"s, HeaderParse::NotTwoParts},
    };
    for (const Case& c : cases) {
        const FileHeaderReading reading = parseFileHeader(c.payload);
        EXPECT_EQ(reading.outcome, c.outcome) << c.name;
        if (c.outcome == HeaderParse::Header) {
            EXPECT_EQ(reading.header.length, c.length) << c.name;
            EXPECT_EQ(reading.header.crc, c.crc) << c.name;
        }
    }
}

TEST(WireServerError, ClassifiesByPrefixAtTheVeryStart)
{
    struct Case {
        std::string body;
        ServerErrorKind kind;
        std::string message;
    };
    const Case cases[] = {
        {"Authentication Error: bad password", ServerErrorKind::Authentication, "bad password"},
        {"Authorization Error: no rights", ServerErrorKind::Authorization, "no rights"},
        {"Failed. Authentication Error: x", ServerErrorKind::Plain, "Failed. Authentication Error: x"},
        {"authorization error: x", ServerErrorKind::Plain, "authorization error: x"},
        {"Authorization Error:x", ServerErrorKind::Plain, "Authorization Error:x"},
        {"a\0b"s, ServerErrorKind::Plain, "a\0b"s},
    };
    for (const Case& c : cases) {
        const ServerError error = classifyServerError(c.body);
        EXPECT_EQ(error.kind, c.kind) << printable(c.body);
        EXPECT_EQ(error.message, c.message) << printable(c.body);
    }
}

TEST(WireAcknowledgement, OnlyTheExactReadyReplyLetsATransferGoOn)
{
    struct Case {
        std::string payload;
        AckOutcome outcome;
        std::string body;
    };
    const Case cases[] = {
        {"SUCCESS\0ready_to_transfer"s, AckOutcome::Ready, ""},
        {"SUCCESS\0ready_to_transfer "s, AckOutcome::Refused, "ready_to_transfer "},
        {"SUCCESS\0ready_to_transfer\0"s, AckOutcome::Refused, "ready_to_transfer\0"s},
        {"success\0ready_to_transfer"s, AckOutcome::Refused, "ready_to_transfer"},
        {"ERROR\0Authorization Error: no"s, AckOutcome::Refused, "Authorization Error: no"},
        {"SUCCESS"s, AckOutcome::NotTwoParts, ""},
    };
    for (const Case& c : cases) {
        const AckReading ack = readAcknowledgement(c.payload);
        EXPECT_EQ(ack.outcome, c.outcome) << printable(c.payload);
        EXPECT_EQ(ack.body, c.body) << printable(c.payload);
    }
}

}  // namespace
}  // namespace zel::wire
