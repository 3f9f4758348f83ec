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

ZELServerString S(const std::string& text) { return ZELServerString(text); }

std::vector<unsigned> flagsOf(const IZELServerService& service)
{
    return {service.isRegistrationAllowed(1), service.isRegistrationAllowed(2), service.isRegistrationAllowed(3),
            service.isRegistrationAllowed(4)};
}

// ---- Settings and flags -----------------------------------------------------------------------------

TEST(ServiceSettings, FreshServiceHasTheUnsavedIdAndNoFlags)
{
    const ZELServerService service(nullptr, "download", "Data Download", "Serves files", "/svc/{name}", false, false,
                                   false, false, false);
    EXPECT_EQ(service.serviceId(), "-1");
    EXPECT_EQ(service.isEnabled(), 0u);
    EXPECT_EQ(flagsOf(service), (std::vector<unsigned>{0, 0, 0, 0}));
    ZELServerString text;
    service.getUrlPattern(text);
    EXPECT_EQ(text.str(), "/svc/{name}");
}

TEST(ServiceSettings, RegistrationFlagsPerItemTypeIgnoreOtherTypes)
{
    ZELServerService service(nullptr);
    service.setRegistrationAllowed(3, 1);
    service.setRegistrationAllowed(5, 1);
    service.setRegistrationAllowed(0, 1);
    EXPECT_EQ(flagsOf(service), (std::vector<unsigned>{0, 0, 1, 0}));
    service.setWorkspaceRegistrationAllowed(9);
    EXPECT_EQ(service.isWorkspaceRegistrationAllowed(), 1u);
    EXPECT_EQ(service.isRegistrationAllowed(1), 1u);
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
    ZELServerService service{channel.get(), "download", "Data Download", "", "", false, false, false, false, false};
};

TEST_F(ServiceTest, RegisterItemRefusesKindsTheServiceDoesNotTakeWithoutSending)
{
    service.setWorkspaceRegistrationAllowed(1);
    server.exchange(command("REP_REGISTERITEM",
                            {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "roads.zlw"}}),
                    success("true"));
    connect();
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("clean.zlx")))), msg::kRegistrationRefused);
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("report.zlwt")))), msg::kRegistrationRefused);
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("ROADS.ZLW")))), msg::kRegistrationRefused);
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("")))), msg::kRequiredValueMissing);
    EXPECT_EQ(StatusPtr(service.registerItem(S("Samples"), S("roads.zlw"))), nullptr);
    EXPECT_TRUE(sentCommands(1));
}

TEST_F(ServiceTest, NameWithoutAKnownEndingIsAlwaysRefused)
{
    for (unsigned type = 1; type <= 4; ++type) {
        service.setRegistrationAllowed(type, 1);
    }
    connect();
    EXPECT_EQ(numberOf(StatusPtr(service.registerItem(S("Samples"), S("notes.txt")))), msg::kRegistrationRefused);
    EXPECT_TRUE(sentCommands(0));
}

TEST_F(ServiceTest, ItemRegisteredAndDeregisterItemAnswerWithTheServersFlag)
{
    server.exchange(command("REP_ITEMREGISTERED",
                            {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "a.zlw"}}),
                    success("true"))
        .exchange(command("REP_DEREGISTERITEM",
                          {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "a.zlw"}}),
                  success("false"));
    connect();
    unsigned registered = 0;
    EXPECT_EQ(StatusPtr(service.itemRegistered(S("Samples"), S("a.zlw"), registered)), nullptr);
    EXPECT_EQ(registered, 1u);
    unsigned deregistered = 7;
    EXPECT_EQ(StatusPtr(service.deregisterItem(S("Samples"), S("a.zlw"), deregistered)), nullptr);
    EXPECT_EQ(deregistered, 0u);
    EXPECT_TRUE(sentCommands(2));
}

