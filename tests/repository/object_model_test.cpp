// The repository object model read from reply documents, the property accessor with the document
// the update commands send, and a service's registration flags. No connection needed.

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
#include "support/wire_table.h"
#include "transport/ZELServerTCPIPRequest.h"

using namespace std::string_literals;

namespace zel {
namespace {

using zeltest::joined;

ZELServerString S(const std::string& text) { return ZELServerString(text); }

template <class Object>
std::string text(const Object& object, void (Object::*getter)(IZELServerString&) const)
{
    ZELServerString out;
    (object.*getter)(out);
    return out.str();
}

template <class I>
std::string names(IZELServerVector<I>& vector)
{
    return joined(vector.entries(), [&](unsigned i) { return text<I>(*vector.element(i), &I::getName); });
}

std::string strings(const IZELServerStringArray& array)
{
    return joined(array.entries(), [&](unsigned i) {
        ZELServerString element;
        array.getElement(i, element);
        return element.str();
    });
}

// Datasets A (source), B (destination) and C (source) with feature types; parameters of every
// options type; properties (one named twice) and resources.
const std::string kWorkspaceDocument = R"(<REP_GET_WORKSPACEVIEW>
  <WORKSPACE_DEFINITIONS name="roads.zlw" title="Roads" description="Road network" is_enabled="true" filesize="1234567">
    <DATASET format="LINES" name="A" location="/data/a" is_source="true">
      <FEATURE_TYPE name="a1" description="first of A">
        <ATTRIBUTE name="id" zel_type="zel_int32" decimals="0" width="10"/>
        <ATTRIBUTE name="length" zel_type="zel_real64" decimals="3" width="15"/>
        <PROPERTY category="display" name="colour" value="red"><ATTRIBUTE name="unit" value="rgb"/></PROPERTY>
      </FEATURE_TYPE>
      <FEATURE_TYPE name="a2"/>
      <PROPERTY category="source" name="reader" value="LINES"/>
    </DATASET>
    <DATASET name="B" is_source="false"><FEATURE_TYPE name="b1"/></DATASET>
    <DATASET name="C" is_source="1"><FEATURE_TYPE name="c1"/></DATASET>
    <PARAMETER name="SRC" param_type="FILENAME" default_val="$(DATA)/a.lin" options_type="FILEFILTER_CONFIG"
        options="Line files (*.lin)%*.lin"/>
    <PARAMETER name="MODE" options_type="SINGLECHOICE_CONFIG" options="fast%safe"/>
    <PARAMETER name="LAYERS" options_type="MULTICHOICE_CONFIG" options="roads%rails"/>
    <PARAMETER name="TOLERANCE" options_type="RANGE_CONFIG" options="0%10"/>
    <PROPERTY category="run" name="priority" value="low"/>
    <PROPERTY category="run" name="priority" value="high"><ATTRIBUTE name="set_by" value="admin"/></PROPERTY>
    <PROPERTY category="notify" name="topic" value="done"/>
    <RESOURCE name="lookup.csv" description="codes" filesize="2048"/>
    <RESOURCE name="style.txt"/>
  </WORKSPACE_DEFINITIONS>
</REP_GET_WORKSPACEVIEW>)";

TEST(WorkspaceReading, EveryPartLandsInItsPlace)
{
    ZELServerWorkspace workspace(nullptr);
    ASSERT_EQ(readWorkspaceReply(kWorkspaceDocument, nullptr, workspace), 0);
    EXPECT_TRUE(workspace.isEnabled());
    EXPECT_EQ(workspace.getFileSize(), 1234567);
    EXPECT_EQ(names(workspace.getResources()), "lookup.csv,style.txt,");
    EXPECT_EQ(workspace.getResources().element(0)->getFileSize(), 2048);
    // Datasets split by their source flag, in reverse document order; feature types through both.
    EXPECT_EQ(names(workspace.getSourceDatasets()), "C,A,");
    EXPECT_EQ(names(workspace.getDestinationDatasets()), "B,");
    EXPECT_EQ(names(workspace.getSourceFeatureTypes()), "c1,a1,a2,");
    EXPECT_EQ(names(workspace.getDestinationFeatureTypes()), "b1,");
    IZELServerDataset& a = *workspace.getSourceDatasets().element(1);
    EXPECT_EQ(text<IZELServerDataset>(a, &IZELServerDataset::getFormat) + " " +
                  text<IZELServerDataset>(a, &IZELServerDataset::getLocation),
              "LINES /data/a");
    EXPECT_EQ(workspace.getSourceFeatureTypes().element(1), a.getFeatureTypes().element(0)) << "the same objects";
    // A property's own "ATTRIBUTE" child is no attribute of the feature type.
    IZELServerFeatureType& a1 = *a.getFeatureTypes().element(0);
    EXPECT_EQ(names(a1.getAttributes()), "id,length,");
    const IZELServerAttribute& length = *a1.getAttributes().element(1);
    EXPECT_EQ(text<IZELServerAttribute>(length, &IZELServerAttribute::getType), "zel_real64");
    EXPECT_EQ(std::to_string(length.getDecimals()) + " " + std::to_string(length.getWidth()), "3 15");
    // Properties belong to their own element; a repeated one keeps the later value and gains attributes.
    ZELServerStringArray categories;
    workspace.getPropertyAccessor().getCategoryNames(categories);
    EXPECT_EQ(strings(categories), "notify,run,");
    ZELServerStringArray datasetCategories;
    a.getPropertyAccessor().getCategoryNames(datasetCategories);
    EXPECT_EQ(strings(datasetCategories), "source,");
    const IZELServerProperty* priority = workspace.getPropertyAccessor().getProperty(S("run"), S("priority"));
    ASSERT_NE(priority, nullptr);
    ZELServerString setBy;
    EXPECT_TRUE(priority->getAttribute(S("set_by"), setBy));
    EXPECT_EQ(text<IZELServerProperty>(*priority, &IZELServerProperty::getValue) + " " + setBy.str(), "high admin");
    // Choices by options type: a file filter is never split, a range has none; appended to what is there.
    const std::string choices[] = {"kept,Line files (*.lin)%*.lin,", "kept,fast,safe,", "kept,roads,rails,", "kept,"};
    for (unsigned i = 0; i < 4; ++i) {
        ZELServerStringArray options({"kept"});
        workspace.getParameters().element(i)->getOptions(options);
        EXPECT_EQ(strings(options), choices[i]);
    }
}

TEST(WorkspaceReading, ReadingAgainReplacesEverythingAndFailuresAreReported)
{
    ZELServerWorkspace workspace(nullptr);
    EXPECT_FALSE(workspace.isEnabled() || ZELServerWorkspaceSummary().isEnabled()) << "fresh objects are disabled";
    ASSERT_EQ(readWorkspaceReply(kWorkspaceDocument, nullptr, workspace), 0);
    ASSERT_EQ(readWorkspaceReply(R"(<X><WORKSPACE_DEFINITIONS name="w2"><DATASET name="D"><FEATURE_TYPE name="f"/>)"
                                 R"(</DATASET></WORKSPACE_DEFINITIONS></X>)",
                                 nullptr, workspace),
              0);
    EXPECT_FALSE(workspace.isEnabled());
    EXPECT_EQ(workspace.getFileSize(), 0);
    EXPECT_EQ(names(workspace.getSourceDatasets()) + names(workspace.getDestinationFeatureTypes()), "f,");
    EXPECT_EQ(workspace.getParameters().entries() + workspace.getResources().entries(), 0u);
    ZELServerStringArray categories;
    workspace.getPropertyAccessor().getCategoryNames(categories);
    EXPECT_EQ(categories.entries(), 0u);
    EXPECT_EQ(readWorkspaceReply("not xml", nullptr, workspace), static_cast<int>(msg::kXmlFailure));

    // A list takes every workspace of the document, at any depth, into a cleared vector.
    ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
    workspaces.append(new ZELServerWorkspace(nullptr));
    EXPECT_EQ(readWorkspacesReply("not xml", nullptr, workspaces), static_cast<int>(msg::kXmlFailure));
    ASSERT_EQ(readWorkspacesReply(R"(<L><WORKSPACE_DEFINITIONS name="one"><DATASET name="s" is_source="true"/>)"
                                  R"(</WORKSPACE_DEFINITIONS><G><WORKSPACE_DEFINITIONS name="two"/></G></L>)",
                                  nullptr, workspaces),
              0);
    EXPECT_EQ(names(workspaces), "one,two,");
    EXPECT_EQ(names(workspaces.element(0)->getSourceDatasets()), "s,");
}

TEST(ItemReading, SummariesItemsAndStoredFilesReadTheirAttributes)
{
    ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary> summaries;
    ASSERT_EQ(readWorkspaceSummariesReply(R"(<R><WORKSPACE_SUMMARY name="a" title="A"/><WORKSPACE_SUMMARY name="b" )"
                                          R"(is_enabled="true"/><WORKSPACE_SUMMARY name="c" is_enabled="0"/></R>)",
                                          summaries),
              0);
    EXPECT_EQ(names(summaries), "a,b,c,");
    EXPECT_EQ(joined(3, [&](unsigned i) { return std::to_string(summaries.element(i)->isEnabled()); }), "0,1,0,");
    EXPECT_EQ(text<IZELServerWorkspaceSummary>(*summaries.element(0), &IZELServerWorkspaceSummary::getTitle), "A");

    // The type follows the name's ending, case sensitively.
    const std::pair<std::string, unsigned> types[] = {
        {"roads.zlw", 1}, {"reader.zds", 2}, {"clean.zlx", 3}, {"report.zlwt", 4}, {"ROADS.ZLW", 0}, {"a.zlw.bak", 0},
    };
    for (const auto& [name, type] : types) {
        ZELServerItem item;
        ASSERT_EQ(readItemReply("<R><ITEM name=\"" + name + "\"/></R>", item), 0);
        EXPECT_EQ(item.getItemType(), type) << name;
    }
    ZELServerItem item;
    ASSERT_EQ(readItemReply(R"(<R><ITEM name="roads.zlw" repository_name="Samples" buildnumber="24117"/></R>)", item),
              0);
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getRepositoryName), "Samples");
    EXPECT_EQ(item.getBuildNumber(), 24117);
    // A 32-bit size holds what fits, a 64-bit one more; what does not convert or fit reads as zero.
    const std::pair<const char*, long long> sizes[] = {
        {"2147483647", 2147483647}, {"-2147483648", -2147483648LL}, {"2147483648", 0}, {"12abc", 0}};
    for (const auto& [size, expected] : sizes) {
        ASSERT_EQ(readItemReply(std::string("<R><ITEM filesize=\"") + size + "\"/></R>", item), 0);
        EXPECT_EQ(item.getFileSize(), expected) << size;
    }
    ZELServerCustomFormat format;
    ASSERT_EQ(readCustomFormatReply(R"(<R><CUSTOMFORMAT name="f.zds" title="F" filesize="5000000000"/></R>)", format),
              0);
    EXPECT_EQ(text<IZELServerCustomFormat>(format, &IZELServerCustomFormat::getTitle), "F");
    EXPECT_EQ(format.getFileSize(), 5000000000LL);
}

