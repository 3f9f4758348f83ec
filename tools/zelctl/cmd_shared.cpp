// sr: shared resources, the server's file areas.

#include <filesystem>
#include <map>

#include "commands.h"
#include "progress.h"

namespace zelctl {

namespace {

struct Arguments {
    std::string resource;
    std::string path = "/";
    std::string target;
    std::string file;
};

// A shared resource looked up by name, with the paths made on it released before it goes.
class Area {
public:
    explicit Area(Connection& connection)
        : connection_(connection), area_(connection.own(connection.session().createMountPoint()))
    {}
    // Paths belong to the mount point that made them, not to the session.
    ~Area()
    {
        for (IZELServerPath* path : paths_)
            area_->releaseObject(path);
    }
    Area(const Area&) = delete;
    Area& operator=(const Area&) = delete;

    Outcome open(const std::string& name)
    {
        if (!area_)
            return complaint("out of memory for the shared resource");
        unsigned found = 0;
        if (Outcome failure = connection_.check(
                connection_.session().getMountPointManager()->getSharedResource(connection_.text(name), *area_, found)))
            return failure;
        if (!found)
            return complaint("no shared resource '" + name + "'");
        return std::nullopt;
    }

    // Paths are rooted at the resource; a missing leading "/" is added.
    IZELServerPath& path(const std::string& text)
    {
        paths_.push_back(area_->createPath(connection_.text(text.empty() || text[0] != '/' ? "/" + text : text)));
        return *paths_.back();
    }
    IZELServerMountPoint& get() { return *area_; }

private:
    Connection& connection_;
    ZELServerOwned<IZELServerMountPoint> area_;
    std::vector<IZELServerPath*> paths_;
};

nlohmann::ordered_json describe(Connection& connection, const IZELServerFileInfo& info)
{
    return {{"name", connection.read(info.getPath(), &IZELServerPath::getName)},
            {"type", info.isDirectory() ? "dir" : "file"},
            {"size", info.getSize()},
            {"date", connection.read(info, &IZELServerFileInfo::getDate)},
            {"path", connection.read(info.getPath(), &IZELServerPath::getAbsolutePath)}};
}

Outcome resources(Context& context)
{
    IZELServerSession& session = context.connection.session();
    const auto areas = context.connection.own(session.createMountPointVector());
    if (!areas)
        return complaint("out of memory for the list");
    Outcome failure = context.connection.check(session.getMountPointManager()->getSharedResources(*areas));
    return printRows(context, failure, *areas, [&](const IZELServerMountPoint& area) {
        return nlohmann::ordered_json{
            {"shared_resource", context.connection.read(area, &IZELServerMountPoint::getName)},
            {"display_name", context.connection.read(area, &IZELServerMountPoint::getDisplayName)},
            {"description", context.connection.read(area, &IZELServerMountPoint::getDescription)}};
    });
}

Outcome list(Context& context, const Arguments& a)
{
    Area area(context.connection);
    if (Outcome failure = area.open(a.resource))
        return failure;
    const auto entries = context.connection.own(context.connection.session().createFileInfoVector());
    if (!entries)
        return complaint("out of memory for the list");
    Outcome failure = context.connection.check(area.get().list(area.path(a.path), *entries));
    return printRows(context, failure, *entries,
                     [&](const IZELServerFileInfo& info) { return describe(context.connection, info); });
}

Outcome stat(Context& context, const Arguments& a)
{
    Area area(context.connection);
    if (Outcome failure = area.open(a.resource))
        return failure;
    const auto info = context.connection.own(context.connection.session().createFileInfo());
    if (!info)
        return complaint("out of memory for the file information");
    Outcome failure = context.connection.check(area.get().getFileInfo(area.path(a.path), *info));
    if (!failure)
        context.output.print(describe(context.connection, *info));
    return failure;
}

// mkdir, rm, cp and mv: one call on the resource each, then a confirmation.
Outcome change(Context& context, const Arguments& a, const std::string& what)
{
    Area area(context.connection);
    if (Outcome failure = area.open(a.resource))
        return failure;
    IZELServerMountPoint& m = area.get();
    unsigned removed = 1;
    IZELServerStatus* status = nullptr;
    if (what == "mkdir")
        status = m.makeDirectory(area.path(a.path));
    else if (what == "rm")
        status = m.remove(area.path(a.path), removed);
    else if (what == "cp")
        status = m.copy(area.path(a.path), area.path(a.target));
    else
        status = m.move(area.path(a.path), area.path(a.target));
    if (Outcome failure = context.connection.check(status))
        return failure;
    if (!removed)
        return complaint("no '" + a.path + "' in '" + a.resource + "'");
    nlohmann::ordered_json json = {{"shared_resource", a.resource}, {"path", a.path}};
    if (!a.target.empty())
        json["target"] = a.target;
    const std::map<std::string, const char*> verbs = {
        {"mkdir", "created"}, {"rm", "removed"}, {"cp", "copied"}, {"mv", "moved"}};
    context.output.done(verbs.at(what), json);
    return std::nullopt;
}

Outcome download(Context& context, const Arguments& a)
{
    Area area(context.connection);
    if (Outcome failure = area.open(a.resource))
        return failure;
    const std::string file = a.file.empty() ? std::filesystem::path(a.path).filename().string() : a.file;
    if (file.empty())
        return complaint("name the local file with -o");
    ProgressBar bar(file, !context.output.quiet());
    unsigned received = 0;
    if (Outcome failure = context.connection.check(
            area.get().download(area.path(a.path), context.connection.text(file), received, &bar)))
        return failure;
    if (!received)
        return complaint("nothing received for '" + a.path + "'");
    context.output.done("downloaded", {{"shared_resource", a.resource}, {"path", a.path}, {"file", file}});
    return std::nullopt;
}

Outcome upload(Context& context, const Arguments& a)
{
    Area area(context.connection);
    if (Outcome failure = area.open(a.resource))
        return failure;
    ProgressBar bar(a.file, !context.output.quiet());
    if (Outcome failure =
            context.connection.check(area.get().upload(context.connection.text(a.file), area.path(a.path), &bar)))
        return failure;
    context.output.done("uploaded", {{"shared_resource", a.resource}, {"path", a.path}, {"file", a.file}});
    return std::nullopt;
}

}  // namespace

void addSharedResourceCommands(CLI::App& app, Action& chosen)
{
    auto a = std::make_shared<Arguments>();
    auto* sr = app.add_subcommand("sr", "Shared resources");
    sr->require_subcommand(1);

    on(sr->add_subcommand("list", "List shared resources"), chosen, resources);

    auto* ls = sr->add_subcommand("ls", "List a folder");
    ls->add_option("RESOURCE", a->resource, "Shared resource name, e.g. DATA")->required();
    ls->add_option("PATH", a->path, "Folder (default: /)");
    on(ls, chosen, [a](Context& c) { return list(c, *a); });

    auto* statCommand = sr->add_subcommand("stat", "Show a file or folder");
    statCommand->add_option("RESOURCE", a->resource, "Shared resource name, e.g. DATA")->required();
    statCommand->add_option("PATH", a->path, "Path in the resource, e.g. /in/data.csv")->required();
    on(statCommand, chosen, [a](Context& c) { return stat(c, *a); });

    for (const char* what : {"mkdir", "rm"}) {
        auto* command =
            sr->add_subcommand(what, std::string(what) == "rm" ? "Remove a file or folder" : "Make a folder");
        command->add_option("RESOURCE", a->resource, "Shared resource name, e.g. DATA")->required();
        command->add_option("PATH", a->path, "Path in the resource, e.g. /in/data.csv")->required();
        on(command, chosen, [a, what](Context& c) { return change(c, *a, what); });
    }
    for (const char* what : {"cp", "mv"}) {
        auto* command = sr->add_subcommand(what, std::string(what) == "cp" ? "Copy within the resource"
                                                                           : "Move within the resource");
        command->add_option("RESOURCE", a->resource, "Shared resource name, e.g. DATA")->required();
        command->add_option("SOURCE", a->path, "Path to copy or move")->required();
        command->add_option("TARGET", a->target, "Path it goes to")->required();
        on(command, chosen, [a, what](Context& c) { return change(c, *a, what); });
    }

    auto* getCommand = sr->add_subcommand("get", "Download a file");
    getCommand->add_option("RESOURCE", a->resource, "Shared resource name, e.g. DATA")->required();
    getCommand->add_option("PATH", a->path, "Path in the resource, e.g. /in/data.csv")->required();
    getCommand->add_option("-o,--output", a->file, "Local file (default: the file's name)");
    on(getCommand, chosen, [a](Context& c) { return download(c, *a); });

    auto* putCommand = sr->add_subcommand("put", "Upload a file");
    putCommand->add_option("RESOURCE", a->resource, "Shared resource name, e.g. DATA")->required();
    putCommand->add_option("FILE", a->file, "Local file to upload")->required()->check(CLI::ExistingFile);
    putCommand->add_option("PATH", a->path, "Path in the resource, e.g. /in/data.csv")->required();
    on(putCommand, chosen, [a](Context& c) { return upload(c, *a); });
}

}  // namespace zelctl
