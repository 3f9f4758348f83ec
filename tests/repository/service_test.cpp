// Services on the wire and off it: the registration flags per item type, the local refusal of
// registerItem, the item commands, the registered-items query, and the four property-accessor
// updates with their documents named after the command.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "repository/ZELServerService.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/reply_readers.h"
#include "repository/repository_objects.h"
#include "repository_fixture.h"

namespace zel::repotest {
namespace {

std::vector<unsigned> flagsOf(const IZELServerService& service)
{
    return {service.isRegistrationAllowed(1), service.isRegistrationAllowed(2), service.isRegistrationAllowed(3),
            service.isRegistrationAllowed(4)};
}

// ---- Settings and flags -----------------------------------------------------------------------------

TEST(ServiceSettings, FreshServiceIsUnsavedAndFlagsApplyPerItemTypeOnly)
{
    ZELServerService service(nullptr, "download", "Data Download", "Serves files", "/svc/{name}", false, false, false,
                             false, false);
    EXPECT_EQ(service.serviceId(), "-1");
    EXPECT_EQ(service.isEnabled(), 0u);
    EXPECT_EQ(flagsOf(service), (std::vector<unsigned>{0, 0, 0, 0}));
    ZELServerString text;
    service.getUrlPattern(text);
    EXPECT_EQ(text.str(), "/svc/{name}");

    service.setRegistrationAllowed(3, 1);
    service.setRegistrationAllowed(5, 1);
    service.setRegistrationAllowed(0, 1);
    EXPECT_EQ(flagsOf(service), (std::vector<unsigned>{0, 0, 1, 0}));
    service.setWorkspaceRegistrationAllowed(9);
    EXPECT_EQ(flagsOf(service), (std::vector<unsigned>{1, 0, 1, 0}));
    EXPECT_EQ(service.isRegistrationAllowed(0), 0u);
    EXPECT_EQ(service.isRegistrationAllowed(5), 0u);
    service.setRegistrationAllowed(1, 0);
    EXPECT_EQ(service.isWorkspaceRegistrationAllowed(), 0u);
}

TEST(ServiceSettings, ReadsTheTenAttributesAndItsProperties)
{
    const std::string body =
        R"(<R><SERVICE service_id="42" name="download" display_name="Data Download" description="Serves files" )"
        R"(url_pattern="/dl/{ws}" is_enabled="true" is_workspace_reg_allowed="true" is_customformat_reg_allowed="false" )"
        R"(is_customtransform_reg_allowed="1" is_template_reg_allowed="yes">)"
        R"(<PROPERTY category="limits" name="max_size" value="100"/></SERVICE></R>)";
    ZELServerService service(nullptr);
    ASSERT_EQ(readServiceReply(body, nullptr, service), 0);
    EXPECT_EQ(service.serviceId(), "42");
    ZELServerString text;
    service.getDisplayName(text);
    EXPECT_EQ(text.str(), "Data Download");
    service.getDescription(text);
    EXPECT_EQ(text.str(), "Serves files");
    EXPECT_EQ(service.isEnabled(), 1u);
    EXPECT_EQ(flagsOf(service), (std::vector<unsigned>{1, 0, 1, 1}));
    ZELServerString value;
    EXPECT_TRUE(service.getPropertyAccessor().getPropertyValue(S("limits"), S("max_size"), value));
    EXPECT_EQ(value.str(), "100");
}

// ---- Commands ---------------------------------------------------------------------------------------

class ServiceTest : public RepositoryWireTest {
protected:
    // The accessor document of an update command holding the one property the tests set.
    static std::string propertiesDocument(const std::string& keyword)
    {
        return xmlDocument(keyword, R"(<PROPERTY category="run" name="priority" value="high"/>)");
    }

    ZELServerService service{channel.get(), "download", "Data Download", "", "", false, false, false, false, false};
};

TEST_F(ServiceTest, RegisterItemRefusesKindsTheServiceDoesNotTakeWithoutSending)
{
    service.setWorkspaceRegistrationAllowed(1);
    server.exchange(command("REP_REGISTERITEM",
                            {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "roads.zlw"}}),
                    success("true"));
    signIn();
    for (const char* refused : {"clean.zlx", "report.zlwt", "ROADS.ZLW"}) {
        EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S(refused)))), msg::kRegistrationRefused)
            << refused;
    }
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("")))), msg::kRequiredValueMissing);
    EXPECT_EQ(StatusPtr(service.registerItem(S("Samples"), S("roads.zlw"))), nullptr);
    // A name without a known ending is refused even by a service that takes every kind.
    for (unsigned type = 1; type <= 4; ++type) {
        service.setRegistrationAllowed(type, 1);
    }
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("notes.txt")))), msg::kRegistrationRefused);
    EXPECT_TRUE(server.verify());
}

