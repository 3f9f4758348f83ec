// Every command's --json answer against the keys docs/zelctl.md documents for it, in order. The table
// is read from the document itself, so the two cannot drift apart, and a documented command that
// this test does not run fails it too.

#include <map>
#include <regex>

#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

struct Documented {
    std::string command;  // as the first column names it
    std::string part;     // the key of a nested list, or empty for the answer itself
    bool each = false;    // keys of every element of a list
    std::vector<std::string> keys;
};

std::vector<std::string> quotedWords(const std::string& text)
{
    std::vector<std::string> words;
    const std::regex word("`([^`]+)`");
    for (auto it = std::sregex_iterator(text.begin(), text.end(), word); it != std::sregex_iterator(); ++it)
        words.push_back((*it)[1]);
    return words;
}

// The rows "| `command` [part] | [each:] `key`, ... |" of the section "## JSON output".
std::vector<Documented> documentedKeys()
{
    std::ifstream in(ZEL_TEST_ZELCTL_DOC);
    std::vector<Documented> rows;
    bool inSection = false;
    const std::regex row(R"(\| `([^`]+)` ?([a-z_]*) \| (.*) \|)");
    for (std::string line; std::getline(in, line);) {
        if (line.rfind("## ", 0) == 0)
            inSection = line == "## JSON output";
        std::smatch match;
        if (inSection && std::regex_match(line, match, row))
            rows.push_back({match[1], match[2], match[3].str().rfind("each:", 0) == 0, quotedWords(match[3])});
    }
    return rows;
}

std::vector<std::string> keysOf(const nlohmann::ordered_json& object)
{
    std::vector<std::string> keys;
    for (const auto& [key, _] : object.items())
        keys.push_back(key);
    return keys;
}

class JsonSchema : public Zelctl {
protected:
    nlohmann::ordered_json answer(const std::vector<std::string>& arguments)
    {
        std::vector<std::string> line = {"--json"};
        line.insert(line.end(), arguments.begin(), arguments.end());
        const Outcome run = ann(line);
        EXPECT_EQ(run.status, 0) << arguments[0] << " " << arguments[1] << ": " << run.err;
        return nlohmann::ordered_json::parse(run.out, nullptr, false);
    }
};

TEST_F(JsonSchema, EveryCommandAnswersWithTheDocumentedKeys)
{
    std::ofstream(local("roads.zlw")) << "#!/bin/sh\n# @title Roads\n"
                                         "# @parameter MODE | CHOICE | fast | How | SINGLECHOICE_CONFIG | fast%slow\n"
                                         "# @source CSV | roads | /data/roads.csv\n# @featuretype road | A road\n"
                                         "# @destination GPKG | out | out.gpkg\n# @featuretype line\necho done\n";
    std::ofstream(local("a.txt")) << "some text";
    // In order: what a command needs was made by an earlier one.
    std::map<std::string, nlohmann::ordered_json> answers;
    auto run = [&](const std::string& command, const std::vector<std::string>& arguments) {
        return answers[command] = answer(arguments);
    };
    auto jobOf = [](const nlohmann::ordered_json& answer) { return std::to_string(answer.value("job", 0u)); };
    run("ping", {"ping"});
    run("whoami", {"whoami"});
    run("prop", {"prop", "USER_NAME"});
    run("repo create", {"repo", "create", "demo"});
    run("item put", {"item", "put", "demo", local("roads.zlw")});
    run("repo list", {"repo", "list"});
    run("repo show", {"repo", "show", "demo"});
    run("item list", {"item", "list", "demo"});
    run("item get", {"item", "get", "demo", "roads.zlw", "-o", local("back.zlw")});
    run("resource put", {"resource", "put", "demo", "roads.zlw", local("a.txt")});
    run("resource list", {"resource", "list", "demo", "roads.zlw"});
    run("resource get", {"resource", "get", "demo", "roads.zlw", "a.txt", "-o", local("back.txt")});
    run("resource rm", {"resource", "rm", "demo", "roads.zlw", "a.txt"});
    run("workspace list", {"workspace", "list", "demo"});
    run("workspace show", {"workspace", "show", "demo", "roads.zlw"});
    const std::string job = jobOf(run("job submit", {"job", "submit", "zeljob", "demo", "roads.zlw"}));
    run("job wait", {"job", "wait", job});
    run("job result", {"job", "result", job});
    run("job log", {"job", "log", job});
    run("job log -o", {"job", "log", job, "-o", local("job.log")});
    run("job run", {"job", "run", "zeljob", "demo", "roads.zlw"});
    run("job abort",
        {"job", "abort", jobOf(run("job schedule", {"job", "schedule", "3600", "zeljob", "demo", "roads.zlw"}))});
    run("service create", {"service", "create", "svc", "--workspace-registration", "true"});
    run("service update", {"service", "update", "svc", "--description", "changed"});
    run("service register", {"service", "register", "svc", "demo", "roads.zlw"});
    run("service list", {"service", "list"});
    run("service show", {"service", "show", "svc"});
    run("service deregister", {"service", "deregister", "svc", "demo", "roads.zlw"});
    run("service delete", {"service", "delete", "svc"});
    run("token set", {"token", "set", "bob"});
    run("token show", {"token", "show", "bob"});
    run("token expired", {"token", "expired", "bob"});
    run("token rm", {"token", "rm", "bob"});
    run("sr list", {"sr", "list"});
    run("sr mkdir", {"sr", "mkdir", "DATA", "/in"});
    run("sr put", {"sr", "put", "DATA", local("a.txt"), "/in/a.txt"});
    run("sr cp", {"sr", "cp", "DATA", "/in/a.txt", "/in/b.txt"});
    run("sr mv", {"sr", "mv", "DATA", "/in/b.txt", "/c.txt"});
    run("sr ls", {"sr", "ls", "DATA", "/in"});
    run("sr stat", {"sr", "stat", "DATA", "/c.txt"});
    run("sr get", {"sr", "get", "DATA", "/c.txt", "-o", local("c.txt")});
    run("sr rm", {"sr", "rm", "DATA", "/c.txt"});
    run("item rm", {"item", "rm", "demo", "roads.zlw"});
    run("repo delete", {"repo", "delete", "demo"});

    const std::vector<Documented> documented = documentedKeys();
    ASSERT_GT(documented.size(), answers.size()) << "the table of docs/zelctl.md was not found";
    std::map<std::string, int> checked;
    for (const Documented& d : documented) {
        ASSERT_EQ(answers.count(d.command), 1u) << "documented but not run: " << d.command;
        ++checked[d.command];
        const nlohmann::ordered_json& value = d.part.empty() ? answers[d.command] : answers[d.command][d.part];
        if (!d.each) {
            EXPECT_EQ(keysOf(value), d.keys) << d.command << " " << value.dump();
            continue;
        }
        ASSERT_TRUE(value.is_array() && !value.empty()) << d.command << " " << d.part << ": " << value.dump();
        for (const auto& element : value)
            EXPECT_EQ(keysOf(element), d.keys) << d.command << " " << d.part << ": " << element.dump();
    }
    for (const auto& [command, _] : answers)
        EXPECT_EQ(checked.count(command), 1u) << "run but not documented: " << command;
}

}  // namespace
}  // namespace zeltest
