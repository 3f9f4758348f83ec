// zelserverd's readers of what a client sends, chosen by the first byte: a frame (length prefix,
// then the payload as a command, an acknowledgement and a file header), a job request text with its
// parameter document, a path document, the header of an uploaded item (strict and lenient), and a
// command payload run by a signed-in administrator.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <string>
#include <string_view>

#include "commands.h"
#include "framing.h"
#include "item_header.h"
#include "jobs.h"
#include "server.h"
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

// A server state in a scratch directory, never listening for anyone: the process's one.
struct ScratchServer {
    ScratchServer()
    {
        char pattern[] = "/tmp/zel-fuzz-XXXXXX";
        dir = mkdtemp(pattern);
        std::string error;
        server = Server::create(
            {.dataDir = dir, .configFile = {}, .listen = "127.0.0.1:0", .quiet = true, .logStream = stderr}, error);
    }
    ~ScratchServer()
    {
        server.reset();
        std::filesystem::remove_all(dir);
    }
    std::string dir;
    std::unique_ptr<Server> server;
};

// The handlers' own reading of their values (the service, repository, property accessor and user
// token documents among them). Only the repository and security families run: they touch nothing
// but the server's database, and their transfers fail on the closed descriptor.
void runCommand(std::string_view payload)
{
    static ScratchServer scratch;
    Request request;
    if (!scratch.server || parseRequest(payload, request) ||
        !(request.keyword.starts_with("REP_") || request.keyword.starts_with("SEC_")))
        return;
    Session session{Principal{"admin", {"admin"}, ~0u, false, {}}, "fuzz"};
    FrameIo io(-1, 1 << 20);
    CommandContext context{scratch.server->state(), session, request, io};
    dispatch(context);
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
    runCommand,
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    if (size == 0)
        return 0;
    kReaders[data[0] % std::size(kReaders)](std::string_view(reinterpret_cast<const char*>(data) + 1, size - 1));
    return 0;
}
