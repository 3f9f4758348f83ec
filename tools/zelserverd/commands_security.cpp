// User tokens ("SEC_" commands). A user manages their own token; the "tokens.admin" right
// reaches every account's.
#include "commands.h"
#include "server.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

// The account a command names ("userAccountName"), once the signed-in user may touch it: the
// failure reply, or nothing with `account` set.
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

// Reads the "USERTOKEN" element of "userTokenObject" into `token`. The dates are the server's
// to set.
std::optional<Reply> readToken(CommandContext& context, UserToken& token)
{
    Reply failure;
    auto text = context.required("userTokenObject", failure);
    if (!text)
        return failure;
    pugi::xml_document doc;
    std::string error = parseXml(*text, doc);
    pugi::xml_node element = error.empty() ? findElement(doc, "USERTOKEN") : pugi::xml_node();
    if (!element)
        return Reply::error("\"userTokenObject\" holds no USERTOKEN element" +
                            (error.empty() ? std::string() : ": " + error));
    token.token = element.attribute("token").value();
    token.clientAddress = element.attribute("clientaddress").value();
    std::string timeout = element.attribute("expirationtimeout").value();
    auto seconds = parseSigned(trim(timeout));
    if (!timeout.empty() && !seconds)
        return Reply::error("expirationtimeout '" + timeout + "' is not a number of seconds");
    token.timeoutSeconds = seconds.value_or(0);
    return std::nullopt;
}

Reply tokenExists(CommandContext& context)
{
    std::string account;
    if (auto failure = resolveAccount(context, account))
        return *failure;
    return Reply::boolean(context.server.tokens.get(account).has_value());
}

Reply getToken(CommandContext& context)
{
    std::string account;
    if (auto failure = resolveAccount(context, account))
        return *failure;
    std::optional<UserToken> token = context.server.tokens.get(account);
    return Reply::ok(replyDocument("SEC_GET_USERTOKEN", [&](pugi::xml_node root) {
        if (!token)
            return;
        pugi::xml_node element = root.append_child("USERTOKEN");
        element.append_attribute("token") = token->token.c_str();
        element.append_attribute("clientaddress") = token->clientAddress.c_str();
        element.append_attribute("expirationtimeout") = std::to_string(token->timeoutSeconds).c_str();
        element.append_attribute("firsttokendate") = token->firstDate.c_str();
        element.append_attribute("lasttokendate") = token->lastDate.c_str();
        element.append_attribute("expirationdate") = token->expirationDate.c_str();
    }));
}

Reply writeToken(CommandContext& context, bool add)
{
    std::string account;
    if (auto failure = resolveAccount(context, account))
        return *failure;
    UserToken token;
    token.account = account;
    if (auto failure = readToken(context, token))
        return *failure;
    std::string error = add ? context.server.tokens.add(token) : context.server.tokens.update(token);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addToken(CommandContext& context) { return writeToken(context, true); }
Reply updateToken(CommandContext& context) { return writeToken(context, false); }

Reply removeToken(CommandContext& context)
{
    std::string account;
    if (auto failure = resolveAccount(context, account))
        return *failure;
    return Reply::boolean(context.server.tokens.remove(account));
}

Reply tokenExpired(CommandContext& context)
{
    std::string account;
    if (auto failure = resolveAccount(context, account))
        return *failure;
    std::optional<UserToken> token = context.server.tokens.get(account);
    if (!token)
        return Reply::error("account '" + account + "' has no user token");
    return Reply::boolean(token->expired(nowSeconds()));
}

}  // namespace

std::vector<CommandSpec> securityCommands()
{
    return {
        {"SEC_USERTOKEN_EXISTS", 0, tokenExists}, {"SEC_GET_USERTOKEN", 0, getToken},
        {"SEC_ADD_USERTOKEN", 0, addToken},       {"SEC_UPDATE_USERTOKEN", 0, updateToken},
        {"SEC_REMOVE_USERTOKEN", 0, removeToken}, {"SEC_USERTOKEN_EXPIRED", 0, tokenExpired},
    };
}

}  // namespace zelserverd
