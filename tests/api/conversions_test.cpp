// Number and truth-value texts from the wire: what each reader accepts, what it keeps when text
// follows the number, and where it overflows.

#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "api/conversions.h"

namespace {

template <class T>
struct WholeCase {
    std::string text;
    bool read;
    bool complete;
    T value;  // compared when `read`
};

template <class T, class Reader>
void checkTable(const std::vector<WholeCase<T>>& cases, Reader reader)
{
    for (const auto& c : cases) {
        SCOPED_TRACE("text \"" + c.text + "\"");
        const zel::NumberReading<T> reading = reader(c.text);
        EXPECT_EQ(reading.read, c.read);
        EXPECT_EQ(reading.complete, c.complete);
        if (c.read) {
            EXPECT_EQ(reading.value, c.value);
        }
        EXPECT_EQ(reading.whole().has_value(), c.complete);
    }
}

TEST(UnsignedConversion, PlainReader)
{
    checkTable<std::uint32_t>(
        {
            // decimal, hexadecimal, zero fractions and blanks
            {"17", true, true, 17},
            {"   17", true, true, 17},
            {" 0x1F ", true, true, 31},
            {"0X1f", true, true, 31},
            {"0x1F.00", true, true, 31},
            {"010", true, true, 10},  // no octal
            {"12.000", true, true, 12},
            {"+5", true, true, 5},
            {"4294967295", true, true, 4294967295u},
            {"0000000000004294967295", true, true, 4294967295u},
            // what follows the number is refused, but the number is kept
            {"12.5", true, false, 12},
            {"12 .0", true, false, 12},
            {"12abc", true, false, 12},
            {"0x", true, false, 0},
            {"-0x1F", true, false, 0},  // a sign hides the x from the base choice
            // no number, or overflow
            {"4294967296", false, false, 0},
            {"0x100000000", false, false, 0},
            {"-4294967296", false, false, 0},
            // a minus wraps
            {"-1", true, true, 4294967295u},
            {"-4294967295", true, true, 1},
        },
        zel::readUInt32);
}

TEST(UnsignedConversion, AnyBaseReaderRefusesAMinusAtOnce)
{
    checkTable<std::uint32_t>(
        {
            {"-1", false, false, 0},
            {"+7", true, true, 7},
            {" 0x10", true, true, 16},
            {"12.00 ", true, true, 12},
            {"12.5", true, false, 12},
            {"4294967295", true, true, 4294967295u},
            {"4294967296", false, false, 0},
        },
        zel::readUInt32AnyBase);
}

TEST(UnsignedConversion, SixtyFourBitLimits)
{
    checkTable<std::uint64_t>(
        {
            {"18446744073709551615", true, true, UINT64_MAX},
            {"0xFFFFFFFFFFFFFFFF", true, true, UINT64_MAX},
            {"4294967296", true, true, 4294967296ull},
            {"18446744073709551616", false, false, 0},
            {"0x10000000000000000", false, false, 0},
            {"-1", true, true, UINT64_MAX},
        },
        zel::readUInt64);
}

TEST(SignedConversion, TimeoutTexts)
{
    checkTable<std::int64_t>(
        {
            {"   3600", true, true, 3600},
            {"3600.5", true, false, 3600},
            {"0x10", true, true, 16},
            {"abc", false, false, 0},
            {"", false, false, 0},
            {"-5", true, true, -5},
            {"+5 ", true, true, 5},
            {"9223372036854775807", true, true, INT64_MAX},
            {"-9223372036854775808", true, true, INT64_MIN},
            {"9223372036854775808", false, false, 0},
            {"-9223372036854775809", false, false, 0},
            {"0x8000000000000000", false, false, 0},
        },
        zel::readInt64);
}

TEST(UnsignedConversion, ConvenienceFormsGiveOnlyWholeConversions)
{
    EXPECT_EQ(zel::toUInt32(" 0x1F "), 31u);
    EXPECT_FALSE(zel::toUInt32("12.5").has_value());
    EXPECT_FALSE(zel::toUInt32AnyBase("-1").has_value());
    EXPECT_EQ(zel::toUInt64("12.0"), 12u);
    EXPECT_EQ(zel::toInt64("-12.0"), -12);
    EXPECT_FALSE(zel::toInt64("3600.5").has_value());
}

TEST(UnsignedConversion, StoreWritesTheNumberBeforeCheckingWhatFollows)
{
    const struct {
        const char* text;
        bool whole;
        std::uint32_t stored;
    } cases[] = {
        {" 7 ", true, 7}, {"12abc", false, 12}, {"abc", false, 99}, {"", false, 99}, {"4294967296", false, 99}};
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
        {"yes", true},
        {"T", true},
        {"true", true},
        {"No", false},
        {"F", false},
        {"false", false},
        {"0", false},
        {"0.0", false},
        {"+0.000", false},
        {"1", true},
        {"2.5", true},
        {".5", true},
        {"0.001", true},
        {"99999999999999999999999999999", true},
        {"maybe", std::nullopt},
        {"", std::nullopt},
        {".", std::nullopt},
        {"1.2.3", std::nullopt},
        {"10abc", std::nullopt},
        {"1e3", std::nullopt},
        {" yes", std::nullopt},  // the letter rule looks at the very first character only
    };
    for (const auto& c : cases) {
        SCOPED_TRACE("text \"" + c.text + "\"");
        EXPECT_EQ(zel::toBoolean(c.text), c.expected);
        EXPECT_EQ(zel::toBooleanOrFalse(c.text), c.expected.value_or(false));
    }
}

TEST(FloatConversion, OrdinaryDecimalNotationOnly)
{
    const struct {
        std::string text;
        std::optional<float> expected;
    } cases[] = {
        {"1.5", 1.5f},           {" -2.25 ", -2.25f},   {"+0.5", 0.5f},
        {"1e3", 1000.0f},        {".25", 0.25f},        {"7", 7.0f},
        {"", std::nullopt},      {"abc", std::nullopt}, {"inf", std::nullopt},
        {"-inf", std::nullopt},  {"nan", std::nullopt}, {"infinity", std::nullopt},
        {"1.5x", std::nullopt},  {"+-1", std::nullopt}, {"1e39", std::nullopt},
        {"0x1p3", std::nullopt}, {"-", std::nullopt},   {"1 2", std::nullopt},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE("text \"" + c.text + "\"");
        EXPECT_EQ(zel::toFloat(c.text), c.expected);
    }
}

}  // namespace
