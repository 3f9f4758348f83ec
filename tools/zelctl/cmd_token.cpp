// token: user tokens of an account.

#include "commands.h"

namespace zelctl {

namespace {

struct Arguments {
    std::string account;
    std::string token;
    std::string clientAddress;
    long long expiresAfter = 0;
};

IZELServerSecurityManager* security(Context& context) { return context.connection.session().getSecurityManager(); }

// The account's token as the server keeps it; an account without one is a failure.
Outcome fetch(Context& context, const std::string& account, ZELServerOwned<IZELServerUserToken>& token)
{
    Connection& c = context.connection;
    token = c.own(security(context)->createUserToken());
    if (!token)
        return complaint("out of memory for the token");
    bool found = false;
    if (Outcome failure = c.check(security(context)->getUserToken(c.text(account), *token, found)))
        return failure;
    if (!found)
        return complaint("no token for '" + account + "'");
    return std::nullopt;
}

Outcome show(Context& context, const std::string& account)
{
    ZELServerOwned<IZELServerUserToken> token;
    if (Outcome failure = fetch(context, account, token))
        return failure;
    Connection& c = context.connection;
    context.output.print({{"account", account},
                          {"token", c.read(*token, &IZELServerUserToken::getToken)},
                          {"client_address", c.read(*token, &IZELServerUserToken::getClientAddress)},
                          {"expires_after", token->getExpirationTimeout()}});
    return std::nullopt;
}

// Adds the token, or replaces the one the account has. An empty token asks the server to make one,
// which is then news to the user: it is printed even with --quiet.
Outcome set(Context& context, const Arguments& a)
{
    Connection& c = context.connection;
    IZELServerSecurityManager& manager = *security(context);
    bool exists = false;
    if (Outcome failure = c.check(manager.userTokenExists(c.text(a.account), exists)))
        return failure;
    const auto token = c.own(manager.createUserToken(c.text(a.token), c.text(a.clientAddress), a.expiresAfter));
    if (!token)
        return complaint("out of memory for the token");
    IZELServerStatus* status =
        exists ? manager.updateUserToken(c.text(a.account), *token) : manager.addUserToken(c.text(a.account), *token);
    if (Outcome failure = c.check(status))
        return failure;
    const char* verb = exists ? "updated" : "added";
    if (!a.token.empty()) {
        context.output.done(verb, {{"account", a.account}, {"token", a.token}});
        return std::nullopt;
    }
    ZELServerOwned<IZELServerUserToken> made;
    if (Outcome failure = fetch(context, a.account, made))
        return failure;
    const std::string value = c.read(*made, &IZELServerUserToken::getToken);
    if (context.output.json())
        context.output.print({{"done", verb}, {"account", a.account}, {"token", value}});
    else
        context.output.print(value);
    return std::nullopt;
}

Outcome remove(Context& context, const std::string& account)
{
    bool removed = false;
    if (Outcome failure =
            context.connection.check(security(context)->removeUserToken(context.connection.text(account), removed)))
        return failure;
    if (!removed)
        return complaint("no token for '" + account + "'");
    context.output.done("removed", {{"account", account}});
    return std::nullopt;
}

Outcome expired(Context& context, const std::string& account)
{
    bool isExpired = false;
    if (Outcome failure =
            context.connection.check(security(context)->userTokenExpired(context.connection.text(account), isExpired)))
        return failure;
    context.output.print({{"account", account}, {"expired", isExpired}});
    return std::nullopt;
}

}  // namespace

void addTokenCommands(CLI::App& app, Action& chosen)
{
    auto a = std::make_shared<Arguments>();
    auto* token = app.add_subcommand("token", "User tokens");
    token->require_subcommand(1);

    auto* showCommand = token->add_subcommand("show", "Show an account's token");
    showCommand->add_option("ACCOUNT", a->account, "User account name")->required();
    on(showCommand, chosen, [a](Context& c) { return show(c, a->account); });

    auto* setCommand = token->add_subcommand("set", "Set an account's token");
    setCommand->add_option("ACCOUNT", a->account, "User account name")->required();
    setCommand->add_option("TOKEN", a->token, "The token; left out, the server makes one and zelctl prints it");
    setCommand->add_option("--client-address", a->clientAddress, "Only this client address may use it");
    setCommand->add_option("--expires-after", a->expiresAfter, "Seconds until it expires (0: never)");
    on(setCommand, chosen, [a](Context& c) { return set(c, *a); });

    auto* rmCommand = token->add_subcommand("rm", "Remove an account's token");
    rmCommand->add_option("ACCOUNT", a->account, "User account name")->required();
    on(rmCommand, chosen, [a](Context& c) { return remove(c, a->account); });

    auto* expiredCommand = token->add_subcommand("expired", "Tell whether an account's token has expired");
    expiredCommand->add_option("ACCOUNT", a->account, "User account name")->required();
    on(expiredCommand, chosen, [a](Context& c) { return expired(c, a->account); });
}

}  // namespace zelctl
