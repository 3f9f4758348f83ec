// zelserverd's readers of what a client sends, chosen by the first byte: a frame (length prefix,
// then the payload as a command, an acknowledgement and a file header), a job request text with its parameter
// document, a path document, and the header of an uploaded item, strict and lenient.
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "framing.h"
#include "item_header.h"
#include "jobs.h"
#include "shared_resources.h"

namespace {

using namespace zelserverd;

void readFrame(std::string_view frame)
{
    if (frame.size() < 4)
        return;
    decodeLength(reinterpret_cast<const unsigned char*>(frame.data()));
    std::string_view payload = frame.substr(4);
    Request request;
    parseRequest(payload, request);
    isAck(payload);
    parseFileHeader(payload);
}

void (*const kReaders[])(std::string_view) = {
    readFrame,
    [](std::string_view text) {
        JobRequestText out;
        parseJobRequestText(text, out);
    },
    [](std::string_view text) {
        std::string path;
        pathFromDocument(text, path);
    },
    [](std::string_view text) {
        ItemHeader strict, lenient;
        parseItemHeader(text, true, strict);
        parseItemHeader(text, false, lenient);
    },
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    if (size == 0)
        return 0;
    kReaders[data[0] % std::size(kReaders)](std::string_view(reinterpret_cast<const char*>(data) + 1, size - 1));
    return 0;
}