TEST(ServiceSettings, RegistrationFlagsApplyPerItemTypeOnly)
{
    ZELServerService service(nullptr, "download", "", "", "", false, false, false, false, false);
    const auto flags = [&] {
        return joined(6, [&](unsigned type) { return std::to_string(service.isRegistrationAllowed(type)); });
    };
    EXPECT_EQ(service.serviceId(), "-1");
    service.setRegistrationAllowed(4, 1);
    service.setRegistrationAllowed(5, 1);
    service.setRegistrationAllowed(0, 1);
    EXPECT_EQ(flags(), "0,0,0,0,1,0,");
    service.setWorkspaceRegistrationAllowed(9);
    service.setRegistrationAllowed(3, 1);
    EXPECT_EQ(flags(), "0,1,0,1,1,0,");
    service.setRegistrationAllowed(1, 0);
    EXPECT_EQ(service.isWorkspaceRegistrationAllowed(), 0u);
    ASSERT_EQ(
        readServiceReply(R"(<R><SERVICE service_id="42" is_enabled="true" is_workspace_reg_allowed="true" )"
                         R"(is_customformat_reg_allowed="false" is_customtransform_reg_allowed="1" )"
                         R"(is_template_reg_allowed="yes"><PROPERTY category="c" name="n" value="v"/></SERVICE></R>)",
                         nullptr, service),
        0);
    EXPECT_EQ(service.serviceId() + " " + std::to_string(service.isEnabled()) + " " + flags(), "42 1 0,1,0,1,1,0,");
    ZELServerString value;
    EXPECT_TRUE(service.getPropertyAccessor().getPropertyValue(S("c"), S("n"), value));
}

