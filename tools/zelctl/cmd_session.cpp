// ping, whoami and prop: whether a server is there, who it thinks we are, and what it tells about itself.

#include "commands.h"

namespace zelctl {

namespace {

Outcome whoami(Context& context)
{
    IZELServerSession& session = context.connection.session();
    IZELServerIdentity* identity = session.getIdentity();
    if (identity == nullptr)
        return complaint("the session has no identity");
    const auto roles = context.connection.own(session.createStringArray());
    if (!roles)
        return complaint("out of memory for the roles");
    identity->getRoles(*roles);
    nlohmann::ordered_json list = nlohmann::ordered_json::array();
    for (unsigned i = 0; i < roles->entries(); ++i)
        list.push_back(roles->element(i));
    context.output.print({{"account", context.connection.read(*identity, &IZELServerIdentity::getId)},
                          {"authenticated", identity->isAuthenticated()},
                          {"roles", list}});
    return std::nullopt;
}

}  // namespace

void addSessionCommands(CLI::App& app, Action& chosen)
{
    // main reaches the server without signing in for this one command.
    on(app.add_subcommand("ping", "Tell whether a server answers, without signing in; exits 0 when it does"), chosen,
       [](Context& context) -> Outcome {
           const GlobalOptions& options = context.connection.options();
           context.output.print({{"host", options.host}, {"port", options.port}, {"up", true}});
           return std::nullopt;
       });
    on(app.add_subcommand("whoami", "Show the signed-in identity and its roles"), chosen, whoami);

    auto* prop = app.add_subcommand("prop", "Show a session property");
    auto name = std::make_shared<std::string>();
    prop->add_option("NAME", *name, "Property name, e.g. SERVER_VERSION")->required();
    on(prop, chosen, [name](Context& context) -> Outcome {
        IZELServerString& value = context.connection.text();
        if (Outcome failure = context.connection.check(
                context.connection.session().getSessionProperty(context.connection.text(*name), value)))
            return failure;
        if (context.output.json())
            context.output.print({{"property", *name}, {"value", value.c_str()}});
        else
            context.output.print(std::string(value.c_str()));
        return std::nullopt;
    });
}

}  // namespace zelctl
