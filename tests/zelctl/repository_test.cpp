// repo, item, resource and workspace commands against a real repository.

#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

class Repositories : public Zelctl {
protected:
    void SetUp() override
    {
        Zelctl::SetUp();
        ASSERT_EQ(ann({"repo", "create", "demo", "--description", "Demo items"}).status, 0);
        ASSERT_EQ(ann({"item", "put", "demo", local("greet.zlw")}).status, 0);
    }
};

TEST_F(Repositories, RepositoriesAreListedShownAndDeleted)
{
    EXPECT_EQ(annJson({"repo", "list"}),
              nlohmann::json::parse(R"([{"repository":"demo","description":"Demo items"}])"));
    EXPECT_EQ(annJson({"repo", "show", "demo"})["description"], "Demo items");
    EXPECT_EQ(ann({"repo", "list"}).out, "REPOSITORY  DESCRIPTION\ndemo        Demo items\n");
    EXPECT_EQ(annJson({"repo", "delete", "demo"})["done"], "deleted");
    EXPECT_EQ(annJson({"repo", "list"}), nlohmann::json::array());
    EXPECT_EQ(ann({"repo", "delete", "demo"}).status, 1);
}

// Downloads write files and nothing to standard error: no progress bar off a terminal.
TEST_F(Repositories, ItemsAndTheirResourcesGoInAndOut)
{
    const nlohmann::json items = annJson({"item", "list", "demo"});
    ASSERT_EQ(items.size(), 1u);
    EXPECT_EQ(items[0]["item"], "greet.zlw");
    EXPECT_EQ(items[0]["type"], "workspace");
    EXPECT_EQ(items[0]["title"], "Greeter");
    EXPECT_EQ(ann({"item", "put", "demo", local("greet.zlw")}).status, 1) << "a second upload needs --update";
    EXPECT_EQ(annJson({"item", "put", "demo", local("greet.zlw"), "--update"})["done"], "updated");
    EXPECT_EQ(annJson({"item", "put", "demo", local("greet.zlw"), "--name", "copy.zlw"})["item"], "copy.zlw");
    const Outcome got = ann({"--quiet", "item", "get", "demo", "copy.zlw", "-o", local("back.zlw")});
    EXPECT_EQ(got.status, 0) << got.err;
    EXPECT_EQ(got.out + got.err, "");
    EXPECT_EQ(readFile(local("back.zlw")), kGreeter);
    EXPECT_EQ(annJson({"item", "rm", "demo", "copy.zlw"})["done"], "removed");
    EXPECT_EQ(annJson({"item", "list", "demo"}).size(), 1u);
    EXPECT_EQ(ann({"item", "rm", "demo", "copy.zlw"}).status, 1);

    std::ofstream(local("lookup.csv")) << "a,b\n1,2\n";
    EXPECT_EQ(annJson({"resource", "put", "demo", "greet.zlw", local("lookup.csv")})["resource"], "lookup.csv");
    const nlohmann::json list = annJson({"resource", "list", "demo", "greet.zlw"});
    ASSERT_EQ(list.size(), 1u);
    EXPECT_EQ(list[0]["resource"], "lookup.csv");
    EXPECT_EQ(list[0]["size"], 8);
    const Outcome resource = ann({"resource", "get", "demo", "greet.zlw", "lookup.csv", "-o", local("back.csv")});
    EXPECT_EQ(resource.status, 0) << resource.err;
    EXPECT_EQ(resource.err, "");
    EXPECT_EQ(readFile(local("back.csv")), "a,b\n1,2\n");
    EXPECT_EQ(annJson({"resource", "rm", "demo", "greet.zlw", "lookup.csv"})["done"], "removed");
    EXPECT_EQ(annJson({"resource", "list", "demo", "greet.zlw"}), nlohmann::json::array());
}

TEST_F(Repositories, WorkspacesWithTheirParameters)
{
    const nlohmann::json all = annJson({"workspace", "list", "demo", "--filter", "all"});
    ASSERT_EQ(all.size(), 1u);
    EXPECT_EQ(all[0]["enabled"], true);
    EXPECT_EQ(annJson({"workspace", "list", "demo", "--filter", "disabled"}), nlohmann::json::array());
    EXPECT_EQ(annJson({"workspace", "list", "demo", "--filter", "enabled"}).size(), 1u);
    const nlohmann::json shown = annJson({"workspace", "show", "demo", "greet.zlw"});
    EXPECT_EQ(shown["title"], "Greeter");
    ASSERT_EQ(shown["parameters"].size(), 1u);
    EXPECT_EQ(shown["parameters"][0]["name"], "WHO");
    EXPECT_EQ(shown["parameters"][0]["type"], "TEXT");
    EXPECT_EQ(shown["parameters"][0]["default"], "nobody");
    EXPECT_EQ(ann({"workspace", "show", "demo", "missing.zlw"}).status, 1);
}

}  // namespace
}  // namespace zeltest
