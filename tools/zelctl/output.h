#pragma once
// Everything zelctl prints on standard output goes through here: the value a command produced,
// as JSON with --json, as tables and "name: value" lines for people otherwise. Keys are snake_case
// and name one concept each across all commands (docs/zelctl.md lists them).

#include <nlohmann/json.hpp>

#include <iosfwd>
#include <string>

namespace zelctl {

class Output {
public:
    Output(std::ostream& out, bool json, bool quiet) : out_(out), json_(json), quiet_(quiet) {}

    // Data a command was asked for: always printed.
    void print(const nlohmann::ordered_json& value);
    // The confirmation of a change, one shape for every command: {"done": VERB, what it was done to...}.
    // Printed as data with --json, left out with --quiet.
    void done(const char* verb, const nlohmann::ordered_json& subject);

    bool json() const { return json_; }
    bool quiet() const { return quiet_; }

private:
    void human(const nlohmann::ordered_json& value, const std::string& indent);
    void table(const nlohmann::ordered_json& rows, const std::string& indent);

    std::ostream& out_;
    bool json_;
    bool quiet_;
};

// A scalar as a person reads it; arrays of scalars joined with ", ".
std::string plain(const nlohmann::ordered_json& value);

}  // namespace zelctl
