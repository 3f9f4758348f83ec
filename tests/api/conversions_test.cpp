// Number and truth-value texts from the wire: what each reader accepts, what it keeps when text
// follows the number, and where it overflows.

#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <string>

#include "api/conversions.h"

namespace {

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

TEST(NumberConversion, StoreWritesTheNumberBeforeCheckingWhatFollows)
{
    const struct {
        const char* text;
        bool whole;
        std::uint32_t stored;
    } cases[] = {{" 7 ", true, 7}, {"12abc", false, 12}, {"abc", false, 99}, {"4294967296", false, 99}};
    for (const auto& c : cases) {
        std::uint32_t out = 99;
        EXPECT_EQ(zel::storeUInt32(c.text, out), c.whole) << c.text;
        EXPECT_EQ(out, c.stored) << c.text;
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

TEST(FloatConversion, OrdinaryDecimalNotationOnly)
{
    const struct {
        std::string text;
        std::optional<float> expected;
    } cases[] = {
        {" -2.25 ", -2.25f},    {"1e3", 1000.0f},        {".25", 0.25f},         {"", std::nullopt},
        {"inf", std::nullopt},  {"nan", std::nullopt},   {"1.5x", std::nullopt}, {"+-1", std::nullopt},
        {"1e39", std::nullopt}, {"0x1p3", std::nullopt}, {"1 2", std::nullopt},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(zel::toFloat(c.text), c.expected) << c.text;
    }
}

}  // namespace
