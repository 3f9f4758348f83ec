// repo: list, show, create and delete repositories.

#include "repository.h"

namespace zelctl {

Outcome OpenRepository::open(const std::string& name)
{
    repository_ = connection_.own(connection_.session().createRepository());
    if (!repository_)
        return complaint("out of memory for the repository");
    unsigned found = 0;
    if (Outcome failure = connection_.check(
            connection_.session().getRepositoryManager()->getRepository(connection_.text(name), *repository_, found)))
        return failure;
    if (!found)
        return complaint("no repository '" + name + "'");
    return std::nullopt;
}

namespace {

nlohmann::ordered_json describe(Connection& connection, const IZELServerRepository& repository)
{
    return {{"repository", connection.read(repository, &IZELServerRepository::getName)},
            {"description", connection.read(repository, &IZELServerRepository::getDescription)}};
}

Outcome list(Context& context)
{
    IZELServerSession& session = context.connection.session();
    const auto repositories = context.connection.own(session.createRepositoryVector());
    if (!repositories)
        return complaint("out of memory for the list");
    Outcome failure = context.connection.check(session.getRepositoryManager()->getRepositories(nullptr, *repositories));
    return printRows(context, failure, *repositories,
                     [&](const IZELServerRepository& r) { return describe(context.connection, r); });
}

Outcome show(Context& context, const std::string& name)
{
    OpenRepository repository(context.connection);
    if (Outcome failure = repository.open(name))
        return failure;
    context.output.print(describe(context.connection, repository.get()));
    return std::nullopt;
}

Outcome create(Context& context, const std::string& name, const std::string& description)
{
    if (Outcome failure = context.connection.check(context.connection.session().getRepositoryManager()->addRepository(
            context.connection.text(name), context.connection.text(description))))
        return failure;
    context.output.done("created", {{"repository", name}});
    return std::nullopt;
}

Outcome remove(Context& context, const std::string& name)
{
    unsigned removed = 0;
    if (Outcome failure =
            context.connection.check(context.connection.session().getRepositoryManager()->removeRepository(
                context.connection.text(name), removed)))
        return failure;
    if (!removed)
        return complaint("no repository '" + name + "'");
    context.output.done("deleted", {{"repository", name}});
    return std::nullopt;
}

}  // namespace

void addRepositoryCommands(CLI::App& app, Action& chosen)
{
    auto* repo = app.add_subcommand("repo", "Repositories");
    repo->require_subcommand(1);
    on(repo->add_subcommand("list", "List repositories"), chosen, list);

    auto name = std::make_shared<std::string>();
    auto description = std::make_shared<std::string>();
    auto* showCommand = repo->add_subcommand("show", "Show a repository");
    showCommand->add_option("NAME", *name, "Repository name")->required();
    on(showCommand, chosen, [name](Context& c) { return show(c, *name); });

    auto* createCommand = repo->add_subcommand("create", "Create a repository");
    createCommand->add_option("NAME", *name, "Repository name")->required();
    createCommand->add_option("--description", *description, "Description");
    on(createCommand, chosen, [name, description](Context& c) { return create(c, *name, *description); });

    auto* deleteCommand = repo->add_subcommand("delete", "Delete a repository and its items");
    deleteCommand->alias("rm");
    deleteCommand->add_option("NAME", *name, "Repository name")->required();
    on(deleteCommand, chosen, [name](Context& c) { return remove(c, *name); });
}

}  // namespace zelctl
