// workspace: the workspaces of a repository and what one of them asks for and works on.

#include "repository.h"

namespace zelctl {

namespace {

// The server's names for the enable filter.
std::string filterDirective(const std::string& filter)
{
    if (filter == "enabled")
        return "ENABLED";
    if (filter == "disabled")
        return "DISABLED";
    return "ALL";
}

Outcome list(Context& context, const std::string& name, const std::string& filter)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    const auto summaries = context.connection.own(context.connection.session().createWorkspaceSummaryVector());
    if (!summaries)
        return complaint("out of memory for the list");
    ZELServerStringDict directives;
    directives.insert("ENABLE_FILTER", filterDirective(filter));
    Outcome failure = context.connection.check(repository.get().getWorkspaceSummariesView(&directives, *summaries));
    return printRows(context, failure, *summaries, [&](const IZELServerWorkspaceSummary& s) {
        return nlohmann::ordered_json{
            {"workspace", context.connection.read(s, &IZELServerWorkspaceSummary::getName)},
            {"title", context.connection.read(s, &IZELServerWorkspaceSummary::getTitle)},
            {"enabled", s.isEnabled()},
            {"description", context.connection.read(s, &IZELServerWorkspaceSummary::getDescription)}};
    });
}

nlohmann::ordered_json parameters(Connection& connection, IZELServerVector<IZELServerParameter>& list)
{
    return rowsOf(list, [&](const IZELServerParameter& p) {
        const auto options = connection.own(connection.session().createStringArray());
        nlohmann::ordered_json choices = nlohmann::ordered_json::array();
        if (options) {
            p.getOptions(*options);
            for (unsigned j = 0; j < options->entries(); ++j)
                choices.push_back(options->element(j));
        }
        return nlohmann::ordered_json{{"name", connection.read(p, &IZELServerParameter::getName)},
                                      {"type", connection.read(p, &IZELServerParameter::getType)},
                                      {"default", connection.read(p, &IZELServerParameter::getDefaultValue)},
                                      {"choices", choices},
                                      {"description", connection.read(p, &IZELServerParameter::getDescription)}};
    });
}

nlohmann::ordered_json featureTypes(Connection& connection, IZELServerVector<IZELServerFeatureType>& list)
{
    return rowsOf(list, [&](const IZELServerFeatureType& f) {
        return nlohmann::ordered_json{{"name", connection.read(f, &IZELServerFeatureType::getName)},
                                      {"description", connection.read(f, &IZELServerFeatureType::getDescription)}};
    });
}

nlohmann::ordered_json datasets(Connection& connection, IZELServerVector<IZELServerDataset>& list)
{
    return rowsOf(list, [&](const IZELServerDataset& d) {
        return nlohmann::ordered_json{{"name", connection.read(d, &IZELServerDataset::getName)},
                                      {"format", connection.read(d, &IZELServerDataset::getFormat)},
                                      {"location", connection.read(d, &IZELServerDataset::getLocation)}};
    });
}

Outcome show(Context& context, const std::string& name, const std::string& workspaceName)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    Connection& c = context.connection;
    const auto workspace = c.own(c.session().createWorkspace());
    if (!workspace)
        return complaint("out of memory for the workspace");
    unsigned found = 0;
    Outcome failure = c.check(repository.get().getWorkspaceView(c.text(workspaceName), *workspace, found));
    if (!failure && !found)
        failure = complaint("no workspace '" + workspaceName + "' in '" + name + "'");
    if (!failure) {
        IZELServerWorkspace& w = *workspace;
        context.output.print({{"workspace", c.read(w, &IZELServerWorkspace::getName)},
                              {"title", c.read(w, &IZELServerWorkspace::getTitle)},
                              {"description", c.read(w, &IZELServerWorkspace::getDescription)},
                              {"enabled", w.isEnabled()},
                              {"size", w.getFileSize()},
                              {"parameters", parameters(c, w.getParameters())},
                              {"source_datasets", datasets(c, w.getSourceDatasets())},
                              {"destination_datasets", datasets(c, w.getDestinationDatasets())},
                              {"source_feature_types", featureTypes(c, w.getSourceFeatureTypes())},
                              {"destination_feature_types", featureTypes(c, w.getDestinationFeatureTypes())}});
    }
    return failure;
}

}  // namespace

void addWorkspaceCommands(CLI::App& app, Action& chosen)
{
    auto repository = std::make_shared<std::string>();
    auto name = std::make_shared<std::string>();
    auto filter = std::make_shared<std::string>("all");

    auto* workspace = app.add_subcommand("workspace", "Workspaces of a repository");
    workspace->require_subcommand(1);
    auto* listCommand = workspace->add_subcommand("list", "List the workspaces of a repository");
    listCommand->add_option("REPOSITORY", *repository, "Repository name")->required();
    listCommand->add_option("--filter", *filter, "all, enabled or disabled")
        ->check(CLI::IsMember({"all", "enabled", "disabled"}));
    on(listCommand, chosen, [repository, filter](Context& c) { return list(c, *repository, *filter); });

    auto* showCommand = workspace->add_subcommand("show", "Show parameters, datasets and feature types");
    showCommand->add_option("REPOSITORY", *repository, "Repository name")->required();
    showCommand->add_option("WORKSPACE", *name, "Workspace item, e.g. greeting.zlw")->required();
    on(showCommand, chosen, [repository, name](Context& c) { return show(c, *repository, *name); });
}

}  // namespace zelctl
