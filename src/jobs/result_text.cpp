#include "jobs/result_text.h"

#include <array>
#include <vector>

namespace zel {
namespace {

// The server's job states, in the order of their codes.
constexpr std::array<const char*, 11> kJobStatusWords = {
    "SUBMITTED", "QUEUED",  "DELAYED",     "PAUSED",      "IN_PROCESS", "DELETED",
    "ABORTED",   "SUCCESS", "ZEL_FAILURE", "JOB_FAILURE", "PULLED",
};

std::vector<std::string_view> splitAt(std::string_view text, char separator)
{
    std::vector<std::string_view> pieces;
    std::size_t start = 0;
    for (;;) {
        const std::size_t end = text.find(separator, start);
        if (end == std::string_view::npos) {
            pieces.push_back(text.substr(start));
            return pieces;
        }
        pieces.push_back(text.substr(start, end - start));
        start = end + 1;
    }
}

bool isStatusPiece(std::string_view piece)
{
    return piece.find(':') != std::string_view::npos && piece.find('=') == std::string_view::npos;
}

void storeStatusPiece(std::string_view piece, ResultProperties& properties)
{
    const std::size_t colon = piece.find(':');
    const std::string_view number = piece.substr(0, colon);
    const std::string_view message = piece.substr(colon + 1);
    if (!number.empty()) {
        properties["StatusNumber"] = std::string(number);
    }
    if (!message.empty()) {
        properties["StatusMessage"] = std::string(message);
    }
}

}  // namespace

void parseResultEntries(std::string_view text, ResultProperties& properties)
{
    if (text.empty()) {
        return;
    }
    for (const std::string_view entry : splitAt(text, '\0')) {
        const std::size_t equals = entry.find('=');
        if (equals == std::string_view::npos) {
            continue;
        }
        std::string key(1, kResultPropertyPrefix);
        key.append(entry.substr(0, equals));
        properties[std::move(key)] = std::string(entry.substr(equals + 1));
    }
}

void splitResultValue(ResultProperties& properties)
{
    const auto result = properties.find(std::string(1, kResultPropertyPrefix) + "result");
    if (result == properties.end()) {
        return;
    }
    // Copied: a piece named "*result" overwrites the very text the pieces point into.
    const std::string value = result->second;
    const std::vector<std::string_view> pieces = splitAt(value, '|');
    for (std::size_t i = 0; i < pieces.size() && isStatusPiece(pieces[i]); ++i) {
        storeStatusPiece(pieces[i], properties);
    }
    for (const std::string_view piece : pieces) {
        const std::size_t equals = piece.find('=');
        if (equals != std::string_view::npos) {
            properties[std::string(piece.substr(0, equals))] = std::string(piece.substr(equals + 1));
        }
    }
}

std::optional<unsigned> jobStatusCode(std::string_view word)
{
    for (unsigned code = 0; code < kJobStatusWords.size(); ++code) {
        if (word == kJobStatusWords[code]) {
            return code;
        }
    }
    return std::nullopt;
}

const char* jobStatusWord(unsigned code) { return code < kJobStatusWords.size() ? kJobStatusWords[code] : nullptr; }

}  // namespace zel
