// item and resource: the files of a repository and the resource files that belong to an item.

#include <filesystem>

#include "progress.h"
#include "repository.h"

namespace zelctl {

namespace {

// Adds one row per item of one kind. Workspaces, custom formats, custom transformers and
// templates share their getters, so one template reads all four.
template <typename Item, typename View>
Outcome collect(Context& context, const char* kind, ZELServerOwned<IZELServerVector<Item>> items, View view,
                nlohmann::ordered_json& rows)
{
    if (!items)
        return complaint("out of memory for the list");
    Outcome failure = context.connection.check(view(*items));
    for (unsigned i = 0; !failure && i < items->entries(); ++i) {
        const Item& item = *items->element(i);
        rows.push_back({{"item", context.connection.read(item, &Item::getName)},
                        {"type", kind},
                        {"title", context.connection.read(item, &Item::getTitle)},
                        {"size", static_cast<long long>(item.getFileSize())}});
    }
    return failure;
}

Outcome list(Context& context, const std::string& name)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    Connection& c = context.connection;
    IZELServerSession& session = c.session();
    IZELServerRepository& r = repository.get();
    nlohmann::ordered_json rows = nlohmann::ordered_json::array();
    Outcome failure = collect(
        context, "workspace", c.own(session.createWorkspaceVector()),
        [&](auto& v) { return r.getWorkspacesView(nullptr, v); }, rows);
    if (!failure)
        failure = collect(
            context, "custom format", c.own(session.createCustomFormatVector()),
            [&](auto& v) { return r.getCustomFormatsView(nullptr, v); }, rows);
    if (!failure)
        failure = collect(
            context, "custom transformer", c.own(session.createCustomTransformerVector()),
            [&](auto& v) { return r.getCustomTransformersView(nullptr, v); }, rows);
    if (!failure)
        failure = collect(
            context, "template", c.own(session.createTemplateVector()),
            [&](auto& v) { return r.getTemplatesView(nullptr, v); }, rows);
    if (!failure)
        context.output.print(rows);
    return failure;
}

// What a confirmation names: the repository, the item and, for a resource, the resource.
nlohmann::ordered_json subject(const std::string& repository, const std::string& item, const std::string& resource)
{
    nlohmann::ordered_json json = {{"repository", repository}, {"item", item}};
    if (!resource.empty())
        json["resource"] = resource;
    return json;
}

Outcome get(Context& context, const std::string& name, const std::string& item, const std::string& resource,
            std::string file)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    if (file.empty())
        file = resource.empty() ? item : resource;
    Connection& c = context.connection;
    ProgressBar bar(resource.empty() ? item : resource, !context.output.quiet());
    unsigned received = 0;
    IZELServerStatus* status = resource.empty() ? repository.get().getItem(c.text(item), c.text(file), received, &bar)
                                                : repository.get().getItemResource(c.text(item), c.text(resource),
                                                                                   c.text(file), received, &bar);
    if (Outcome failure = c.check(status))
        return failure;
    if (!received)
        return complaint("nothing received for '" + (resource.empty() ? item : resource) + "'");
    nlohmann::ordered_json done = subject(name, item, resource);
    done["file"] = file;
    context.output.done("downloaded", done);
    return std::nullopt;
}

Outcome put(Context& context, const std::string& name, const std::string& item, const std::string& file,
            std::string target, bool update)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    if (target.empty())
        target = std::filesystem::path(file).filename().string();
    Connection& c = context.connection;
    IZELServerRepository& r = repository.get();
    ProgressBar bar(target, !context.output.quiet());
    IZELServerStatus* status = nullptr;
    if (item.empty())
        status =
            update ? r.updateItem(c.text(target), c.text(file), &bar) : r.addItem(c.text(target), c.text(file), &bar);
    else
        status = update ? r.updateItemResource(c.text(item), c.text(target), c.text(file), &bar)
                        : r.addItemResource(c.text(item), c.text(target), c.text(file), &bar);
    if (Outcome failure = c.check(status))
        return failure;
    nlohmann::ordered_json done = item.empty() ? subject(name, target, "") : subject(name, item, target);
    done["file"] = file;
    context.output.done(update ? "updated" : "added", done);
    return std::nullopt;
}

Outcome remove(Context& context, const std::string& name, const std::string& item, const std::string& resource)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    Connection& c = context.connection;
    unsigned removed = 0;
    IZELServerStatus* status = resource.empty()
                                   ? repository.get().removeItem(c.text(item), removed)
                                   : repository.get().removeItemResource(c.text(item), c.text(resource), removed);
    if (Outcome failure = c.check(status))
        return failure;
    const std::string what = resource.empty() ? item : resource;
    if (!removed)
        return complaint("no such item or resource '" + what + "'");
    context.output.done("removed", subject(name, item, resource));
    return std::nullopt;
}

