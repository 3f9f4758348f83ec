// The one place where a request's names become what they name: repositories, items, services,
// item resources, shared resources and paths in them, jobs and user accounts. Handlers receive the
// result and never look a name up themselves.
#include "commands.h"
#include "server.h"
#include "util.h"

namespace zelserverd {

namespace {

// Reads the value `valueName` into `out.name`; a Known one must also be found by `find`, which
// fills `out`, or the command is refused with "unknown <what> '<name>'<where>".
template <typename Record, typename Find>
std::optional<Reply> resolveName(CommandContext& context, Named how, std::string_view valueName, std::string_view what,
                                 const std::string& where, Find find, Record& out)
{
    if (how == Named::No)
        return std::nullopt;
    Reply failure;
    auto name = context.required(valueName, failure);
    if (!name)
        return failure;
    out.name = *name;
    if (how == Named::Name)
        return std::nullopt;
    std::optional<Record> record = find(*name);
    if (!record)
        return Reply::error("unknown " + std::string(what) + " '" + *name + "'" + where);
    out = std::move(*record);
    return std::nullopt;
}

// "enableFilter" as the directives put it on the wire.
std::optional<Reply> resolveFilter(CommandContext& context, Filter& out)
{
    std::string value = context.request.get("enableFilter", "All");
    if (value == "All")
        out = Filter::All;
    else if (value == "Enabled")
        out = Filter::Enabled;
    else if (value == "Disabled")
        out = Filter::Disabled;
    else
        return Reply::error("bad enableFilter '" + value + "' (All, Enabled or Disabled)");
    return std::nullopt;
}

std::optional<Reply> resolveRepository(CommandContext& context, const Needs& needs, Target& target)
{
    RepositoryStore& repos = context.server.repos;
    if (auto failure = resolveName(
            context, needs.service, "serviceName", "service", "",
            [&](const std::string& name) { return repos.service(name); }, target.service))
        return failure;
    if (auto failure = resolveName(
            context, needs.repository, "repositoryName", "repository", "",
            [&](const std::string& name) { return repos.repository(name); }, target.repository))
        return failure;
    if (needs.filter)
        if (auto failure = resolveFilter(context, target.filter))
            return failure;
    if (auto failure = resolveName(
            context, needs.item, needs.itemValue, "item", " in '" + target.repository.name + "'",
            [&](const std::string& name) { return repos.item(target.repository.name, name); }, target.item))
        return failure;
    if (needs.resource) {
        Reply failure;
        auto name = context.required("resourceName", failure);
        if (!name)
            return failure;
        target.resourceName = *name;
    }
    return std::nullopt;
}

// Reads the "PATH" document under `valueName` and confines it to the area.
std::optional<Reply> resolvePath(CommandContext& context, const SharedArea& area, std::string_view valueName,
                                 AreaPath& out)
{
    const std::string* value = context.request.find(valueName);
    if (!value)
        return Reply::error("missing value \"" + std::string(valueName) + "\"");
    std::string clientPath;
    std::string error = pathFromDocument(*value, clientPath);
    if (error.empty())
        error = area.resolve(clientPath, out);
    if (!error.empty())
        return Reply::error(error);
    return std::nullopt;
}

std::optional<Reply> resolveArea(CommandContext& context, const Needs& needs, Target& target)
{
    if (needs.area == Named::No)
        return std::nullopt;
    Reply failure;
    auto name = context.required("srName", failure);
    if (!name)
        return failure;
    target.areaName = *name;
    if (needs.area == Named::Name)
        return std::nullopt;
    target.area = context.server.findArea(*name);
    if (!target.area)
        return Reply::error("unknown shared resource '" + *name + "'");
    std::optional<Reply> refused;
    if (needs.path)
        refused = resolvePath(context, *target.area, "srPath", target.path);
    if (!refused && needs.source)
        refused = resolvePath(context, *target.area, "srSrcPath", target.source);
    if (!refused && needs.destination)
        refused = resolvePath(context, *target.area, "srDestPath", target.destination);
    return refused;
}

// Clients write job ids as signed 32-bit decimals, so 4294967295 arrives as -1.
std::optional<Reply> resolveJob(CommandContext& context, std::int64_t& id)
{
    Reply failure;
    auto text = context.required("jobID", failure);
    if (!text)
        return failure;
    auto value = parseSigned(*text);
    if (!value || *value < INT32_MIN || *value > static_cast<std::int64_t>(UINT32_MAX))
        return Reply::error("bad job id '" + *text + "'");
    id = static_cast<std::int64_t>(static_cast<std::uint32_t>(*value));
    // A job, its log and its result are its owner's; "jobs.admin" reaches everyone's.
    const Principal& principal = context.principal();
    std::optional<std::string> owner = context.server.jobs->owner(id);
    if (owner && *owner != principal.user && !(principal.rights & kRightJobsAdmin))
        return Reply::authorization("user '" + principal.user + "' may not reach job " + std::to_string(id) +
                                    " of user '" + *owner + "'");
    return std::nullopt;
}

// A user manages their own account's token with "tokens"; "tokens.admin" reaches every account.
std::optional<Reply> resolveAccount(CommandContext& context, std::string& account)
{
    Reply failure;
    auto name = context.required("userAccountName", failure);
    if (!name)
        return failure;
    const Principal& principal = context.principal();
    bool own = *name == principal.user;
    std::uint32_t needed = own ? (kRightTokens | kRightTokensAdmin) : kRightTokensAdmin;
    if ((principal.rights & needed) == 0)
        return Reply::authorization("user '" + principal.user + "' may not manage the user token of '" + *name + "'");
    if (!context.server.config.findUser(*name))
        return Reply::error("unknown user account '" + *name + "'");
    account = *name;
    return std::nullopt;
}

}  // namespace

std::optional<Reply> resolveTarget(CommandContext& context, const Needs& needs, Target& target)
{
    if (auto failure = resolveRepository(context, needs, target))
        return failure;
    if (auto failure = resolveArea(context, needs, target))
        return failure;
    if (needs.job)
        if (auto failure = resolveJob(context, target.job))
            return failure;
    if (needs.account)
        if (auto failure = resolveAccount(context, target.account))
            return failure;
    return std::nullopt;
}

}  // namespace zelserverd
