#include "api/text_encoding.h"

#include <cstdint>

namespace zel {
namespace {

constexpr char kReplacement = '?';

// Decodes the sequence at `pos`. On success returns its length and sets `codePoint`; returns 0 for a
// byte that does not start a well-formed sequence.
std::size_t decodeOne(std::string_view text, std::size_t pos, std::uint32_t& codePoint)
{
    const auto byte = [&](std::size_t i) { return static_cast<unsigned char>(text[pos + i]); };
    const unsigned char lead = byte(0);
    if (lead < 0x80) {
        codePoint = lead;
        return 1;
    }
    // Lead byte pattern, payload bits of the lead, sequence length, smallest code point it may carry.
    struct Form {
        unsigned char mask, pattern, payload;
        std::size_t length;
        std::uint32_t minimum;
    };
    static constexpr Form kForms[] = {
        {0xE0, 0xC0, 0x1F, 2, 0x80}, {0xF0, 0xE0, 0x0F, 3, 0x800}, {0xF8, 0xF0, 0x07, 4, 0x10000}};
    const Form* form = nullptr;
    for (const Form& candidate : kForms) {
        if ((lead & candidate.mask) == candidate.pattern) {
            form = &candidate;
        }
    }
    if (form == nullptr) {
        return 0;
    }
    const std::size_t length = form->length;
    codePoint = lead & form->payload;
    if (text.size() - pos < length) {
        return 0;
    }
    for (std::size_t i = 1; i < length; ++i) {
        if ((byte(i) & 0xC0) != 0x80) {
            return 0;
        }
        codePoint = (codePoint << 6) | (byte(i) & 0x3F);
    }
    const bool surrogate = codePoint >= 0xD800 && codePoint <= 0xDFFF;
    return codePoint < form->minimum || codePoint > 0x10FFFF || surrogate ? 0 : length;
}

}  // namespace

bool isValidUtf8(std::string_view text)
{
    std::uint32_t codePoint = 0;
    for (std::size_t pos = 0; pos < text.size();) {
        const std::size_t length = decodeOne(text, pos, codePoint);
        if (length == 0) {
            return false;
        }
        pos += length;
    }
    return true;
}

std::string latin1ToUtf8(std::string_view text)
{
    std::string out;
    out.reserve(text.size());
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (byte < 0x80) {
            out.push_back(c);
        } else {
            out.push_back(static_cast<char>(0xC0 | (byte >> 6)));
            out.push_back(static_cast<char>(0x80 | (byte & 0x3F)));
        }
    }
    return out;
}

std::string utf8ToLatin1(std::string_view text)
{
    std::string out;
    out.reserve(text.size());
    std::uint32_t codePoint = 0;
    for (std::size_t pos = 0; pos < text.size();) {
        const std::size_t length = decodeOne(text, pos, codePoint);
        if (length == 0) {
            out.push_back(kReplacement);
            ++pos;
            continue;
        }
        out.push_back(codePoint <= 0xFF ? static_cast<char>(codePoint) : kReplacement);
        pos += length;
    }
    return out;
}

}  // namespace zel
