#include "framing.h"

#include <array>

#include "util.h"

namespace zelserverd {

std::string encodeFrame(std::string_view payload)
{
    std::string frame;
    frame.reserve(payload.size() + 4);
    auto n = static_cast<std::uint32_t>(payload.size());
    frame.push_back(static_cast<char>((n >> 24) & 0xFF));
    frame.push_back(static_cast<char>((n >> 16) & 0xFF));
    frame.push_back(static_cast<char>((n >> 8) & 0xFF));
    frame.push_back(static_cast<char>(n & 0xFF));
    frame.append(payload);
    return frame;
}

std::uint32_t decodeLength(const unsigned char prefix[4])
{
    return (std::uint32_t{prefix[0]} << 24) | (std::uint32_t{prefix[1]} << 16) | (std::uint32_t{prefix[2]} << 8) |
           std::uint32_t{prefix[3]};
}

const std::string* Request::find(std::string_view name) const
{
    for (const auto& [key, value] : values)
        if (key == name)
            return &value;
    return nullptr;
}

std::string Request::get(std::string_view name, std::string_view fallback) const
{
    const std::string* value = find(name);
    return value ? *value : std::string(fallback);
}

std::vector<std::string> Request::all(std::string_view name) const
{
    std::vector<std::string> found;
    for (const auto& [key, value] : values)
        if (key == name)
            found.push_back(value);
    return found;
}

std::optional<std::string> parseRequest(std::string_view payload, Request& out)
{
    out = Request{};
    std::vector<std::string> pieces = split(payload, '\0');
    static constexpr std::string_view kVersionName = "APIVERSION=";
    if (pieces.size() < 2 || pieces[0].rfind(kVersionName, 0) != 0)
        return "request does not start with the API version header";
    if (pieces[0].substr(kVersionName.size()) != "1")
        return "unsupported API version '" + pieces[0].substr(kVersionName.size()) + "'";
    if (pieces[1].empty())
        return "request has no command keyword";
    out.keyword = pieces[1];
    for (std::size_t i = 2; i < pieces.size(); ++i) {
        std::size_t eq = pieces[i].find('=');
        if (eq == std::string::npos || eq == 0)
            return "named value " + std::to_string(i - 1) + " has no name";
        out.values.emplace_back(pieces[i].substr(0, eq), pieces[i].substr(eq + 1));
    }
    return std::nullopt;
}

std::string replyPayload(bool success, std::string_view body)
{
    std::string payload(success ? kSuccess : kError);
    payload.push_back('\0');
    payload.append(body);
    return payload;
}

std::string ackPayload() { return replyPayload(true, kReadyToTransfer); }

bool isAck(std::string_view payload) { return payload == ackPayload(); }

std::string fileHeaderPayload(std::uint64_t length, std::uint32_t crc)
{
    std::string payload = "fileLength=" + std::to_string(length);
    payload.push_back('\0');
    payload += "fileCRC=" + std::to_string(crc);
    return payload;
}

std::optional<FileHeader> parseFileHeader(std::string_view payload)
{
    static constexpr std::string_view kLength = "fileLength=";
    static constexpr std::string_view kCrc = "fileCRC=";
    std::size_t nul = payload.find('\0');
    if (nul == std::string_view::npos)
        return std::nullopt;
    std::string_view first = payload.substr(0, nul);
    std::string_view second = payload.substr(nul + 1);
    if (first.substr(0, kLength.size()) != kLength || second.substr(0, kCrc.size()) != kCrc)
        return std::nullopt;
    auto length = parseDecimal(first.substr(kLength.size()), UINT32_MAX);
    auto crc = parseDecimal(second.substr(kCrc.size()), UINT32_MAX);
    if (!length || !crc)
        return std::nullopt;
    return FileHeader{*length, static_cast<std::uint32_t>(*crc)};
}

namespace {
std::array<std::uint32_t, 256> makeCrcTable()
{
    std::array<std::uint32_t, 256> table{};
    for (std::uint32_t i = 0; i < 256; ++i) {
        std::uint32_t c = i;
        for (int k = 0; k < 8; ++k)
            c = (c & 1) ? 0xEDB88320u ^ (c >> 1) : c >> 1;
        table[i] = c;
    }
    return table;
}
}  // namespace

void Crc32::update(const void* data, std::size_t size)
{
    static const std::array<std::uint32_t, 256> table = makeCrcTable();
    const auto* bytes = static_cast<const unsigned char*>(data);
    std::uint32_t c = state_;
    for (std::size_t i = 0; i < size; ++i)
        c = table[(c ^ bytes[i]) & 0xFF] ^ (c >> 8);
    state_ = c;
}

}  // namespace zelserverd
