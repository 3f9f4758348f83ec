// service, token and shared resource commands, and signing in with a token set through zelctl.

#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

TEST_F(Zelctl, ServicesAndRegistrations)
{
    ASSERT_EQ(ann({"repo", "create", "demo"}).status, 0);
    ASSERT_EQ(ann({"item", "put", "demo", local("greet.zlw")}).status, 0);
    EXPECT_EQ(annJson({"service", "create", "svc", "--display-name", "Service", "--description", "first",
                       "--workspace-registration", "true"})["done"],
              "created");
    nlohmann::json shown = annJson({"service", "show", "svc"});
    EXPECT_EQ(shown["display_name"], "Service");
    EXPECT_EQ(shown["description"], "first");
    EXPECT_EQ(shown["registered"], nlohmann::json::array());
    EXPECT_EQ(shown["workspace_registration"], true);
    EXPECT_EQ(annJson({"service", "update", "svc", "--description", "second", "--enabled", "false"})["done"],
              "updated");
    shown = annJson({"service", "show", "svc"});
    EXPECT_EQ(shown["description"], "second");
    EXPECT_EQ(shown["display_name"], "Service") << "left alone by the update";
    EXPECT_EQ(shown["enabled"], false);

    auto listed = [&](const char* filter) {
        bool found = false;
        for (const auto& service : annJson({"service", "list", "--filter", filter}))
            found = found || service["service"] == "svc";
        return found;
    };
    EXPECT_TRUE(listed("all"));
    EXPECT_TRUE(listed("disabled"));
    EXPECT_FALSE(listed("enabled"));
    EXPECT_EQ(annJson({"service", "list", "--filter", "disabled"}).size(), 1u);

    EXPECT_EQ(annJson({"service", "register", "svc", "demo", "greet.zlw"})["done"], "registered");
    EXPECT_EQ(annJson({"service", "show", "svc"})["registered"],
              nlohmann::json::parse(R"([{"repository":"demo","item":"greet.zlw"}])"));
    EXPECT_EQ(annJson({"service", "deregister", "svc", "demo", "greet.zlw"})["done"], "deregistered");
    EXPECT_EQ(ann({"service", "deregister", "svc", "demo", "greet.zlw"}).status, 1);
    EXPECT_EQ(annJson({"service", "delete", "svc"})["done"], "deleted");
    const Outcome gone = ann({"service", "show", "svc"});
    EXPECT_EQ(gone.status, 1);
    EXPECT_EQ(gone.err, "error: no service 'svc'\n");
}

TEST_F(Zelctl, TokensAndTokenSignIn)
{
    EXPECT_EQ(annJson({"token", "set", "bob", "secret-token-of-bob", "--expires-after", "3600"})["done"], "added");
    const nlohmann::json token = annJson({"token", "show", "bob"});
    EXPECT_EQ(token["token"], "secret-token-of-bob");
    EXPECT_EQ(token["expires_after"], 3600);
    EXPECT_EQ(annJson({"token", "expired", "bob"})["expired"], false);
    const Outcome signedIn = raw({"--json", "--token", "secret-token-of-bob", "whoami"});
    ASSERT_EQ(signedIn.status, 0) << signedIn.err;
    EXPECT_EQ(signedIn.json()["account"], "bob");

    EXPECT_EQ(annJson({"token", "set", "bob", "another", "--client-address", "localhost"})["done"], "updated");
    EXPECT_EQ(annJson({"token", "show", "bob"})["client_address"], "localhost");
    EXPECT_EQ(annJson({"token", "rm", "bob"})["done"], "removed");
    EXPECT_EQ(ann({"token", "rm", "bob"}).status, 1);
    const Outcome refused = raw({"--token", "another", "whoami"});
    EXPECT_EQ(refused.status, 1);
    EXPECT_EQ(refused.err.rfind("error ", 0), 0u) << refused.err;
}

TEST_F(Zelctl, SharedResourceFiles)
{
    const nlohmann::json areas = annJson({"sr", "list"});
    ASSERT_EQ(areas.size(), 1u);
    EXPECT_EQ(areas[0]["shared_resource"], "DATA");
    std::ofstream(local("a.txt")) << "shared content";
    EXPECT_EQ(annJson({"sr", "mkdir", "DATA", "/in"})["done"], "created");
    const Outcome put = ann({"sr", "put", "DATA", local("a.txt"), "/in/a.txt"});
    EXPECT_EQ(put.status, 0) << put.err;
    EXPECT_EQ(put.err, "") << "no progress bar off a terminal";
    EXPECT_EQ(annJson({"sr", "cp", "DATA", "/in/a.txt", "/in/b.txt"})["done"], "copied");
    EXPECT_EQ(annJson({"sr", "mv", "DATA", "in/b.txt", "/c.txt"})["done"], "moved");
    const nlohmann::json listed = annJson({"sr", "ls", "DATA", "/in"});
    ASSERT_EQ(listed.size(), 1u);
    EXPECT_EQ(listed[0]["name"], "a.txt");
    EXPECT_EQ(listed[0]["size"], 14);
    EXPECT_EQ(listed[0]["type"], "file");
    EXPECT_EQ(annJson({"sr", "stat", "DATA", "/in"})["type"], "dir");
    EXPECT_EQ(annJson({"sr", "ls", "DATA"}).size(), 2u);
    const Outcome got = ann({"sr", "get", "DATA", "/c.txt", "-o", local("back.txt")});
    EXPECT_EQ(got.status, 0) << got.err;
    EXPECT_EQ(got.err, "");
    EXPECT_EQ(readFile(local("back.txt")), "shared content");
    EXPECT_EQ(annJson({"sr", "rm", "DATA", "/c.txt"})["done"], "removed");
    EXPECT_EQ(ann({"sr", "stat", "DATA", "/c.txt"}).status, 1);
    EXPECT_EQ(ann({"sr", "ls", "NOPE"}).err, "error: no shared resource 'NOPE'\n");
}

}  // namespace
}  // namespace zeltest
