#include "commands.h"

#include <map>

#include "server.h"
#include "transfer.h"

namespace zelserverd {

std::optional<std::string> CommandContext::required(std::string_view name, Reply& failure) const
{
    const std::string* value = request.find(name);
    if (!value || value->empty()) {
        failure = Reply::error("missing value \"" + std::string(name) + "\"");
        return std::nullopt;
    }
    return *value;
}

std::optional<Reply> receiveCommandUpload(CommandContext& context, std::string_view crcFlag, UploadResult& upload)
{
    const bool checkCrc = context.request.get(crcFlag) == "true";
    upload = receiveUpload(context.io, context.server.tempDir, checkCrc, context.server.config.maxFileBytes);
    if (upload.outcome == TransferOutcome::Lost)
        return Reply::close();
    if (upload.outcome == TransferOutcome::Refused)
        return Reply::error(upload.message);
    return std::nullopt;
}

Reply sendCommandDownload(CommandContext& context, int fd, const std::string& refusalPrefix)
{
    std::string message;
    const TransferOutcome outcome = sendDownload(context.io, fd, message);
    if (outcome == TransferOutcome::Lost)
        return Reply::close();
    if (outcome == TransferOutcome::Refused)
        return Reply::error(refusalPrefix + message);
    return Reply::ok();
}

namespace {

std::map<std::string_view, CommandSpec> buildTable()
{
    std::map<std::string_view, CommandSpec> table;
    for (auto family : {sessionCommands, securityCommands, sharedResourceCommands, jobCommands, repositoryCommands})
        for (const CommandSpec& entry : family())
            table.emplace(entry.keyword, entry);
    return table;
}

}  // namespace

const CommandSpec* findCommand(std::string_view keyword)
{
    static const std::map<std::string_view, CommandSpec> table = buildTable();
    auto it = table.find(keyword);
    return it == table.end() ? nullptr : &it->second;
}

Reply dispatch(CommandContext& context)
{
    const CommandSpec* entry = findCommand(context.request.keyword);
    if (!entry)
        return Reply::error("unknown command \"" + context.request.keyword + "\"");
    if (entry->needsSignIn) {
        if (!context.session.principal)
            return Reply::authentication("sign in with SERVER_SESSION_INIT first");
        if ((context.principal().rights & entry->right) != entry->right)
            return Reply::authorization("user '" + context.principal().user + "' may not run " +
                                        std::string(entry->keyword));
    }
    Target target;
    if (auto failure = resolveTarget(context, entry->needs, target))
        return *failure;
    return entry->handler(context, target);
}

}  // namespace zelserverd
