// Sign-in and session properties.
#include "commands.h"
#include "server.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

std::string joined(const std::vector<std::string>& items)
{
    std::string text;
    for (const auto& item : items)
        text += (text.empty() ? "" : ",") + item;
    return text;
}

Reply sessionInit(CommandContext& context, const Target&)
{
    SignInOutcome outcome = context.server.auth.signIn(context.request, context.session.peer);
    if (!outcome.principal) {
        // A failed sign-in also ends an earlier one on this connection.
        context.session.principal.reset();
        return Reply::authentication(outcome.error);
    }
    context.session.principal = std::move(outcome.principal);
    return Reply::ok(replyDocument("SERVER_SESSION_INIT", [&](pugi::xml_node root) {
        root.append_attribute("security_enabled") = "true";
        root.append_attribute("security_pubparm") = "false";
        appendIdentity(root, context.principal());
    }));
}

Reply sessionProperty(CommandContext& context, const Target&)
{
    Reply failure;
    auto name = context.required("sessionPropName", failure);
    if (!name)
        return failure;
    const Config& config = context.server.config;
    const Principal& principal = context.principal();
    std::string value;
    if (*name == "SERVER_NAME") {
        value = "zelserverd";
    } else if (*name == "SERVER_VERSION") {
        value = kServerVersion;
    } else if (*name == "API_VERSION") {
        value = "1";
    } else if (*name == "SERVER_TIME") {
        value = isoTime(nowSeconds());
    } else if (*name == "USER_NAME") {
        value = principal.user;
    } else if (*name == "USER_ROLES") {
        value = joined(principal.roles);
    } else if (*name == "SECURITY_ENABLED") {
        value = "true";
    } else if (*name == "MAX_REQUEST_BYTES") {
        value = std::to_string(config.maxRequestBytes);
    } else if (*name == "MAX_FILE_BYTES") {
        value = std::to_string(config.maxFileBytes);
    } else if (*name == "JOB_SERVICES") {
        std::vector<std::string> names;
        for (const auto& service : config.jobServices)
            names.push_back(service.name);
        value = joined(names);
    } else {
        return Reply::error("unknown session property \"" + *name + "\"");
    }
    return Reply::ok(value);
}

}  // namespace

std::vector<CommandSpec> sessionCommands()
{
    return {
        {"SERVER_SESSION_INIT", 0, {}, sessionInit, false},
        {"SERVER_SESSION_GET_PROP", 0, {}, sessionProperty},
    };
}

}  // namespace zelserverd
