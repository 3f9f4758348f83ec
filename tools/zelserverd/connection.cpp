// One client connection: read a command frame, run it, answer, repeat. Anything that leaves the
// stream in an unknown state (a malformed frame, an oversized length, a broken transfer) ends
// this connection only; the server keeps serving everyone else.
#include <chrono>

#include "commands.h"
#include "server.h"

namespace zelserverd {

namespace {

double millisecondsSince(std::chrono::steady_clock::time_point start)
{
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
}

std::string userOf(const Session& session) { return session.principal ? session.principal->user : std::string(); }

}  // namespace

void serveConnection(ServerState& state, int fd)
{
    const Config& config = state.config;
    Patience patience{config.idleTimeoutSeconds ? static_cast<int>(config.idleTimeoutSeconds) * 1000 : -1,
                      static_cast<int>(config.ioTimeoutSeconds) * 1000};
    FrameIo io(fd, config.maxRequestBytes, patience);
    Session session;
    session.peer = peerAddress(fd);
    std::string payload;
    while (!state.stopping) {
        FrameStatus status = io.readFrame(payload);
        if (status == FrameStatus::Closed)
            return;
        auto start = std::chrono::steady_clock::now();
        if (status == FrameStatus::TooLarge) {
            std::string message = "request frame of " + std::to_string(io.refusedLength()) +
                                  " bytes exceeds the limit of " + std::to_string(state.config.maxRequestBytes) +
                                  " bytes";
            io.writeFrame(replyPayload(false, message));
            state.log.command(userOf(session), "-", "CLOSED", millisecondsSince(start), message);
            return;
        }
        Request request;
        if (std::optional<std::string> error = parseRequest(payload, request)) {
            io.writeFrame(replyPayload(false, "malformed request: " + *error));
            state.log.command(userOf(session), "-", "CLOSED", millisecondsSince(start), *error);
            return;
        }
        CommandContext context{state, session, request, io};
        Reply reply = dispatch(context);
        const char* outcome = "SUCCESS";
        if (reply.kind == Reply::Kind::Close) {
            outcome = "CLOSED";
        } else {
            if (reply.kind == Reply::Kind::Error)
                outcome = "ERROR";
            if (!io.writeFrame(replyPayload(reply.kind == Reply::Kind::Success, reply.body)))
                outcome = "CLOSED";
        }
        state.log.command(userOf(session), request.keyword, outcome, millisecondsSince(start),
                          reply.kind == Reply::Kind::Error ? std::string_view(reply.body) : std::string_view());
        if (std::string_view(outcome) == "CLOSED")
            return;
    }
}

}  // namespace zelserverd