Outcome resources(Context& context, const std::string& name, const std::string& item)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    const auto list = context.connection.own(context.connection.session().createResourceVector());
    if (!list)
        return complaint("out of memory for the list");
    Outcome failure =
        context.connection.check(repository.get().getItemResourcesView(context.connection.text(item), nullptr, *list));
    return printRows(context, failure, *list, [&](const IZELServerResource& resource) {
        return nlohmann::ordered_json{
            {"resource", context.connection.read(resource, &IZELServerResource::getName)},
            {"description", context.connection.read(resource, &IZELServerResource::getDescription)},
            {"size", resource.getFileSize()}};
    });
}

struct Arguments {
    std::string repository;
    std::string item;
    std::string resource;
    std::string file;
    std::string name;
    bool update = false;
};

}  // namespace

void addItemCommands(CLI::App& app, Action& chosen)
{
    auto a = std::make_shared<Arguments>();

    auto* item = app.add_subcommand("item", "Items of a repository");
    item->require_subcommand(1);
    auto* listCommand = item->add_subcommand("list", "List the items of a repository");
    listCommand->add_option("REPOSITORY", a->repository, "Repository name")->required();
    on(listCommand, chosen, [a](Context& c) { return list(c, a->repository); });

    auto* getCommand = item->add_subcommand("get", "Download an item");
    getCommand->add_option("REPOSITORY", a->repository, "Repository name")->required();
    getCommand->add_option("ITEM", a->item, "Item name, e.g. greeting.zlw")->required();
    getCommand->add_option("-o,--output", a->file, "Local file (default: the item's name)");
    on(getCommand, chosen, [a](Context& c) { return get(c, a->repository, a->item, "", a->file); });

    auto* putCommand = item->add_subcommand("put", "Upload a file as an item");
    putCommand->add_option("REPOSITORY", a->repository, "Repository name")->required();
    putCommand->add_option("FILE", a->file, "Local file to upload")->required()->check(CLI::ExistingFile);
    putCommand->add_option("--name", a->name, "Item name (default: the file's name)");
    putCommand->add_flag("--update", a->update, "Replace an existing item");
    on(putCommand, chosen, [a](Context& c) { return put(c, a->repository, "", a->file, a->name, a->update); });

    auto* rmCommand = item->add_subcommand("rm", "Remove an item");
    rmCommand->add_option("REPOSITORY", a->repository, "Repository name")->required();
    rmCommand->add_option("ITEM", a->item, "Item name, e.g. greeting.zlw")->required();
    on(rmCommand, chosen, [a](Context& c) { return remove(c, a->repository, a->item, ""); });

    auto* resource = app.add_subcommand("resource", "Resource files of an item");
    resource->require_subcommand(1);
    auto* rlist = resource->add_subcommand("list", "List the resources of an item");
    rlist->add_option("REPOSITORY", a->repository, "Repository name")->required();
    rlist->add_option("ITEM", a->item, "Item name, e.g. greeting.zlw")->required();
    on(rlist, chosen, [a](Context& c) { return resources(c, a->repository, a->item); });

    auto* rget = resource->add_subcommand("get", "Download a resource");
    rget->add_option("REPOSITORY", a->repository, "Repository name")->required();
    rget->add_option("ITEM", a->item, "Item name, e.g. greeting.zlw")->required();
    rget->add_option("RESOURCE", a->resource, "Resource name")->required();
    rget->add_option("-o,--output", a->file, "Local file (default: the resource's name)");
    on(rget, chosen, [a](Context& c) { return get(c, a->repository, a->item, a->resource, a->file); });

    auto* rput = resource->add_subcommand("put", "Upload a file as a resource of an item");
    rput->add_option("REPOSITORY", a->repository, "Repository name")->required();
    rput->add_option("ITEM", a->item, "Item name, e.g. greeting.zlw")->required();
    rput->add_option("FILE", a->file, "Local file to upload")->required()->check(CLI::ExistingFile);
    rput->add_option("--name", a->name, "Resource name (default: the file's name)");
    rput->add_flag("--update", a->update, "Replace an existing resource");
    on(rput, chosen, [a](Context& c) { return put(c, a->repository, a->item, a->file, a->name, a->update); });

    auto* rrm = resource->add_subcommand("rm", "Remove a resource");
    rrm->add_option("REPOSITORY", a->repository, "Repository name")->required();
    rrm->add_option("ITEM", a->item, "Item name, e.g. greeting.zlw")->required();
    rrm->add_option("RESOURCE", a->resource, "Resource name")->required();
    on(rrm, chosen, [a](Context& c) { return remove(c, a->repository, a->item, a->resource); });
}

}  // namespace zelctl
