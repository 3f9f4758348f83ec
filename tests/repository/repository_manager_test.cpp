// The repository manager on the wire: services (filter, payload with its fixed root), repositories
// (name checks and their one exception, the fixed filter of the list, the payload of addRepository)
// and the global item query.

#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "repository/ZELServerRepository.h"
#include "repository/ZELServerRepositoryManager.h"
#include "repository/ZELServerService.h"
#include "repository/reply_readers.h"
#include "repository_fixture.h"

namespace zel::repotest {
namespace {

class ManagerTest : public RepositoryWireTest {
protected:
    ZELServerRepositoryManager manager{channel.get()};
};

// ---- Services ---------------------------------------------------------------------------------------

TEST_F(ManagerTest, ServiceLookupsAnswerWithTheServersFlagOrFillTheCallersService)
{
    server.exchange(command("REP_SERVICEEXISTS", {{"serviceName", "a/b"}}), success("true"))
        .exchange(command("REP_REMOVE_SERVICE", {{"serviceName", "download"}}), success("true"))
        .exchange(command("REP_GET_SERVICE", {{"serviceName", "download"}}),
                  success(R"(<R><SERVICE service_id="7" name="download" url_pattern="/dl"/></R>)"))
        .exchange(command("REP_GET_SERVICE", {{"serviceName", "nothing"}}), success("<R/>"));
    signIn();
    unsigned exists = 0;
    EXPECT_EQ(StatusPtr(manager.serviceExists(S("a/b"), exists)), nullptr);
    EXPECT_EQ(exists, 1u);
    unsigned removed = 0;
    EXPECT_EQ(StatusPtr(manager.removeService(S("download"), removed)), nullptr);
    EXPECT_EQ(removed, 1u);
    EXPECT_EQ(numberOf(StatusPtr(manager.serviceExists(S(""), exists))), msg::kRequiredValueMissing);
    EXPECT_EQ(exists, 0u);
    ZELServerService service(channel.get());
    unsigned found = 0;
    EXPECT_EQ(StatusPtr(manager.getService(S("download"), service, found)), nullptr);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(service.serviceId(), "7");
    EXPECT_EQ(StatusPtr(manager.getService(S("nothing"), service, found)), nullptr);
    EXPECT_EQ(found, 0u);
    EXPECT_TRUE(server.verify());
}

TEST_F(ManagerTest, ServicesFilterIsExactAndRequiredAndListedServicesUseTheSameChannel)
{
    const std::vector<std::pair<std::optional<std::string>, std::string>> sent = {
        {std::nullopt, "All"}, {"ALL", "All"}, {"ENABLED", "Enabled"}, {"DISABLED", "Disabled"}};
    for (const auto& [filter, value] : sent) {
        server.exchange(command("REP_GET_SERVICES", {{"enableFilter", value}}),
                        success(R"(<R><SERVICE name="download"/><SERVICE name="s2"/></R>)"));
    }
    server.exchange(command("REP_ITEMREGISTERED",
                            {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "a.zlw"}}),
                    success("true"));
    signIn();
    ZELServerVector<IZELServerService, ZELServerService> services;
    for (const auto& [filter, value] : sent) {
        ZELServerStringDict directives;
        if (filter) {
            directives.insert("ENABLE_FILTER", *filter);
        }
        EXPECT_EQ(StatusPtr(manager.getServices(filter ? &directives : nullptr, services)), nullptr) << value;
        EXPECT_EQ(services.entries(), 2u);
    }
    ZELServerStringDict lowerCase;
    lowerCase.insert("ENABLE_FILTER", "enabled");
    EXPECT_EQ(numberOf(StatusPtr(manager.getServices(&lowerCase, services))), msg::kRequiredValueMissing);
    ZELServerStringDict missing;
    EXPECT_EQ(numberOf(StatusPtr(manager.getServices(&missing, services))), msg::kRequiredValueMissing);
    ASSERT_EQ(services.entries(), 2u) << "a refusal leaves the list alone";
    unsigned registered = 0;
    EXPECT_EQ(StatusPtr(services.element(0)->itemRegistered(S("Samples"), S("a.zlw"), registered)), nullptr);
    EXPECT_EQ(registered, 1u);
    EXPECT_TRUE(server.verify());
}

TEST_F(ManagerTest, AddAndUpdateSendTheServiceUnderTheAddRoot)
{
    // The XML library writes attributes in name order, whatever order they were set in.
    const std::string added = xmlDocument(
        "REP_ADD_SERVICE",
        R"(<SERVICE description="Serves &amp; stores" display_name="Data Download" is_customformat_reg_allowed="false" )"
        R"(is_customtransform_reg_allowed="false" is_enabled="true" is_template_reg_allowed="true" )"
        R"(is_workspace_reg_allowed="true" name="download" service_id="-1" url_pattern="/dl/{ws}"/>)");
    const std::string updated =
        xmlDocument("REP_ADD_SERVICE",
                    R"(<SERVICE description="" display_name="" is_customformat_reg_allowed="true" )"
                    R"(is_customtransform_reg_allowed="false" is_enabled="false" is_template_reg_allowed="false" )"
                    R"(is_workspace_reg_allowed="false" name="download" service_id="7" url_pattern=""/>)");
    server.exchange(command("REP_ADD_SERVICE", {{"serviceObject", added}}), success("true"))
        .exchange(command("REP_UPDATE_SERVICE", {{"serviceObject", updated}}), success("true"));
    signIn();
    ZELServerService fresh(channel.get(), "download", "Data Download", "Serves & stores", "/dl/{ws}", true, true, false,
                           false, true);
    EXPECT_EQ(StatusPtr(manager.addService(fresh)), nullptr);

    ZELServerService stored(channel.get());
    ASSERT_EQ(readServiceReply(R"(<SERVICE service_id="7" name="download" is_customformat_reg_allowed="true"/>)",
                               channel.get(), stored),
              0);
    EXPECT_EQ(StatusPtr(manager.updateService(stored)), nullptr);
    EXPECT_TRUE(server.verify());
}

// ---- Repositories -----------------------------------------------------------------------------------

TEST_F(ManagerTest, RepositoryExistsChecksOnlyEmptinessWhileAddAndRemoveCheckCharactersToo)
{
    server.exchange(command("REP_REPOSITORYEXISTS", {{"repositoryName", "a/b"}}), success("false"))
        .exchange(command("REP_ADD_REPOSITORY",
                          {{"repositoryObject",
                            xmlDocument("REP_ADD_REPOSITORY",
                                        R"(<REPOSITORY description="Roads &lt;2024>" name="Samples"/>)")}}),
                  success("true"))
        .exchange(command("REP_REMOVE_REPOSITORY", {{"repositoryName", "Samples"}}), success("true"));
    signIn();
    unsigned flag = 7;
    EXPECT_EQ(StatusPtr(manager.repositoryExists(S("a/b"), flag)), nullptr);
    EXPECT_EQ(flag, 0u);
    ZELServerRepository repository(channel.get());
    for (const char forbidden : std::string("\\/:*?\"<>|&='+%")) {
        const std::string name = std::string("a") + forbidden;
        EXPECT_EQ(numberOf(StatusPtr(manager.getRepository(S(name), repository, flag))), msg::kForbiddenCharacter)
            << name;
        EXPECT_EQ(numberOf(StatusPtr(manager.addRepository(S(name), S("d")))), msg::kForbiddenCharacter) << name;
        EXPECT_EQ(numberOf(StatusPtr(manager.removeRepository(S(name), flag))), msg::kForbiddenCharacter) << name;
    }
    EXPECT_EQ(numberOf(StatusPtr(manager.repositoryExists(S(""), flag))), msg::kRequiredValueMissing);
    EXPECT_EQ(numberOf(StatusPtr(manager.getRepository(S(""), repository, flag))), msg::kRequiredValueMissing);
    EXPECT_EQ(numberOf(StatusPtr(manager.addRepository(S(""), S("d")))), msg::kRequiredValueMissing);
    EXPECT_EQ(numberOf(StatusPtr(manager.removeRepository(S(""), flag))), msg::kRequiredValueMissing);
    EXPECT_EQ(StatusPtr(manager.addRepository(S("Samples"), S("Roads <2024>"))), nullptr);
    EXPECT_EQ(StatusPtr(manager.removeRepository(S("Samples"), flag)), nullptr);
    EXPECT_EQ(flag, 1u);
    EXPECT_TRUE(server.verify());
}

TEST_F(ManagerTest, RepositoryListAlwaysAsksForAllAndRefusesDirectives)
{
    server
        .exchange(command("REP_GET_REPOSITORIES", {{"enableFilter", "All"}}),
                  success(R"(<R><REPOSITORY name="Samples" description="d1"/><X><REPOSITORY name="Other"/></X></R>)"))
        .exchange(command("REP_ITEMEXISTS", {{"repositoryName", "Other"}, {"itemName", "a.zlw"}}), success("true"));
    signIn();
    ZELServerVector<IZELServerRepository, ZELServerRepository> repositories;
    ZELServerStringDict directives;
    EXPECT_EQ(numberOf(StatusPtr(manager.getRepositories(&directives, repositories))), msg::kRequiredValueMissing);
    EXPECT_EQ(StatusPtr(manager.getRepositories(nullptr, repositories)), nullptr);
    ASSERT_EQ(repositories.entries(), 2u);
    ZELServerString text;
    repositories.element(0)->getDescription(text);
    EXPECT_EQ(text.str(), "d1");
    // Repositories read from a list work on the manager's connection.
    unsigned exists = 0;
    EXPECT_EQ(StatusPtr(repositories.element(1)->itemExists(S("a.zlw"), exists)), nullptr);
    EXPECT_EQ(exists, 1u);
    EXPECT_TRUE(server.verify());
}

TEST_F(ManagerTest, UnknownRepositoryIsSuccessWithFoundAtZero)
{
    server
        .exchange(command("REP_GET_REPOSITORY", {{"repositoryName", "Samples"}}),
                  success(R"(<R><REPOSITORY name="Samples" description="sample workspaces"/></R>)"))
        .exchange(command("REP_GET_REPOSITORY", {{"repositoryName", "Nothing"}}), success("<R/>"))
        .exchange(command("REP_ITEMEXISTS", {{"repositoryName", "Samples"}, {"itemName", "x.zlw"}}), success("false"));
    signIn();
    ZELServerRepository repository(nullptr);
    unsigned found = 0;
    EXPECT_EQ(StatusPtr(manager.getRepository(S("Samples"), repository, found)), nullptr);
    EXPECT_EQ(found, 1u);
    ZELServerString text;
    repository.getDescription(text);
    EXPECT_EQ(text.str(), "sample workspaces");
    EXPECT_EQ(StatusPtr(manager.getRepository(S("Nothing"), repository, found)), nullptr);
    EXPECT_EQ(found, 0u);
    // The repository made without a channel now works on the reply's.
    unsigned exists = 7;
    EXPECT_EQ(StatusPtr(repository.itemExists(S("x.zlw"), exists)), nullptr);
    EXPECT_EQ(exists, 0u);
    EXPECT_TRUE(server.verify());
}

// ---- Global query -----------------------------------------------------------------------------------

TEST_F(ManagerTest, GlobalQueryRunsOnlyForExactlyAllItemsAndPassesFailuresOn)
{
    server
        .exchange(command("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}),
                  success(R"(<R><REPOSITORY name="Samples"><PROPERTY category="Samples" name="roads.zlw" value="1">)"
                          R"(<ATTRIBUTE name="type" value="workspace"/></PROPERTY></REPOSITORY>)"
                          R"(<PROPERTY category="Other" name="t.zlwt" value="4"/></R>)"))
        .exchange(command("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}), success("not xml"))
        .exchange(command("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}), zeltest::reply("ERROR", "busy"));
    signIn();
    ZELServerPropertyAccessor items;
    EXPECT_EQ(StatusPtr(manager.getGlobalItems(nullptr, items)), nullptr);
    ZELServerStringDict lowerCase;
    lowerCase.insert("GLOBAL", "allitems");
    EXPECT_EQ(StatusPtr(manager.getGlobalItems(&lowerCase, items)), nullptr);
    ZELServerStringArray categories;
    items.getCategoryNames(categories);
    EXPECT_EQ(categories.entries(), 0u);

    ZELServerStringDict all;
    all.insert("GLOBAL", "ALLITEMS");
    EXPECT_EQ(StatusPtr(manager.getGlobalItems(&all, items)), nullptr);
    items.getCategoryNames(categories);
    EXPECT_EQ(categories.items(), (std::vector<std::string>{"Other", "Samples"}));
    ZELServerString type;
    ASSERT_NE(items.getProperty(S("Samples"), S("roads.zlw")), nullptr);
    EXPECT_TRUE(items.getProperty(S("Samples"), S("roads.zlw"))->getAttribute(S("type"), type));
    EXPECT_EQ(type.str(), "workspace");
    EXPECT_EQ(numberOf(StatusPtr(manager.getGlobalItems(&all, items))), msg::kXmlFailure);
    EXPECT_EQ(numberOf(StatusPtr(manager.getGlobalItems(&all, items))), msg::kServerError);
    EXPECT_TRUE(server.verify());
}

}  // namespace
}  // namespace zel::repotest
