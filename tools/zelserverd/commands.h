// Command dispatch: every keyword maps to one handler and the right it needs.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "auth.h"
#include "framing.h"
#include "net.h"

namespace zelserverd {

struct ServerState;

struct Session {
    std::optional<Principal> principal;
    std::string peer;
};

struct Reply {
    enum class Kind { Success, Error, Close };
    Kind kind = Kind::Success;
    std::string body;

    // A successful reply must carry a body: clients reject "SUCCESS" with nothing after it, so
    // commands that only report success answer "true".
    static Reply ok(std::string body = "true") { return {Kind::Success, std::move(body)}; }
    static Reply boolean(bool value) { return ok(value ? "true" : "false"); }
    static Reply error(std::string message) { return {Kind::Error, std::move(message)}; }
    static Reply authentication(std::string_view message)
    {
        return {Kind::Error, std::string(kAuthenticationError) + std::string(message)};
    }
    static Reply authorization(std::string_view message)
    {
        return {Kind::Error, std::string(kAuthorizationError) + std::string(message)};
    }
    // The connection is out of step or gone: close it without a reply.
    static Reply close() { return {Kind::Close, {}}; }
};

struct CommandContext {
    ServerState& server;
    Session& session;
    const Request& request;
    FrameIo& io;

    const Principal& principal() const { return *session.principal; }
    // The value of a named value that must be present and not empty.
    std::optional<std::string> required(std::string_view name, Reply& failure) const;
};

using Handler = Reply (*)(CommandContext&);

struct CommandSpec {
    std::string_view keyword;
    std::uint32_t right;  // 0: any signed-in user
    Handler handler;
    bool needsSignIn = true;
};

// Each command family lists its commands.
std::vector<CommandSpec> sessionCommands();
std::vector<CommandSpec> securityCommands();
std::vector<CommandSpec> sharedResourceCommands();
std::vector<CommandSpec> jobCommands();
std::vector<CommandSpec> repositoryCommands();

const CommandSpec* findCommand(std::string_view keyword);
Reply dispatch(CommandContext& context);

}  // namespace zelserverd
