// Sign-in, identity, session properties and how zelctl reports failures.

#include <regex>

#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

TEST_F(Zelctl, WhoamiAndPropInJsonAndText)
{
    const nlohmann::json identity = annJson({"whoami"});
    EXPECT_EQ(identity["account"], "ann");
    EXPECT_EQ(identity["authenticated"], true);
    EXPECT_EQ(identity["roles"], nlohmann::json::array({"admin"}));
    const Outcome people = ann({"whoami"});
    EXPECT_EQ(people.status, 0);
    EXPECT_NE(people.out.find("account: ann\n"), std::string::npos) << people.out;

    const Outcome prop = ann({"prop", "SERVER_NAME"});
    EXPECT_EQ(prop.status, 0) << prop.err;
    EXPECT_EQ(prop.out, "zelserverd\n") << "the value alone";
    EXPECT_EQ(annJson({"prop", "USER_NAME"}), (nlohmann::json{{"property", "USER_NAME"}, {"value", "ann"}}));
}

TEST_F(Zelctl, PasswordFromTheEnvironmentAndAClientId)
{
    Outcome run = raw({"--json", "--user", "bob", "whoami"}, "ZEL_PASSWORD=pw-bob");
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.json()["account"], "bob");
    run = raw({"--json", "--client-id", "zelctl-test", "--user", "ann", "--password", "pw-ann", "whoami"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.json()["account"], "ann");
}

// A failure is one line on standard error and status 1: a status from the server keeps its number,
// the client's own finding has none.
TEST_F(Zelctl, FailuresAreOneErrorLineAndStatusOne)
{
    const std::regex numbered("error [1-9][0-9]*: [^\n]+\n");
    ASSERT_EQ(ann({"repo", "create", "demo"}).status, 0);
    const std::vector<Outcome> runs = {
        as("ann", "wrong", {"whoami"}),
        ann({"repo", "create", "demo"}),
        as("bob", "pw-bob", {"repo", "create", "other"}),
        raw({"--host", "127.0.0.1", "--port", "1", "--user", "ann", "--password", "pw-ann", "whoami"}),
    };
    for (const Outcome& run : runs) {
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.out, "");
        EXPECT_TRUE(std::regex_match(run.err, numbered)) << run.err;
    }
    EXPECT_NE(runs[0].err.find("invalid user name or password"), std::string::npos) << runs[0].err;
    const Outcome missing = ann({"repo", "show", "nope"});
    EXPECT_EQ(missing.status, 1);
    EXPECT_EQ(missing.out, "");
    EXPECT_EQ(missing.err, "error: no repository 'nope'\n");
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

}  // namespace
}  // namespace zeltest
