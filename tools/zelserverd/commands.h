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
#include "repository_store.h"
#include "shared_resources.h"

namespace zelserverd {

struct ServerState;
struct UploadResult;

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

// How a command names a service, repository, item or shared resource: not at all, by a name it
// answers for itself when unknown ("false", or a document without the element), or as something
// that must exist.
enum class Named { No, Name, Known };

enum class Filter { All, Enabled, Disabled };

// What a command names. The dispatcher reads and checks it in the order of the members before the
// handler runs; the first missing value or unknown name is the reply.
struct Needs {
    Named service = Named::No;                // "serviceName"
    Named repository = Named::No;             // "repositoryName"
    bool filter = false;                      // "enableFilter", absent meaning all
    Named item = Named::No;                   // `itemValue`, in the repository
    std::string_view itemValue = "itemName";  // "workspaceName" and others for the typed forms
    bool resource = false;                    // "resourceName"
    Named area = Named::No;                   // "srName"
    bool path = false;                        // "srPath", a "PATH" document confined to the area
    bool source = false;                      // "srSrcPath"
    bool destination = false;                 // "srDestPath"
    bool job = false;                         // "jobID"
    bool account = false;                     // "userAccountName", one the user may manage
};

// What the names resolved to. A record named by its name alone holds only that name.
struct Target {
    ServiceRecord service;
    RepositoryRecord repository;
    Filter filter = Filter::All;
    ItemRecord item;
    std::string resourceName;
    std::string areaName;
    const SharedArea* area = nullptr;  // set when the area is Known
    AreaPath path;
    AreaPath source;
    AreaPath destination;
    std::int64_t job = 0;
    std::string account;
};

// Fills `target` with what `needs` names; the failure reply, or nothing.
std::optional<Reply> resolveTarget(CommandContext& context, const Needs& needs, Target& target);

// The file a command receives, into the server's temporary folder and within its size limit,
// checked against its CRC when the request's `crcFlag` value is "true": the reply for a transfer
// lost or refused, or nothing with the file in `upload`.
std::optional<Reply> receiveCommandUpload(CommandContext& context, std::string_view crcFlag, UploadResult& upload);
// Sends the open file: the reply for the transfer, a refusal's reason following `refusalPrefix`.
Reply sendCommandDownload(CommandContext& context, int fd, const std::string& refusalPrefix);

using Handler = Reply (*)(CommandContext&, const Target&);

struct CommandSpec {
    std::string_view keyword;
    std::uint32_t right;  // 0: any signed-in user
    Needs needs;
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
