#include "transport/connection_limits.h"

#include <vector>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "api/status.h"

namespace zel {

namespace {

constexpr std::uint64_t kMaxMilliseconds = 2'000'000'000;

bool isDigit(char c) { return c >= '0' && c <= '9'; }

// Whole digits, then optionally a point and up to `maxDecimals` digits, scaled by 10^maxDecimals.
std::optional<std::uint64_t> scaledDecimal(std::string_view text, unsigned maxDecimals, std::uint64_t max)
{
    std::uint64_t value = 0;
    std::size_t i = 0;
    for (; i < text.size() && isDigit(text[i]); ++i) {
        value = value * 10 + static_cast<std::uint64_t>(text[i] - '0');
        if (value > max) {
            return std::nullopt;
        }
    }
    if (i == 0) {
        return std::nullopt;
    }
    unsigned decimals = 0;
    if (i < text.size() && text[i] == '.' && maxDecimals > 0) {
        for (++i; i < text.size() && isDigit(text[i]) && decimals < maxDecimals; ++i, ++decimals) {
            value = value * 10 + static_cast<std::uint64_t>(text[i] - '0');
        }
    }
    if (i != text.size()) {
        return std::nullopt;
    }
    for (; decimals < maxDecimals; ++decimals) {
        value *= 10;
    }
    return value;
}

// Stores the converted property in `target`; false when it is present and does not convert.
template <class Convert>
bool readProperty(const IZELServerConnectionInfo& info, const char* name, Convert convert, std::uint32_t& target,
                  std::string& badValue)
{
    ZELServerString text;
    if (!info.getProperty(ZELServerString(name), text)) {
        return true;
    }
    const std::optional<std::uint32_t> value = convert(text.str());
    if (!value) {
        badValue = text.str();
        return false;
    }
    target = *value;
    return true;
}

}  // namespace

std::optional<std::uint32_t> secondsAsMilliseconds(std::string_view text)
{
    const std::optional<std::uint64_t> value = scaledDecimal(text, 3, kMaxMilliseconds);
    if (!value || *value > kMaxMilliseconds) {
        return std::nullopt;
    }
    return static_cast<std::uint32_t>(*value);
}

std::optional<std::uint32_t> byteCount(std::string_view text)
{
    const std::optional<std::uint64_t> value = scaledDecimal(text, 0, 0xFFFFFFFFull);
    if (!value || *value == 0) {
        return std::nullopt;
    }
    return static_cast<std::uint32_t>(*value);
}

IZELServerStatus* readConnectionLimits(const IZELServerConnectionInfo& info, ConnectionLimits& limits)
{
    ConnectionLimits read = limits;
    std::string badValue;
    const auto refuse = [&badValue](const char* name) {
        return makeStatus(msg::kInvalidArgument, std::vector<std::string>{name, badValue});
    };
    if (!readProperty(info, kConnectTimeoutProperty, secondsAsMilliseconds, read.connectTimeoutMs, badValue)) {
        return refuse(kConnectTimeoutProperty);
    }
    if (!readProperty(info, kIoTimeoutProperty, secondsAsMilliseconds, read.ioTimeoutMs, badValue)) {
        return refuse(kIoTimeoutProperty);
    }
    if (!readProperty(info, kResultPortTimeoutProperty, secondsAsMilliseconds, read.resultPortTimeoutMs, badValue)) {
        return refuse(kResultPortTimeoutProperty);
    }
    if (!readProperty(info, kMaxReplyBytesProperty, byteCount, read.maxReplyBytes, badValue)) {
        return refuse(kMaxReplyBytesProperty);
    }
    limits = read;
    return nullptr;
}

}  // namespace zel
