// User tokens ("SEC_" commands). A user manages their own token; the "tokens.admin" right
// reaches every account's.
#include "commands.h"
#include "server.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

// Resolves "userAccountName" and checks that the signed-in user may touch that account.
std::optional<std::string> accountFor(CommandContext& context, Reply& failure) {
  auto account = context.required("userAccountName", failure);
  if (!account) return std::nullopt;
  const Principal& principal = context.principal();
  bool own = *account == principal.user;
  std::uint32_t needed = own ? (kRightTokens | kRightTokensAdmin) : kRightTokensAdmin;
  if ((principal.rights & needed) == 0) {
    failure = Reply::authorization("user '" + principal.user +
                                   "' may not manage the user token of '" + *account + "'");
    return std::nullopt;
  }
  if (!context.server.config.findUser(*account)) {
    failure = Reply::error("unknown user account '" + *account + "'");
    return std::nullopt;
  }
  return account;
}

// Reads the "USERTOKEN" element of "userTokenObject". The dates are the server's to set.
std::optional<UserToken> tokenFromRequest(CommandContext& context, const std::string& account,
                                          Reply& failure) {
  auto text = context.required("userTokenObject", failure);
  if (!text) return std::nullopt;
  pugi::xml_document doc;
  std::string error = parseXml(*text, doc);
  pugi::xml_node element = error.empty() ? findElement(doc, "USERTOKEN") : pugi::xml_node();
  if (!element) {
    failure = Reply::error("\"userTokenObject\" holds no USERTOKEN element" +
                           (error.empty() ? std::string() : ": " + error));
    return std::nullopt;
  }
  UserToken token;
  token.account = account;
  token.token = element.attribute("token").value();
  token.clientAddress = element.attribute("clientaddress").value();
  std::string timeout = element.attribute("expirationtimeout").value();
  auto seconds = parseSigned(trim(timeout));
  if (!timeout.empty() && !seconds) {
    failure = Reply::error("expirationtimeout '" + timeout + "' is not a number of seconds");
    return std::nullopt;
  }
  token.timeoutSeconds = seconds.value_or(0);
  return token;
}

Reply tokenExists(CommandContext& context) {
  Reply failure;
  auto account = accountFor(context, failure);
  if (!account) return failure;
  return Reply::boolean(context.server.tokens.get(*account).has_value());
}

Reply getToken(CommandContext& context) {
  Reply failure;
  auto account = accountFor(context, failure);
  if (!account) return failure;
  std::optional<UserToken> token = context.server.tokens.get(*account);
  return Reply::ok(replyDocument("SEC_GET_USERTOKEN", [&](pugi::xml_node root) {
    if (!token) return;
    pugi::xml_node element = root.append_child("USERTOKEN");
    element.append_attribute("token") = token->token.c_str();
    element.append_attribute("clientaddress") = token->clientAddress.c_str();
    element.append_attribute("expirationtimeout") = std::to_string(token->timeoutSeconds).c_str();
    element.append_attribute("firsttokendate") = token->firstDate.c_str();
    element.append_attribute("lasttokendate") = token->lastDate.c_str();
    element.append_attribute("expirationdate") = token->expirationDate.c_str();
  }));
}

Reply writeToken(CommandContext& context, bool add) {
  Reply failure;
  auto account = accountFor(context, failure);
  if (!account) return failure;
  auto token = tokenFromRequest(context, *account, failure);
  if (!token) return failure;
  std::string error = add ? context.server.tokens.add(*token) : context.server.tokens.update(*token);
  return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply addToken(CommandContext& context) { return writeToken(context, true); }
Reply updateToken(CommandContext& context) { return writeToken(context, false); }

Reply removeToken(CommandContext& context) {
  Reply failure;
  auto account = accountFor(context, failure);
  if (!account) return failure;
  return Reply::boolean(context.server.tokens.remove(*account));
}

Reply tokenExpired(CommandContext& context) {
  Reply failure;
  auto account = accountFor(context, failure);
  if (!account) return failure;
  std::optional<UserToken> token = context.server.tokens.get(*account);
  if (!token) return Reply::error("account '" + *account + "' has no user token");
  return Reply::boolean(token->expired(nowSeconds()));
}

}  // namespace

std::vector<CommandSpec> securityCommands() {
  return {
      {"SEC_USERTOKEN_EXISTS", 0, tokenExists},
      {"SEC_GET_USERTOKEN", 0, getToken},
      {"SEC_ADD_USERTOKEN", 0, addToken},
      {"SEC_UPDATE_USERTOKEN", 0, updateToken},
      {"SEC_REMOVE_USERTOKEN", 0, removeToken},
      {"SEC_USERTOKEN_EXPIRED", 0, tokenExpired},
  };
}

}  // namespace zelserverd
