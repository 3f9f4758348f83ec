// service: the services of the server and the items registered with them.

#include "commands.h"

namespace zelctl {

namespace {

struct Arguments {
    std::string name;
    std::string filter = "all";
    std::optional<std::string> displayName;
    std::optional<std::string> description;
    std::optional<std::string> urlPattern;
    std::optional<bool> enabled;
    std::optional<bool> workspaces;
    std::string repository;
    std::string item;
};

using Service = ZELServerOwned<IZELServerService>;

// Looks the service up; a name the server does not know is a failure.
Outcome fetch(Connection& connection, const std::string& name, Service& service)
{
    service = connection.own(connection.session().createService());
    if (!service)
        return complaint("out of memory for the service");
    unsigned found = 0;
    if (Outcome failure = connection.check(
            connection.session().getRepositoryManager()->getService(connection.text(name), *service, found)))
        return failure;
    if (!found)
        return complaint("no service '" + name + "'");
    return std::nullopt;
}

nlohmann::ordered_json describe(Connection& connection, const IZELServerService& service)
{
    return {{"service", connection.read(service, &IZELServerService::getName)},
            {"display_name", connection.read(service, &IZELServerService::getDisplayName)},
            {"enabled", service.isEnabled() != 0},
            {"url_pattern", connection.read(service, &IZELServerService::getUrlPattern)},
            {"workspace_registration", service.isWorkspaceRegistrationAllowed() != 0},
            {"description", connection.read(service, &IZELServerService::getDescription)}};
}

Outcome list(Context& context, const std::string& filter)
{
    IZELServerSession& session = context.connection.session();
    const auto services = context.connection.own(session.createServiceVector());
    if (!services)
        return complaint("out of memory for the list");
    ZELServerStringDict directives;
    directives.insert("ENABLE_FILTER", filter == "enabled" ? "ENABLED" : filter == "disabled" ? "DISABLED" : "ALL");
    Outcome failure = context.connection.check(session.getRepositoryManager()->getServices(&directives, *services));
    return printRows(context, failure, *services,
                     [&](const IZELServerService& s) { return describe(context.connection, s); });
}

Outcome show(Context& context, const std::string& name)
{
    Service service;
    if (Outcome failure = fetch(context.connection, name, service))
        return failure;
    const auto items = context.connection.own(context.connection.session().createItemVector());
    if (!items)
        return complaint("out of memory for the list");
    Outcome failure = context.connection.check(service->getRegisteredItems(nullptr, *items));
    nlohmann::ordered_json json = describe(context.connection, *service);
    nlohmann::ordered_json registered = nlohmann::ordered_json::array();
    for (unsigned i = 0; !failure && i < items->entries(); ++i) {
        const IZELServerItem& item = *items->element(i);
        registered.push_back({{"repository", context.connection.read(item, &IZELServerItem::getRepositoryName)},
                              {"item", context.connection.read(item, &IZELServerItem::getName)}});
    }
    if (failure)
        return failure;
    json["registered"] = registered;
    context.output.print(json);
    return std::nullopt;
}

// Applies the options the user gave; the others keep the service's values.
void apply(Connection& connection, const Arguments& a, IZELServerService& service)
{
    if (a.displayName)
        service.setDisplayName(connection.text(*a.displayName));
    if (a.description)
        service.setDescription(connection.text(*a.description));
    if (a.urlPattern)
        service.setUrlPattern(connection.text(*a.urlPattern));
    if (a.enabled)
        service.setEnabled(*a.enabled ? 1 : 0);
    if (a.workspaces)
        service.setWorkspaceRegistrationAllowed(*a.workspaces ? 1 : 0);
}

Outcome create(Context& context, const Arguments& a)
{
    Connection& c = context.connection;
    const Service service =
        c.own(c.session().createService(c.text(a.name), c.text(a.displayName.value_or(a.name)),
                                        c.text(a.description.value_or("")), c.text(a.urlPattern.value_or(""))));
    if (!service)
        return complaint("out of memory for the service");
    apply(c, a, *service);
    Outcome failure = c.check(c.session().getRepositoryManager()->addService(*service));
    if (!failure)
        context.output.done("created", {{"service", a.name}});
    return failure;
}

Outcome update(Context& context, const Arguments& a)
{
    Service service;
    if (Outcome failure = fetch(context.connection, a.name, service))
        return failure;
    apply(context.connection, a, *service);
    if (Outcome failure =
            context.connection.check(context.connection.session().getRepositoryManager()->updateService(*service)))
        return failure;
    context.output.done("updated", {{"service", a.name}});
    return std::nullopt;
}

Outcome remove(Context& context, const std::string& name)
{
    unsigned removed = 0;
    if (Outcome failure = context.connection.check(
            context.connection.session().getRepositoryManager()->removeService(context.connection.text(name), removed)))
        return failure;
    if (!removed)
        return complaint("no service '" + name + "'");
    context.output.done("deleted", {{"service", name}});
    return std::nullopt;
}

Outcome registration(Context& context, const Arguments& a, bool add)
{
    Service service;
    if (Outcome failure = fetch(context.connection, a.name, service))
        return failure;
    Connection& c = context.connection;
    unsigned deregistered = 0;
    IZELServerStatus* status = add ? service->registerItem(c.text(a.repository), c.text(a.item))
                                   : service->deregisterItem(c.text(a.repository), c.text(a.item), deregistered);
    if (Outcome failure = c.check(status))
        return failure;
    if (!add && !deregistered)
        return complaint("'" + a.item + "' is not registered with '" + a.name + "'");
    context.output.done(add ? "registered" : "deregistered",
                        {{"service", a.name}, {"repository", a.repository}, {"item", a.item}});
    return std::nullopt;
}

void addFieldOptions(CLI::App* command, Arguments& a)
{
    command->add_option("NAME", a.name, "Service name")->required();
    command->add_option("--display-name", a.displayName, "Display name");
    command->add_option("--description", a.description, "Description");
    command->add_option("--url-pattern", a.urlPattern, "URL pattern");
    command->add_option("--enabled", a.enabled, "true or false");
    command->add_option("--workspace-registration", a.workspaces, "true or false: workspaces may be registered");
}

}  // namespace

void addServiceCommands(CLI::App& app, Action& chosen)
{
    auto a = std::make_shared<Arguments>();
    auto* service = app.add_subcommand("service", "Services and item registrations");
    service->require_subcommand(1);

    auto* listCommand = service->add_subcommand("list", "List services");
    listCommand->add_option("--filter", a->filter, "all, enabled or disabled")
        ->check(CLI::IsMember({"all", "enabled", "disabled"}));
    on(listCommand, chosen, [a](Context& c) { return list(c, a->filter); });

    auto* showCommand = service->add_subcommand("show", "Show a service and its registered items");
    showCommand->add_option("NAME", a->name, "Service name")->required();
    on(showCommand, chosen, [a](Context& c) { return show(c, a->name); });

    auto* createCommand = service->add_subcommand("create", "Create a service");
    addFieldOptions(createCommand, *a);
    on(createCommand, chosen, [a](Context& c) { return create(c, *a); });

    auto* updateCommand = service->add_subcommand("update", "Change a service");
    addFieldOptions(updateCommand, *a);
    on(updateCommand, chosen, [a](Context& c) { return update(c, *a); });

    auto* deleteCommand = service->add_subcommand("delete", "Delete a service");
    deleteCommand->alias("rm");
    deleteCommand->add_option("NAME", a->name, "Service name")->required();
    on(deleteCommand, chosen, [a](Context& c) { return remove(c, a->name); });

    for (const bool add : {true, false}) {
        auto* command = service->add_subcommand(add ? "register" : "deregister",
                                                add ? "Register an item with a service" : "Deregister an item");
        command->add_option("SERVICE", a->name, "Service name")->required();
        command->add_option("REPOSITORY", a->repository, "Repository of the item")->required();
        command->add_option("ITEM", a->item, "Item name")->required();
        on(command, chosen, [a, add](Context& c) { return registration(c, *a, add); });
    }
}

}  // namespace zelctl
