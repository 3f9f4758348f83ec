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

// Whether `actual` holds what `expected` names: the keys of an object (more are fine), every element
// of a list of the same length, any other value as it is. Turning `actual` into `expected` then
// takes nothing but removing keys of objects.
bool holds(const nlohmann::ordered_json& actual, const nlohmann::json& expected)
{
    const nlohmann::json whole = actual;
    for (const auto& step : nlohmann::json::diff(whole, expected)) {
        const nlohmann::json::json_pointer at(step["path"].get<std::string>());
        if (step["op"] != "remove" || !whole[at.parent_pointer()].is_object())
            return false;
    }
    return true;
}

class JsonSchema : public Zelctl {
protected:
    // Runs a command with --json as ann; its answer must hold `expected` (JSON text, if any).
    nlohmann::ordered_json& run(const std::string& command, std::vector<std::string> arguments,
                                const char* expected = nullptr)
    {
        arguments.insert(arguments.begin(), "--json");
        const Outcome outcome = ann(arguments);
        EXPECT_EQ(outcome.status, 0) << command << ": " << outcome.err;
        nlohmann::ordered_json& answer = answers[command] = nlohmann::ordered_json::parse(outcome.out, nullptr, false);
        // Nothing on standard error (no progress bar off a terminal) but the ID of a job run.
        const std::string id = command == "job run" ? std::to_string(answer.value("job", 0u)) : "";
        EXPECT_EQ(outcome.err, id.empty() ? "" : "job " + id + " submitted\n") << command;
        EXPECT_TRUE(!expected || holds(answer, nlohmann::json::parse(expected))) << command << ": " << answer.dump();
        return answer;
    }

    std::map<std::string, nlohmann::ordered_json> answers;
};

