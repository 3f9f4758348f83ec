// User tokens ("SEC_" commands). A user manages their own token; the "tokens.admin" right
// reaches every account's.
#include "commands.h"
#include "server.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

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

Reply tokenExists(CommandContext& context, const Target& t)
{
    const std::string& account = t.account;
    return Reply::boolean(context.server.tokens.get(account).has_value());
}

Reply getToken(CommandContext& context, const Target& t)
{
    const std::string& account = t.account;
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

Reply writeToken(CommandContext& context, const std::string& account, bool add)
{
    UserToken token;
    token.account = account;
    if (auto failure = readToken(context, token))
        return *failure;
    std::string error = add ? context.server.tokens.add(token) : context.server.tokens.update(token);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addToken(CommandContext& context, const Target& t) { return writeToken(context, t.account, true); }
Reply updateToken(CommandContext& context, const Target& t) { return writeToken(context, t.account, false); }

Reply removeToken(CommandContext& context, const Target& t)
{
    const std::string& account = t.account;
    return Reply::boolean(context.server.tokens.remove(account));
}

Reply tokenExpired(CommandContext& context, const Target& t)
{
    const std::string& account = t.account;
    std::optional<UserToken> token = context.server.tokens.get(account);
    if (!token)
        return Reply::error("account '" + account + "' has no user token");
    return Reply::boolean(token->expired(nowSeconds()));
}

}  // namespace

std::vector<CommandSpec> securityCommands()
{
    constexpr Needs account{.account = true};
    return {
        {"SEC_USERTOKEN_EXISTS", 0, account, tokenExists}, {"SEC_GET_USERTOKEN", 0, account, getToken},
        {"SEC_ADD_USERTOKEN", 0, account, addToken},       {"SEC_UPDATE_USERTOKEN", 0, account, updateToken},
        {"SEC_REMOVE_USERTOKEN", 0, account, removeToken}, {"SEC_USERTOKEN_EXPIRED", 0, account, tokenExpired},
    };
}

}  // namespace zelserverd
