// zelctl: the command line of the client library.

#include <exception>
#include <iostream>

#include "commands.h"

namespace {

using namespace zelctl;

int fail(const Failure& failure)
{
    if (failure.text.empty())
        return failure.exit;
    if (failure.number != 0)
        std::cerr << "error " << failure.number << ": " << failure.text << '\n';
    else
        std::cerr << "error: " << failure.text << '\n';
    return failure.exit;
}

// Flags win over the environment; a global flag may stand anywhere on the line, after the command too.
void addGlobalOptions(CLI::App& app, GlobalOptions& options)
{
    app.fallthrough();
    app.set_version_flag("--version", "zelctl " ZEL_VERSION " (zelserverapi " ZEL_VERSION ")");
    app.add_option("--host", options.host, "Server host")
        ->envname("ZEL_HOST")
        ->capture_default_str()
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeLast);
    app.add_option("--port", options.port, "Server port")
        ->envname("ZEL_PORT")
        ->capture_default_str()
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeLast);
    app.add_option("--user", options.user, "User name")->envname("ZEL_USER");
    app.add_option("--password", options.password, "Password (better: the environment variable)")
        ->envname("ZEL_PASSWORD");
    app.add_option("--token", options.token, "Sign in with this user token instead")->envname("ZEL_TOKEN");
    app.add_option("--client-id", options.clientId, "Client ID sent with the handshake");
    app.add_option("--timeout", options.timeout,
                   "Seconds allowed for connecting and for each exchange (exit status 5 when they run out)");
    app.add_flag("--json", options.json, "Machine-readable output on standard output");
    app.add_flag("--quiet", options.quiet, "No progress and no confirmations");
}

int run(int argc, char** argv)
{
    CLI::App app{"Command line of the job-processing server client", "zelctl"};
    app.require_subcommand(1);
    app.failure_message(CLI::FailureMessage::help);
    GlobalOptions options;
    addGlobalOptions(app, options);

    Action chosen;
    addSessionCommands(app, chosen);
    addJobCommands(app, chosen);
    addRepositoryCommands(app, chosen);
    addItemCommands(app, chosen);
    addWorkspaceCommands(app, chosen);
    addServiceCommands(app, chosen);
    addTokenCommands(app, chosen);
    addSharedResourceCommands(app, chosen);

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        // --help and --version end here too, with status 0.
        return app.exit(error) == 0 ? kExitSuccess : kExitUsage;
    }
    if (!chosen)
        return kExitUsage;

    Connection connection(options);
    if (Outcome failure = app.got_subcommand("ping") ? connection.reach() : connection.open())
        return fail(*failure);
    Output output(std::cout, options.json, options.quiet);
    Context context{connection, output};
    if (Outcome failure = chosen(context))
        return fail(*failure);
    return kExitSuccess;
}

}  // namespace

int main(int argc, char** argv)
{
    try {
        return run(argc, argv);
    } catch (const std::exception& error) {
        std::cerr << "error: " << error.what() << '\n';
    } catch (...) {
        std::cerr << "error: unexpected failure\n";
    }
    return kExitError;
}