// In order: what a command needs was made by an earlier one.
TEST_F(JsonSchema, EveryCommandAnswersWithTheDocumentedKeysAndTheServersValues)
{
    std::ofstream(local("roads.zlw"))
        << "#!/bin/sh\n# @title Roads\n"
           "# @parameter MODE | CHOICE | fast | How | SINGLECHOICE_CONFIG | fast%slow\n"
           "# @source CSV | roads | /data/roads.csv\n# @featuretype road | A road\n"
           "# @destination GPKG | out | out.gpkg\n# @featuretype line\necho \"Hello $MODE\"\n";
    std::ofstream(local("a.txt")) << "some text";
    auto jobOf = [](const nlohmann::ordered_json& answer) { return std::to_string(answer.value("job", 0u)); };
    run("ping", {"ping"}, (R"({"host":"127.0.0.1","up":true,"port":)" + std::to_string(server->port()) + "}").c_str());
    run("whoami", {"whoami"}, R"({"account":"ann","authenticated":true,"roles":["admin"]})");
    run("prop", {"prop", "USER_NAME"}, R"({"property":"USER_NAME","value":"ann"})");
    run("repo create", {"repo", "create", "demo", "--description", "Demo items"}, R"({"done":"created"})");
    run("item put", {"item", "put", "demo", local("roads.zlw")}, R"({"done":"added","item":"roads.zlw"})");
    run("repo list", {"repo", "list"}, R"([{"repository":"demo","description":"Demo items"}])");
    run("repo show", {"repo", "show", "demo"}, R"({"repository":"demo","description":"Demo items"})");
    run("item list", {"item", "list", "demo"}, R"([{"item":"roads.zlw","type":"workspace","title":"Roads"}])");
    run("item get", {"item", "get", "demo", "roads.zlw", "-o", local("back.zlw")}, R"({"done":"downloaded"})");
    run("resource put", {"resource", "put", "demo", "roads.zlw", local("a.txt")}, R"({"resource":"a.txt"})");
    run("resource list", {"resource", "list", "demo", "roads.zlw"}, R"([{"resource":"a.txt","size":9}])");
    run("resource get", {"resource", "get", "demo", "roads.zlw", "a.txt", "-o", local("back.txt")},
        R"({"done":"downloaded"})");
    run("resource rm", {"resource", "rm", "demo", "roads.zlw", "a.txt"}, R"({"done":"removed"})");
    run("workspace list", {"workspace", "list", "demo", "--filter", "enabled"}, R"([{"enabled":true}])");
    run("workspace show", {"workspace", "show", "demo", "roads.zlw"},
        R"({"title":"Roads","parameters":[{"name":"MODE","type":"CHOICE","default":"fast","choices":["fast","slow"]}]})");
    const std::string job = jobOf(
        run("job submit", {"job", "submit", "zeljob", "demo", "roads.zlw", "-p", "MODE=slow", "-d", "PRIORITY=50"}));
    run("job wait", {"job", "wait", job}, R"({"status":"SUCCESS","success":true})");
    run("job result", {"job", "result", job}, R"({"status":"SUCCESS"})");
    EXPECT_NE(run("job log", {"job", "log", job})["log"].get<std::string>().find("Hello slow"), std::string::npos);
    run("job log -o", {"job", "log", job, "-o", local("job.log")}, R"({"done":"downloaded"})");
    run("job run", {"job", "run", "zeljob", "demo", "roads.zlw"}, R"({"status":"SUCCESS","success":true})");
    const std::string later = jobOf(run("job schedule", {"job", "schedule", "3600", "zeljob", "demo", "roads.zlw"}));
    run("job abort", {"job", "abort", later}, R"({"done":"aborted"})");
    run("service create", {"service", "create", "svc", "--display-name", "Service", "--workspace-registration", "true"},
        R"({"done":"created"})");
    run("service update", {"service", "update", "svc", "--description", "changed", "--enabled", "false"},
        R"({"done":"updated"})");
    run("service register", {"service", "register", "svc", "demo", "roads.zlw"}, R"({"done":"registered"})");
    run("service list", {"service", "list", "--filter", "disabled"}, R"([{"service":"svc"}])");
    run("service show", {"service", "show", "svc"},
        R"({"display_name":"Service","description":"changed","enabled":false,"workspace_registration":true,)"
        R"("registered":[{"repository":"demo","item":"roads.zlw"}]})");
    run("service deregister", {"service", "deregister", "svc", "demo", "roads.zlw"}, R"({"done":"deregistered"})");
    run("service delete", {"service", "delete", "svc"}, R"({"done":"deleted"})");
    run("token set", {"token", "set", "bob", "token-of-bob", "--expires-after", "3600"}, R"({"done":"added"})");
    run("token show", {"token", "show", "bob"}, R"({"token":"token-of-bob","expires_after":3600})");
    run("token expired", {"token", "expired", "bob"}, R"({"expired":false})");
    run("token rm", {"token", "rm", "bob"}, R"({"done":"removed"})");
    run("sr list", {"sr", "list"}, R"([{"shared_resource":"DATA"}])");
    run("sr mkdir", {"sr", "mkdir", "DATA", "/in"}, R"({"done":"created"})");
    run("sr put", {"sr", "put", "DATA", local("a.txt"), "/in/a.txt"}, R"({"done":"uploaded"})");
    run("sr cp", {"sr", "cp", "DATA", "/in/a.txt", "/in/b.txt"}, R"({"done":"copied"})");
    run("sr mv", {"sr", "mv", "DATA", "in/b.txt", "/c.txt"}, R"({"done":"moved"})");
    run("sr ls", {"sr", "ls", "DATA", "/in"}, R"([{"name":"a.txt","type":"file","size":9}])");
    run("sr stat", {"sr", "stat", "DATA", "/in"}, R"({"type":"dir"})");
    run("sr get", {"sr", "get", "DATA", "/c.txt", "-o", local("c.txt")}, R"({"done":"downloaded"})");
    run("sr rm", {"sr", "rm", "DATA", "/c.txt"}, R"({"done":"removed"})");
    run("item rm", {"item", "rm", "demo", "roads.zlw"}, R"({"done":"removed"})");
    run("repo delete", {"repo", "delete", "demo"}, R"({"done":"deleted"})");
    for (const auto& [file, content] : {std::pair{"back.txt", "some text"}, {"c.txt", "some text"}})
        EXPECT_EQ(slurp(local(file)), content) << file;
    EXPECT_EQ(slurp(local("back.zlw")), slurp(local("roads.zlw")));

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
