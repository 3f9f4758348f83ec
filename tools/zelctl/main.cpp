// zelctl: the command line of the client library.

#include <cstdlib>
#include <exception>
#include <iostream>

#include "commands.h"

namespace {

using namespace zelctl;

int fail(const Failure& failure)
{
    if (failure.number != 0)
        std::cerr << "error " << failure.number << ": " << failure.text << '\n';
    else
        std::cerr << "error: " << failure.text << '\n';
    return 1;
}

int run(int argc, char** argv)
{
    CLI::App app{"Command line of the job-processing server client", "zelctl"};
    app.require_subcommand(1);
    app.failure_message(CLI::FailureMessage::help);
    GlobalOptions options;
    if (const char* password = std::getenv("ZEL_PASSWORD"))
        options.password = password;
    app.add_option("--host", options.host, "Server host")
        ->capture_default_str()
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeLast);
    app.add_option("--port", options.port, "Server port")
        ->capture_default_str()
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeLast);
    app.add_option("--user", options.user, "User name");
    app.add_option("--password", options.password, "Password (better: the environment variable ZEL_PASSWORD)");
    app.add_option("--token", options.token, "Sign in with this user token");
    app.add_option("--client-id", options.clientId, "Client ID sent with the handshake");
    app.add_flag("--json", options.json, "Machine-readable output on standard output");
    app.add_flag("--quiet", options.quiet, "No progress and no confirmations");

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
        const int code = app.exit(error);
        return code == 0 ? 0 : 2;
    }
    if (!chosen)
        return 2;

    Connection connection(options);
    if (Outcome failure = connection.open())
        return fail(*failure);
    Output output(std::cout, options.json, options.quiet);
    Context context{connection, output};
    if (Outcome failure = chosen(context))
        return fail(*failure);
    return 0;
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
    return 1;
}
