// Sign-in, identity, session properties and how zelctl reports failures.

#include <regex>

#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

const std::regex kErrorLine("error [1-9][0-9]*: [^\n]+\n");

TEST_F(Zelctl, WhoamiShowsIdentityAndRoles)
{
    const nlohmann::json identity = annJson({"whoami"});
    EXPECT_EQ(identity["id"], "ann");
    EXPECT_EQ(identity["authenticated"], true);
    EXPECT_EQ(identity["roles"], nlohmann::json::array({"admin"}));

    const Outcome people = ann({"whoami"});
    EXPECT_EQ(people.status, 0);
    EXPECT_NE(people.out.find("id: ann\n"), std::string::npos) << people.out;
}

TEST_F(Zelctl, PropPrintsTheValueAlone)
{
    const Outcome run = ann({"prop", "SERVER_NAME"});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.out, "zelserverd\n");
    EXPECT_EQ(annJson({"prop", "USER_NAME"}), (nlohmann::json{{"name", "USER_NAME"}, {"value", "ann"}}));
}

TEST_F(Zelctl, PasswordComesFromTheEnvironment)
{
    const Outcome run = raw({"--json", "--user", "bob", "whoami"}, "ZEL_PASSWORD=pw-bob");
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.json()["id"], "bob");
}

TEST_F(Zelctl, ClientIdGoesWithTheHandshake)
{
    const Outcome run = raw({"--json", "--client-id", "zelctl-test", "--user", "ann", "--password", "pw-ann", "whoami"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.json()["id"], "ann");
}

TEST_F(Zelctl, RefusedLoginIsOneErrorLineAndStatusOne)
{
    const Outcome run = as("ann", "wrong", {"whoami"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "");
    EXPECT_TRUE(std::regex_match(run.err, kErrorLine)) << run.err;
    EXPECT_NE(run.err.find("invalid user name or password"), std::string::npos) << run.err;
}

// Failing commands: a status from the server keeps its number; the client's own finding has none.
TEST_F(Zelctl, FailingCommandsReportOneLine)
{
    ASSERT_EQ(ann({"repo", "create", "demo"}).status, 0);
    const Outcome duplicate = ann({"repo", "create", "demo"});
    EXPECT_EQ(duplicate.status, 1);
    EXPECT_TRUE(std::regex_match(duplicate.err, kErrorLine)) << duplicate.err;

    const Outcome forbidden = as("bob", "pw-bob", {"repo", "create", "other"});
    EXPECT_EQ(forbidden.status, 1);
    EXPECT_TRUE(std::regex_match(forbidden.err, kErrorLine)) << forbidden.err;

    const Outcome missing = ann({"repo", "show", "nope"});
    EXPECT_EQ(missing.status, 1);
    EXPECT_EQ(missing.err, "error: no repository 'nope'\n");
    EXPECT_EQ(missing.out, "");
}

TEST_F(Zelctl, UsageErrorsExitTwoWithHelp)
{
    const std::vector<std::vector<std::string>> cases = {
        {},
        {"bogus"},
        {"job", "abort"},
        {"job", "abort", "not-a-number"},
        {"workspace", "list", "demo", "--filter", "some"},
        {"item", "put", "demo", "no-such-file"},
    };
    for (const auto& arguments : cases) {
        const Outcome run = ann(arguments);
        EXPECT_EQ(run.status, 2) << arguments.size();
        EXPECT_NE(run.err.find("Usage"), std::string::npos) << run.err;
    }
}

TEST_F(Zelctl, UnreachableServerIsAnErrorNotACrash)
{
    const Outcome run = raw({"--host", "127.0.0.1", "--port", "1", "--user", "ann", "--password", "pw-ann", "whoami"});
    EXPECT_EQ(run.status, 1);
    EXPECT_TRUE(std::regex_match(run.err, std::regex("error [1-9][0-9]*: [^\n]+\n"))) << run.err;
}

}  // namespace
}  // namespace zeltest
