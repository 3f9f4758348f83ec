// Small text, time and randomness helpers shared by every part of the server.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace zelserverd {

std::string trim(std::string_view text);
std::string toLower(std::string_view text);
bool iequals(std::string_view a, std::string_view b);
std::vector<std::string> split(std::string_view text, char delimiter);

// Strict unsigned decimal: digits only, no sign, no blanks, no overflow past `max`.
std::optional<std::uint64_t> parseDecimal(std::string_view text, std::uint64_t max = UINT64_MAX);
// Signed decimal as clients write job identifiers ("%ld" of a 32-bit value, so -1 for 4294967295).
std::optional<std::int64_t> parseSigned(std::string_view text);

// Current time as ISO 8601 UTC ("2024-05-01T12:00:00Z"), and any epoch second in that form.
std::string isoTime(std::int64_t epochSeconds);
std::int64_t nowSeconds();

// Bytes from the kernel's random source, as lower-case hex; empty when the source failed.
std::string randomHex(std::size_t bytes);

// Comparison whose duration does not depend on where the texts differ.
bool constantTimeEquals(std::string_view a, std::string_view b);

}  // namespace zelserverd