TEST_F(ServiceTest, ItemCommandsAnswerWithTheServersFlagAndListRegisteredItems)
{
    server
        .exchange(command("REP_ITEMREGISTERED",
                          {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "a.zlw"}}),
                  success("true"))
        .exchange(command("REP_DEREGISTERITEM",
                          {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "a.zlw"}}),
                  success("false"))
        .exchange(command("REP_GET_REGISTEREDITEMS", {{"serviceName", "download"}}),
                  success(R"(<R><ITEM name="a.zlw" repository_name="Samples"/><ITEM name="b.zlwt"/></R>)"))
        .exchange(command("REP_GET_REGISTEREDITEMS", {{"serviceName", "download"}, {"itemType", "4"}}),
                  success(R"(<R><ITEM name="b.zlwt"/></R>)"));
    signIn();
    unsigned registered = 0;
    EXPECT_EQ(StatusPtr(service.itemRegistered(S("Samples"), S("a.zlw"), registered)), nullptr);
    EXPECT_EQ(registered, 1u);
    unsigned deregistered = 7;
    EXPECT_EQ(StatusPtr(service.deregisterItem(S("Samples"), S("a.zlw"), deregistered)), nullptr);
    EXPECT_EQ(deregistered, 0u);
    // The registered-items query sends the item type only when "ITEM_TYPE" asks for one.
    ZELServerVector<IZELServerItem, ZELServerItem> items;
    ZELServerStringDict other;
    other.insert("item_type", "1");
    EXPECT_EQ(StatusPtr(service.getRegisteredItems(&other, items)), nullptr);
    ASSERT_EQ(items.entries(), 2u);
    EXPECT_EQ(items.element(0)->getItemType(), 1u);
    EXPECT_EQ(items.element(1)->getItemType(), 4u);
    ZELServerStringDict templates;
    templates.insert("ITEM_TYPE", "4");
    EXPECT_EQ(StatusPtr(service.getRegisteredItems(&templates, items)), nullptr);
    EXPECT_EQ(items.entries(), 1u);
    EXPECT_TRUE(server.verify());
}

// ---- Property-accessor updates ----------------------------------------------------------------------

TEST_F(ServiceTest, AccessorUpdatesSendTheOwnersIdAndADocumentNamedAfterTheCommand)
{
    const auto update = [](const std::string& keyword, const char* idName, const char* id) {
        return command(keyword, {{idName, id}, {"propertyAccessorObject", propertiesDocument(keyword)}});
    };
    server.exchange(update("REP_UPDATE_SERVICEPROPERTYACCESSOR", "serviceID", "-1"), success("true"))
        .exchange(update("REP_UPDATE_SERVICEPROPERTYACCESSOR", "serviceID", "42"), success("true"))
        .exchange(update("REP_UPDATE_WORKSPACEPROPERTYACCESSOR", "workspaceID", "ws-17"), success("true"))
        .exchange(update("REP_UPDATE_DATASETPROPERTYACCESSOR", "datasetID", "d-a"), success("true"))
        .exchange(update("REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", "featureTypeID", "ft-a1"),
                  zeltest::reply("ERROR", "feature type is locked"));
    signIn();
    ZELServerPropertyAccessor accessor;
    accessor.setProperty(S("run"), S("priority"), S("high"));
    // A service not saved yet goes by the id "-1".
    EXPECT_EQ(StatusPtr(service.updatePropertyAccessor(accessor)), nullptr);
    ASSERT_EQ(readServiceReply(R"(<SERVICE service_id="42" name="download"/>)", channel.get(), service), 0);
    EXPECT_EQ(StatusPtr(service.updatePropertyAccessor(accessor)), nullptr);
    ZELServerWorkspace workspace(nullptr);
    ASSERT_EQ(readWorkspaceReply(R"(<WORKSPACE_DEFINITIONS workspace_id="ws-17"><DATASET dataset_id="d-a" )"
                                 R"(is_source="true"><FEATURE_TYPE feature_type_id="ft-a1"/></DATASET>)"
                                 R"(</WORKSPACE_DEFINITIONS>)",
                                 channel.get(), workspace),
              0);
    EXPECT_EQ(StatusPtr(workspace.updatePropertyAccessor(accessor)), nullptr);
    EXPECT_EQ(StatusPtr(workspace.getSourceDatasets().element(0)->updatePropertyAccessor(accessor)), nullptr);
    const StatusPtr locked(workspace.getSourceFeatureTypes().element(0)->updatePropertyAccessor(accessor));
    ASSERT_EQ(numberOf(locked), msg::kServerError);
    EXPECT_STREQ(locked->getMessage(), "feature type is locked");
    EXPECT_TRUE(server.verify());
}

}  // namespace
}  // namespace zel::repotest
