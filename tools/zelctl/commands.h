#pragma once
// The command families. Each adds its subcommands to the application; the one the user chose
// stores its action, which main runs with a signed-in connection.

#include <CLI/CLI.hpp>

#include <functional>
#include <string>

#include "connection.h"
#include "output.h"

namespace zelctl {

struct Context {
    Connection& connection;
    Output& output;
};

using Action = std::function<Outcome(Context&)>;

void addSessionCommands(CLI::App& app, Action& chosen);
void addJobCommands(CLI::App& app, Action& chosen);
void addRepositoryCommands(CLI::App& app, Action& chosen);
void addItemCommands(CLI::App& app, Action& chosen);
void addWorkspaceCommands(CLI::App& app, Action& chosen);
void addServiceCommands(CLI::App& app, Action& chosen);
void addTokenCommands(CLI::App& app, Action& chosen);
void addSharedResourceCommands(CLI::App& app, Action& chosen);

// Makes `action` the one to run when `command` is chosen.
inline void on(CLI::App* command, Action& chosen, Action action)
{
    command->callback([&chosen, action = std::move(action)] { chosen = action; });
}

// The client's own complaint, with no message number.
inline Failure complaint(const std::string& text) { return Failure{0, text}; }

// One row per element of the library's list, as `row` makes it.
template <class List, class Row>
nlohmann::ordered_json rowsOf(List& list, Row row)
{
    nlohmann::ordered_json rows = nlohmann::ordered_json::array();
    for (unsigned i = 0; i < list.entries(); ++i)
        rows.push_back(row(*list.element(i)));
    return rows;
}

// Prints the rows of the list that the call which returned `failure` filled, unless it failed.
template <class List, class Row>
Outcome printRows(Context& context, Outcome failure, List& list, Row row)
{
    if (!failure)
        context.output.print(rowsOf(list, row));
    return failure;
}

}  // namespace zelctl
