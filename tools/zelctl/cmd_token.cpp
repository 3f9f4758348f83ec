// token: user tokens of an account.

#include "commands.h"

namespace zelctl {

namespace {

struct Arguments {
    std::string account;
    std::string token;
    std::string clientAddress;
    long long timeout = 0;
};

IZELServerSecurityManager* security(Context& context) { return context.connection.session().getSecurityManager(); }

Outcome show(Context& context, const std::string& account)
{
    Connection& c = context.connection;
    const auto token = c.own(security(context)->createUserToken());
    if (!token)
        return complaint("out of memory for the token");
    bool found = false;
    if (Outcome failure = c.check(security(context)->getUserToken(c.text(account), *token, found)))
        return failure;
    if (!found)
        return complaint("no token for '" + account + "'");
    const IZELServerUserToken& t = *token;
    context.output.print({{"account", account},
                          {"token", c.read([&](IZELServerString& out) { t.getToken(out); })},
                          {"client address", c.read([&](IZELServerString& out) { t.getClientAddress(out); })},
                          {"timeout", t.getExpirationTimeout()}});
    return std::nullopt;
}

// Adds the token, or replaces the one the account has.
Outcome set(Context& context, const Arguments& a)
{
    Connection& c = context.connection;
    IZELServerSecurityManager& manager = *security(context);
    bool exists = false;
    if (Outcome failure = c.check(manager.userTokenExists(c.text(a.account), exists)))
        return failure;
    const auto token = c.own(manager.createUserToken(c.text(a.token), c.text(a.clientAddress), a.timeout));
    if (!token)
        return complaint("out of memory for the token");
    IZELServerStatus* status =
        exists ? manager.updateUserToken(c.text(a.account), *token) : manager.addUserToken(c.text(a.account), *token);
    if (Outcome failure = c.check(status))
        return failure;
    context.output.confirm({{"account", a.account}, {exists ? "updated" : "added", true}});
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
    context.output.confirm({{"account", account}, {"removed", true}});
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
    showCommand->add_option("ACCOUNT", a->account)->required();
    on(showCommand, chosen, [a](Context& c) { return show(c, a->account); });

    auto* setCommand = token->add_subcommand("set", "Set an account's token (empty: the server makes one)");
    setCommand->add_option("ACCOUNT", a->account)->required();
    setCommand->add_option("TOKEN", a->token)->required();
    setCommand->add_option("--client-address", a->clientAddress, "Only this client address may use it");
    setCommand->add_option("--timeout", a->timeout, "Seconds until it expires (0: never)");
    on(setCommand, chosen, [a](Context& c) { return set(c, *a); });

    auto* rmCommand = token->add_subcommand("rm", "Remove an account's token");
    rmCommand->add_option("ACCOUNT", a->account)->required();
    on(rmCommand, chosen, [a](Context& c) { return remove(c, a->account); });

    auto* expiredCommand = token->add_subcommand("expired", "Tell whether an account's token has expired");
    expiredCommand->add_option("ACCOUNT", a->account)->required();
    on(expiredCommand, chosen, [a](Context& c) { return expired(c, a->account); });
}

}  // namespace zelctl
