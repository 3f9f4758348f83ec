// Texts from the wire: what each number and truth-value reader accepts and where it overflows; and
// how a reply is cut into status word and body.

#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <vector>

#include "api/conversions.h"
#include "api/text_split.h"

namespace {

using namespace std::string_literals;
using Parts = std::vector<std::string>;

template <class T>
std::string shown(const zel::NumberReading<T>& r)
{
    return (r.read ? std::to_string(r.value) : std::string("-")) + (r.complete ? " whole" : "");
}

TEST(NumberConversion, ReadersAcceptDecimalHexAndZeroFractionsAndRefuseOverflow)
{
    enum Reader { U32, AnyBase, I64 };
    const struct {
        Reader reader;
        const char* text;
        const char* expected;  // value read ("-" for none), " whole" when nothing else follows
    } cases[] = {
        {U32, " 0x1F ", "31 whole"},
        {U32, "0Xaf", "175 whole"},
        {U32, "010", "10 whole"},  // no octal
        {U32, "12.000", "12 whole"},
        {U32, "12.5", "12"},
        {U32, "-0x1F", "0"},  // a sign hides the x from the base choice
        {U32, "4294967295", "4294967295 whole"},
        {U32, "4294967296", "-"},
        {U32, "0x100000000", "-"},
        {U32, "-1", "4294967295 whole"},  // a minus wraps
        {AnyBase, "-1", "-"},
        {AnyBase, "4294967296", "-"},
        {I64, "3600.5", "3600"},
        {I64, "", "-"},
        {I64, "-9223372036854775808", "-9223372036854775808 whole"},
        {I64, "9223372036854775808", "-"},
        {I64, "-9223372036854775809", "-"},
    };
    for (const auto& c : cases) {
        const std::string got = c.reader == U32       ? shown(zel::readUInt32(c.text))
                                : c.reader == AnyBase ? shown(zel::readUInt32AnyBase(c.text))
                                                      : shown(zel::readInt64(c.text));
        EXPECT_EQ(got, c.expected) << "reader " << c.reader << " text \"" << c.text << "\"";
    }
}

TEST(BooleanConversion, FirstLetterThenNumber)
{
    const struct {
        std::string text;
        std::optional<bool> expected;
    } cases[] = {
        {"yes", true},           {"T", true},           {"No", false},          {"f", false},
        {"0.0", false},          {"+0", false},         {".5", true},           {"2", true},
        {"maybe", std::nullopt}, {"", std::nullopt},    {".", std::nullopt},    {"1.2.3", std::nullopt},
        {"10abc", std::nullopt}, {"1e3", std::nullopt}, {" yes", std::nullopt},  // the letter rule looks at the very first character only
    };
    for (const auto& c : cases) {
        EXPECT_EQ(zel::toBoolean(c.text), c.expected) << c.text;
    }
}

// How the transport cuts a reply: the status word, then the body verbatim (the reply splitter's own
// table has the rest).
TEST(SplitOnce, StatusWordThenTheBodyVerbatim)
{
    const std::pair<std::string, Parts> cases[] = {
        {"\0\0SUCCESS\0a\0b"s, {"SUCCESS", "a\0b"s}},  // leading NULs skipped, the body keeps its NULs
        {"\0\0"s, {}},
    };
    for (const auto& [text, expected] : cases) {
        Parts out{"kept"};
        EXPECT_EQ(zel::splitOnce(text, "\0"s, 2, out), expected.size()) << text;
        out.erase(out.begin());
        EXPECT_EQ(out, expected) << text;
    }
}

}  // namespace
