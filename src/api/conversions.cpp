#include "api/conversions.h"

#include <limits>

namespace zel {
namespace {

bool isBlank(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r'; }

std::string_view skipBlanks(std::string_view text)
{
    while (!text.empty() && isBlank(text.front())) {
        text.remove_prefix(1);
    }
    return text;
}

std::string_view trimBlanks(std::string_view text)
{
    text = skipBlanks(text);
    while (!text.empty() && isBlank(text.back())) {
        text.remove_suffix(1);
    }
    return text;
}

bool isDecimalDigit(char c) { return c >= '0' && c <= '9'; }

// The digit's value in `base` (10 or 16), or -1 when the character is no digit there.
int digitValue(char c, unsigned base)
{
    if (isDecimalDigit(c)) {
        return c - '0';
    }
    if (base == 16) {
        const char lower = static_cast<char>(c | 0x20);
        if (lower >= 'a' && lower <= 'f') {
            return lower - 'a' + 10;
        }
    }
    return -1;
}

// A point followed by zeros only, then blanks only: the way the server writes a whole number that
// went through a floating-point field.
bool onlyZeroFractionFollows(std::string_view rest)
{
    if (!rest.empty() && rest.front() == '.') {
        rest.remove_prefix(1);
        while (!rest.empty() && rest.front() == '0') {
            rest.remove_prefix(1);
        }
    }
    return skipBlanks(rest).empty();
}

struct WholeScan {
    std::uint64_t magnitude = 0;
    bool negative = false;
    bool read = false;
    bool complete = false;
};

struct SignRule {
    std::uint64_t positiveLimit;  // largest magnitude accepted without a minus
    std::uint64_t negativeLimit;  // largest magnitude accepted with a minus
    bool refuseMinus;
};

WholeScan scanWhole(std::string_view text, const SignRule& rule)
{
    WholeScan scan;
    const std::string_view rest = skipBlanks(text);
    if (rest.empty() || (rule.refuseMinus && rest.front() == '-')) {
        return scan;
    }
    std::size_t pos = 0;
    if (rest.front() == '+' || rest.front() == '-') {
        scan.negative = rest.front() == '-';
        ++pos;
    }
    unsigned base = 10;
    // Hexadecimal is chosen by the second character alone; after a sign that character is a digit,
    // so "-0x1F" reads as -0 followed by junk, exactly as the server's own reader sees it.
    if (rest.size() > 2 && rest[0] == '0' && (rest[1] == 'x' || rest[1] == 'X') && digitValue(rest[2], 16) >= 0) {
        base = 16;
        pos = 2;
    }
    const std::uint64_t limit = scan.negative ? rule.negativeLimit : rule.positiveLimit;
    const std::size_t firstDigit = pos;
    bool overflow = false;
    for (int digit = 0; pos < rest.size() && (digit = digitValue(rest[pos], base)) >= 0; ++pos) {
        const auto d = static_cast<std::uint64_t>(digit);
        if (scan.magnitude > (limit - d) / base) {
            overflow = true;
        } else {
            scan.magnitude = scan.magnitude * base + d;
        }
    }
    if (pos == firstDigit || overflow) {
        return WholeScan{};
    }
    scan.read = true;
    scan.complete = onlyZeroFractionFollows(rest.substr(pos));
    return scan;
}

template <class T>
NumberReading<T> readUnsigned(std::string_view text, bool refuseMinus)
{
    constexpr std::uint64_t max = std::numeric_limits<T>::max();
    const WholeScan scan = scanWhole(text, SignRule{max, max, refuseMinus});
    NumberReading<T> reading;
    reading.read = scan.read;
    reading.complete = scan.complete;
    // Unsigned negation wraps, as the C library's unsigned conversion does.
    reading.value =
        static_cast<T>(scan.negative ? T{0} - static_cast<T>(scan.magnitude) : static_cast<T>(scan.magnitude));
    return reading;
}

// Whether a decimal number (sign, digits, at most one point) is non-zero; nullopt when the text is
// no such number. Only the digits' being zero matters, so no length of digits can overflow.
std::optional<bool> decimalIsNonZero(std::string_view text)
{
    const std::string_view rest = trimBlanks(text);
    std::size_t pos = 0;
    if (pos < rest.size() && (rest[pos] == '+' || rest[pos] == '-')) {
        ++pos;
    }
    bool anyDigit = false;
    bool nonZero = false;
    bool point = false;
    for (; pos < rest.size(); ++pos) {
        const char c = rest[pos];
        if (isDecimalDigit(c)) {
            anyDigit = true;
            nonZero = nonZero || c != '0';
        } else if (c == '.' && !point) {
            point = true;
        } else {
            return std::nullopt;
        }
    }
    return anyDigit ? std::optional<bool>(nonZero) : std::nullopt;
}

}  // namespace

NumberReading<std::uint32_t> readUInt32(std::string_view text) { return readUnsigned<std::uint32_t>(text, false); }

NumberReading<std::uint32_t> readUInt32AnyBase(std::string_view text)
{
    return readUnsigned<std::uint32_t>(text, true);
}

NumberReading<std::uint64_t> readUInt64(std::string_view text) { return readUnsigned<std::uint64_t>(text, false); }

NumberReading<std::int64_t> readInt64(std::string_view text)
{
    constexpr auto positiveLimit = static_cast<std::uint64_t>(std::numeric_limits<std::int64_t>::max());
    const WholeScan scan = scanWhole(text, SignRule{positiveLimit, positiveLimit + 1, false});
    NumberReading<std::int64_t> reading;
    reading.read = scan.read;
    reading.complete = scan.complete;
    // Two's complement conversion is exact here, the lowest value included.
    reading.value = static_cast<std::int64_t>(scan.negative ? std::uint64_t{0} - scan.magnitude : scan.magnitude);
    return reading;
}

bool storeUInt32(std::string_view text, std::uint32_t& out)
{
    const NumberReading<std::uint32_t> reading = readUInt32(text);
    if (reading.read) {
        out = reading.value;
    }
    return reading.complete;
}

std::optional<bool> toBoolean(std::string_view text)
{
    if (text.empty()) {
        return std::nullopt;
    }
    switch (text.front()) {
    case 'T':
    case 't':
    case 'Y':
    case 'y':
        return true;
    case 'F':
    case 'f':
    case 'N':
    case 'n':
        return false;
    default:
        return decimalIsNonZero(text);
    }
}

std::optional<float> toFloat(std::string_view text)
{
    std::string_view rest = trimBlanks(text);
    // from_chars takes no plus sign; stripping it must not let "+-1" through.
    if (!rest.empty() && rest.front() == '+') {
        rest.remove_prefix(1);
        if (!rest.empty() && rest.front() == '-') {
            return std::nullopt;
        }
    }
    // Only ordinary notation: a digit or a point must come first (after a minus), which keeps out
    // "inf", "nan" and their spellings.
    const std::size_t first = !rest.empty() && rest.front() == '-' ? 1 : 0;
    if (first >= rest.size() || !(isDecimalDigit(rest[first]) || rest[first] == '.')) {
        return std::nullopt;
    }
    float value = 0;
    const char* end = rest.data() + rest.size();
    const auto result = std::from_chars(rest.data(), end, value, std::chars_format::general);
    if (result.ec != std::errc() || result.ptr != end) {
        return std::nullopt;
    }
    return value;
}

}  // namespace zel