TEST_F(ServiceTest, RegisteredItemsSendTheItemTypeOnlyWhenAsked)
{
    server.exchange(command("REP_GET_REGISTEREDITEMS", {{"serviceName", "download"}}),
                    success(R"(<R><ITEM name="a.zlw" repository_name="Samples"/><ITEM name="b.zlwt"/></R>)"))
        .exchange(command("REP_GET_REGISTEREDITEMS", {{"serviceName", "download"}, {"itemType", "4"}}),
                  success(R"(<R><ITEM name="b.zlwt"/></R>)"));
    connect();
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
    EXPECT_TRUE(sentCommands(2));
}

// ---- Property-accessor updates ----------------------------------------------------------------------

std::string propertiesDocument(const std::string& keyword)
{
    return payloadDocument(keyword, R"(<PROPERTY category="run" name="priority" value="high"/>)");
}

ZELServerPropertyAccessor& highPriority(ZELServerPropertyAccessor& accessor)
{
    accessor.setProperty(S("run"), S("priority"), S("high"));
    return accessor;
}

TEST_F(ServiceTest, ServicePropertiesAreAddressedByTheServiceId)
{
    const std::string keyword = "REP_UPDATE_SERVICEPROPERTYACCESSOR";
    server.exchange(command(keyword, {{"serviceID", "-1"}, {"propertyAccessorObject", propertiesDocument(keyword)}}),
                    success("true"))
        .exchange(command(keyword, {{"serviceID", "42"}, {"propertyAccessorObject", propertiesDocument(keyword)}}),
                  success("true"));
    connect();
    ZELServerPropertyAccessor accessor;
    EXPECT_EQ(StatusPtr(service.updatePropertyAccessor(highPriority(accessor))), nullptr);
    ASSERT_EQ(readServiceReply(R"(<SERVICE service_id="42" name="download"/>)", channel.get(), service), 0);
    EXPECT_EQ(StatusPtr(service.updatePropertyAccessor(accessor)), nullptr);
    EXPECT_TRUE(sentCommands(2));
}

TEST_F(RepositoryWireTest, WorkspaceDatasetAndFeatureTypeSendTheirOwnIds)
{
    const std::string workspaceKeyword = "REP_UPDATE_WORKSPACEPROPERTYACCESSOR";
    const std::string datasetKeyword = "REP_UPDATE_DATASETPROPERTYACCESSOR";
    const std::string featureTypeKeyword = "REP_UPDATE_FEATURETYPEPROPERTYACCESSOR";
    server.exchange(command(workspaceKeyword,
                            {{"workspaceID", "ws-17"}, {"propertyAccessorObject", propertiesDocument(workspaceKeyword)}}),
                    success("true"))
        .exchange(command(datasetKeyword,
                          {{"datasetID", "d-a"}, {"propertyAccessorObject", propertiesDocument(datasetKeyword)}}),
                  success("true"))
        .exchange(command(featureTypeKeyword, {{"featureTypeID", "ft-a1"},
                                               {"propertyAccessorObject", propertiesDocument(featureTypeKeyword)}}),
                  zeltest::reply("ERROR", "feature type is locked"));
    connect();
    ZELServerWorkspace workspace(nullptr);
    ASSERT_EQ(readWorkspaceReply(R"(<WORKSPACE_DEFINITIONS workspace_id="ws-17"><DATASET dataset_id="d-a" )"
                                 R"(is_source="true"><FEATURE_TYPE feature_type_id="ft-a1"/></DATASET>)"
                                 R"(</WORKSPACE_DEFINITIONS>)",
                                 channel.get(), workspace),
              0);
    ZELServerPropertyAccessor accessor;
    highPriority(accessor);
    EXPECT_EQ(StatusPtr(workspace.updatePropertyAccessor(accessor)), nullptr);
    EXPECT_EQ(StatusPtr(workspace.getSourceDatasets().element(0)->updatePropertyAccessor(accessor)), nullptr);
    const StatusPtr locked(workspace.getSourceFeatureTypes().element(0)->updatePropertyAccessor(accessor));
    ASSERT_EQ(numberOf(locked), msg::kServerError);
    EXPECT_STREQ(locked->getMessage(), "feature type is locked");
    EXPECT_TRUE(sentCommands(3));
}

}  // namespace
}  // namespace zel::repotest
