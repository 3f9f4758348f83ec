#pragma once
// Numbers and truth values read from server text (reply bodies, XML attributes, result properties,
// file-transfer headers), and the decimal text the library writes back. Every number the library
// takes from the server goes through here, so overflow is refused in one place.
//
// Whole numbers, as the server writes them:
//  - leading blanks (space, tab, line breaks) are skipped; nothing left fails;
//  - the number is hexadecimal when the text starts with "0x" or "0X" followed by a hex digit, and
//    decimal otherwise; a leading zero does not select octal ("010" is ten);
//  - the number may be followed by a point and zeros only ("12.000", also "12."), then blanks only;
//    anything else behind it fails ("12.5", "12abc");
//  - a value outside the target type fails;
//  - the plain unsigned readers take a sign the way the C library's unsigned conversion does: "-1"
//    wraps to the type's maximum, so they accept exactly what the server's own reader accepts.
//    Fields that must refuse a negative number use the any-base reader, which fails on a leading
//    minus at once; that refusal is the only difference between the two.

#include <charconv>
#include <concepts>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace zel {

template <class T>
struct NumberReading {
    // The number taken from the front of the text; meaningful when `read`.
    T value = 0;
    // At least one digit was read and the number fits the type.
    bool read = false;
    // Moreover, only an all-zero fraction and blanks followed it: the text converts.
    bool complete = false;

    std::optional<T> whole() const { return complete ? std::optional<T>(value) : std::nullopt; }
};

NumberReading<std::uint32_t> readUInt32(std::string_view text);
// As readUInt32, but a minus sign (after the leading blanks) fails before anything is read.
NumberReading<std::uint32_t> readUInt32AnyBase(std::string_view text);
NumberReading<std::uint64_t> readUInt64(std::string_view text);
NumberReading<std::int64_t> readInt64(std::string_view text);

inline std::optional<std::uint32_t> toUInt32(std::string_view text) { return readUInt32(text).whole(); }
inline std::optional<std::uint32_t> toUInt32AnyBase(std::string_view text) { return readUInt32AnyBase(text).whole(); }
inline std::optional<std::uint64_t> toUInt64(std::string_view text) { return readUInt64(text).whole(); }
inline std::optional<std::int64_t> toInt64(std::string_view text) { return readInt64(text).whole(); }

// Stores the number into `out` as soon as one was read, before the text behind it is checked, and
// returns whether the whole text converted. Some readers depend on this: "12abc" leaves 12 in `out`
// and still counts as a failure; a text holding no number at all leaves `out` untouched.
bool storeUInt32(std::string_view text, std::uint32_t& out);

// Truth value by first character: T, t, Y, y are true; F, f, N, n are false. Any other text is read
// as a decimal number (blanks, a sign, digits and at most one point; "2.5", "-0.0", ".5") and is
// true when it is not zero. Text that is no such number, the empty text included, gives nullopt.
std::optional<bool> toBoolean(std::string_view text);
// As toBoolean, with false for text that does not convert.
inline bool toBooleanOrFalse(std::string_view text) { return toBoolean(text).value_or(false); }

// Decimal floating-point text ("1.5", "-2e3", "+.25") with optional leading and trailing blanks.
// Infinities, NaN, hexadecimal floats and values out of the float range give nullopt.
std::optional<float> toFloat(std::string_view text);

// Decimal text of an integer, the form the server expects for every number the library writes.
template <std::integral T>
std::string decimalText(T value)
{
    char buffer[24];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
    return std::string(buffer, result.ptr);
}

inline const char* booleanText(bool value) { return value ? "true" : "false"; }

}  // namespace zel