// ---- The property accessor ---------------------------------------------------------------------------

// The document the update commands send for `accessor`, under `root`.
std::string writtenDocument(const IZELServerPropertyAccessor& accessor, const std::string& root)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.addXmlValue("propertyAccessorObject", PropertyAccessorXml(accessor), root), 0);
    std::string written;
    request.getText(written);
    const std::string prefix = "K\0clientID=\0propertyAccessorObject=<?xml version=\"1.0\" encoding=\"UTF-8\" "
                               "standalone=\"no\" ?>"s;
    EXPECT_EQ(written.compare(0, prefix.size(), prefix), 0) << written;
    return written.substr(prefix.size());
}

TEST(PropertyAccessor, LookupsAreExactAndCopiesAndDocumentsHoldEveryAttributeInByteOrder)
{
    ZELServerWorkspace workspace(nullptr);
    ASSERT_EQ(readWorkspaceReply(R"(<R><WORKSPACE_DEFINITIONS><PROPERTY category="run" name="n" value="v">)"
                                 R"(<ATTRIBUTE name="unit" value="1"/><ATTRIBUTE name="by" value="ann"/></PROPERTY>)"
                                 R"(<PROPERTY name="bare"/></WORKSPACE_DEFINITIONS></R>)",
                                 nullptr, workspace),
              0);
    IZELServerPropertyAccessor& accessor = workspace.getPropertyAccessor();
    ZELServerVector<IZELServerProperty, ZELServerProperty> copies;
    accessor.getProperties(S("run"), copies);
    accessor.setProperty(S("run"), S("n"), S("changed"));
    accessor.setProperty(S("a"), S("Y"), S("x & y"));
    accessor.setProperty(S("a"), S("b"), S("K\xf6ln"));
    ZELServerString value("stale");
    EXPECT_TRUE(accessor.getPropertyValue(S(""), S("bare"), value)) << "missing attributes are empty texts";
    EXPECT_EQ(value.str(), "");
    const std::pair<const char*, const char*> misses[] = {{"run", "N"}, {"Run", "n"}, {"run", "other"}};
    for (const auto& [category, name] : misses) {
        value.assign("stale");
        EXPECT_FALSE(accessor.getPropertyValue(S(category), S(name), value)) << category << " " << name;
        EXPECT_EQ(value.str(), "");
    }
    ASSERT_EQ(copies.entries(), 1u);
    ZELServerStringArray attributes;
    copies.element(0)->getAttributes(attributes);
    EXPECT_EQ(text<IZELServerProperty>(*copies.element(0), &IZELServerProperty::getValue) + " " + strings(attributes),
              "v by,ann,unit,1,");
    ZELServerStringArray pairs({"kept"});
    EXPECT_TRUE(accessor.getPropertyPairs(S("a"), pairs));
    EXPECT_EQ(strings(pairs), "kept,Y,x & y,b,K\xf6ln,");
    EXPECT_FALSE(accessor.getPropertyPairs(S("missing"), pairs));
    EXPECT_EQ(writtenDocument(accessor, "REP_UPDATE_SERVICEPROPERTYACCESSOR"),
              R"(<REP_UPDATE_SERVICEPROPERTYACCESSOR><PROPERTY category="" name="bare" value=""/>)"
              R"(<PROPERTY category="a" name="Y" value="x &amp; y"/><PROPERTY category="a" name="b" value="K)"
              "\xc3\xb6"
              R"(ln"/><PROPERTY category="run" name="n" value="changed"><ATTRIBUTE name="by" value="ann"/>)"
              R"(<ATTRIBUTE name="unit" value="1"/></PROPERTY></REP_UPDATE_SERVICEPROPERTYACCESSOR>)");
    EXPECT_EQ(writtenDocument(ZELServerPropertyAccessor(), "R"), "<R/>");
}

}  // namespace
}  // namespace zel
