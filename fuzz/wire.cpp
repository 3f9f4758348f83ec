// The reply side of the channel without a socket: a frame's length prefix, the split into status
// word and body, the classification of the server's error texts, file headers and transfer
// acknowledgements, all over the same frame (prefix and payload).
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "transport/wire_format.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    using namespace zel::wire;
    if (size < kLengthPrefixSize)
        return 0;
    unsigned char prefix[kLengthPrefixSize];
    std::memcpy(prefix, data, kLengthPrefixSize);
    decodeLength(prefix);
    std::string_view payload(reinterpret_cast<const char*>(data) + kLengthPrefixSize, size - kLengthPrefixSize);
    if (auto reply = splitReply(payload))
        classifyServerError(reply->body);
    parseFileHeader(payload);
    readAcknowledgement(payload);
    return 0;
}
