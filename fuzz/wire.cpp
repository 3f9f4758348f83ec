// The reply side of the channel without a socket: frames cut out of a byte stream that arrives in
// pieces (the first byte sets the piece size) by the incremental frame reader, and each payload
// split into status word and body, its error text classified, and read as a file header and as a
// transfer acknowledgement.
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "transport/frame_reader.h"
#include "transport/wire_format.h"

namespace {

void readPayload(std::string_view payload)
{
    using namespace zel::wire;
    if (auto reply = splitReply(payload))
        classifyServerError(reply->body);
    parseFileHeader(payload);
    readAcknowledgement(payload);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    using zel::wire::FrameReader;
    if (size == 0)
        return 0;
    const std::size_t piece = data[0] + 1;
    std::string_view stream(reinterpret_cast<const char*>(data) + 1, size - 1);
    FrameReader reader(1 << 16);
    while (!stream.empty() && reader.state() != FrameReader::State::TooLarge) {
        const std::size_t used = reader.feed(stream.substr(0, piece));
        if (used == 0)
            return 0;
        stream.remove_prefix(used);
        if (reader.state() == FrameReader::State::Complete)
            readPayload(reader.takePayload());
    }
    return 0;
}
