// The repository object model read from realistic reply documents: workspaces with their datasets,
// feature types, attributes, parameters, properties and resources; summaries; items and their types;
// custom formats, custom transformers, templates, resources; single and list readers.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/reply_readers.h"
#include "repository/repository_objects.h"

namespace zel {
namespace {

template <class Object>
std::string text(const Object& object, void (Object::*getter)(IZELServerString&) const)
{
    ZELServerString out;
    (object.*getter)(out);
    return out.str();
}

// Names of the objects in a vector, in order.
template <class I>
std::vector<std::string> names(IZELServerVector<I>& vector)
{
    std::vector<std::string> result;
    for (unsigned i = 0; i < vector.entries(); ++i) {
        result.push_back(text<I>(*vector.element(i), &I::getName));
    }
    return result;
}

// A workspace as the server describes it: datasets A (source), B (destination), C (source), each with
// feature types; published parameters of every options type; properties (one category has a name
// twice) and resources.
const std::string kWorkspaceDocument = R"(<?xml version="1.0" encoding="UTF-8"?>
<REP_GET_WORKSPACEVIEW>
  <WORKSPACE_DEFINITIONS workspace_id="ws-17" name="roads.zlw" title="Roads" description="Road network to JSON"
      is_enabled="true" filesize="1234567">
    <DATASET dataset_id="d-a" format="LINES" name="A" location="/data/a" is_source="true">
      <FEATURE_TYPE feature_type_id="ft-a1" name="a1" description="first of A">
        <ATTRIBUTE name="id" zel_type="zel_int32" decimals="0" width="10"/>
        <ATTRIBUTE name="length" zel_type="zel_real64" decimals="3" width="15"/>
        <PROPERTY category="display" name="colour" value="red">
          <ATTRIBUTE name="unit" value="rgb"/>
        </PROPERTY>
      </FEATURE_TYPE>
      <FEATURE_TYPE feature_type_id="ft-a2" name="a2" description="second of A"/>
      <PROPERTY category="source" name="reader" value="LINES"/>
    </DATASET>
    <DATASET dataset_id="d-b" format="JSON" name="B" location="/out/b" is_source="false">
      <FEATURE_TYPE feature_type_id="ft-b1" name="b1"/>
    </DATASET>
    <DATASET dataset_id="d-c" format="CSV" name="C" location="/data/c" is_source="1">
      <FEATURE_TYPE feature_type_id="ft-c1" name="c1"/>
    </DATASET>
    <PARAMETER name="SRC" param_type="FILENAME" default_val="$(DATA)/a.lin" description="Source file"
        options_type="FILEFILTER_CONFIG" options="Line files (*.lin)%*.lin"/>
    <PARAMETER name="MODE" param_type="CHOICE" default_val="fast" description="Mode"
        options_type="SINGLECHOICE_CONFIG" options="fast%safe%exact"/>
    <PARAMETER name="LAYERS" param_type="LOOKUP_CHOICE" default_val="roads" description="Layers"
        options_type="MULTICHOICE_CONFIG" options="roads%rails%rivers"/>
    <PARAMETER name="TOLERANCE" param_type="FLOAT" default_val="0.5" description="Tolerance"
        options_type="RANGE_CONFIG" options="0%10"/>
    <PROPERTY category="run" name="priority" value="low"/>
    <PROPERTY category="run" name="priority" value="high">
      <ATTRIBUTE name="set_by" value="admin"/>
    </PROPERTY>
    <PROPERTY category="notify" name="topic" value="done &amp; dusted"/>
    <RESOURCE name="lookup.csv" description="codes" filesize="2048"/>
    <RESOURCE name="style.txt" description="styling" filesize="512"/>
  </WORKSPACE_DEFINITIONS>
</REP_GET_WORKSPACEVIEW>)";

class WorkspaceReading : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(readWorkspaceReply(kWorkspaceDocument, nullptr, workspace), 0); }

    ZELServerWorkspace workspace{nullptr};
};

TEST_F(WorkspaceReading, ReadsItsOwnAttributesAndResourcesInDocumentOrder)
{
    EXPECT_EQ(text<IZELServerWorkspace>(workspace, &IZELServerWorkspace::getName), "roads.zlw");
    EXPECT_EQ(text<IZELServerWorkspace>(workspace, &IZELServerWorkspace::getTitle), "Roads");
    EXPECT_EQ(text<IZELServerWorkspace>(workspace, &IZELServerWorkspace::getDescription), "Road network to JSON");
    EXPECT_TRUE(workspace.isEnabled());
    EXPECT_EQ(workspace.getFileSize(), 1234567);
    IZELServerVector<IZELServerResource>& resources = workspace.getResources();
    EXPECT_EQ(names(resources), (std::vector<std::string>{"lookup.csv", "style.txt"}));
    EXPECT_EQ(resources.element(0)->getFileSize(), 2048);
    EXPECT_EQ(text<IZELServerResource>(*resources.element(1), &IZELServerResource::getDescription), "styling");
}

TEST_F(WorkspaceReading, SplitsDatasetsBySourceFlagInReverseDocumentOrderWithTheirFeatureTypes)
{
    EXPECT_EQ(names(workspace.getSourceDatasets()), (std::vector<std::string>{"C", "A"}));
    EXPECT_EQ(names(workspace.getDestinationDatasets()), (std::vector<std::string>{"B"}));
    IZELServerDataset& a = *workspace.getSourceDatasets().element(1);
    EXPECT_EQ(text<IZELServerDataset>(a, &IZELServerDataset::getFormat), "LINES");
    EXPECT_EQ(text<IZELServerDataset>(a, &IZELServerDataset::getLocation), "/data/a");
    EXPECT_TRUE(a.isSource());
    EXPECT_FALSE(workspace.getDestinationDatasets().element(0)->isSource());
    // Feature types are reachable through datasets and the workspace alike.
    EXPECT_EQ(names(workspace.getSourceFeatureTypes()), (std::vector<std::string>{"c1", "a1", "a2"}));
    EXPECT_EQ(names(workspace.getDestinationFeatureTypes()), (std::vector<std::string>{"b1"}));
    EXPECT_EQ(names(a.getFeatureTypes()), (std::vector<std::string>{"a1", "a2"}));
    // The same objects, not copies.
    EXPECT_EQ(workspace.getSourceFeatureTypes().element(1), a.getFeatureTypes().element(0));
}

TEST_F(WorkspaceReading, AttributesAndPropertiesBelongToTheirOwnElementAndRepeatsMerge)
{
    IZELServerFeatureType& a1 = *workspace.getSourceFeatureTypes().element(1);
    EXPECT_EQ(text<IZELServerFeatureType>(a1, &IZELServerFeatureType::getDescription), "first of A");
    // The property's own "ATTRIBUTE" child is not a feature type attribute.
    IZELServerVector<IZELServerAttribute>& attributes = a1.getAttributes();
    ASSERT_EQ(attributes.entries(), 2u);
    EXPECT_EQ(text<IZELServerAttribute>(*attributes.element(1), &IZELServerAttribute::getName), "length");
    EXPECT_EQ(text<IZELServerAttribute>(*attributes.element(1), &IZELServerAttribute::getType), "zel_real64");
    EXPECT_EQ(attributes.element(1)->getDecimals(), 3);
    EXPECT_EQ(attributes.element(1)->getWidth(), 15);

    ZELServerString value;
    EXPECT_TRUE(
        a1.getPropertyAccessor().getPropertyValue(ZELServerString("display"), ZELServerString("colour"), value));
    EXPECT_EQ(value.str(), "red");
    // Properties belong to their own element only.
    ZELServerStringArray categories;
    workspace.getPropertyAccessor().getCategoryNames(categories);
    EXPECT_EQ(categories.items(), (std::vector<std::string>{"notify", "run"}));
    ZELServerStringArray datasetCategories;
    workspace.getSourceDatasets().element(1)->getPropertyAccessor().getCategoryNames(datasetCategories);
    EXPECT_EQ(datasetCategories.items(), (std::vector<std::string>{"source"}));
    // A repeated property keeps the later value and gains its attributes.
    const IZELServerProperty* priority =
        workspace.getPropertyAccessor().getProperty(ZELServerString("run"), ZELServerString("priority"));
    ASSERT_NE(priority, nullptr);
    EXPECT_EQ(text<IZELServerProperty>(*priority, &IZELServerProperty::getValue), "high");
    ZELServerString setBy;
    EXPECT_TRUE(priority->getAttribute(ZELServerString("set_by"), setBy));
    EXPECT_EQ(setBy.str(), "admin");
    ZELServerStringArray names;
    workspace.getPropertyAccessor().getPropertyNames(ZELServerString("run"), names);
    EXPECT_EQ(names.items(), (std::vector<std::string>{"priority"}));

    ZELServerString topic;
    workspace.getPropertyAccessor().getPropertyValue(ZELServerString("notify"), ZELServerString("topic"), topic);
    EXPECT_EQ(topic.str(), "done & dusted");
}

TEST_F(WorkspaceReading, ParametersOfferTheirChoicesByOptionsType)
{
    IZELServerVector<IZELServerParameter>& parameters = workspace.getParameters();
    EXPECT_EQ(names(parameters), (std::vector<std::string>{"SRC", "MODE", "LAYERS", "TOLERANCE"}));
    const std::vector<std::vector<std::string>> expected = {
        {"Line files (*.lin)%*.lin"},  // a file filter is never split
        {"fast", "safe", "exact"},
        {"roads", "rails", "rivers"},
        {},  // an options type without choices
    };
    for (unsigned i = 0; i < expected.size(); ++i) {
        ZELServerStringArray choices;
        parameters.element(i)->getOptions(choices);
        EXPECT_EQ(choices.items(), expected[i]) << "parameter " << i;
    }
    IZELServerParameter& source = *parameters.element(0);
    EXPECT_EQ(text<IZELServerParameter>(source, &IZELServerParameter::getType), "FILENAME");
    EXPECT_EQ(text<IZELServerParameter>(source, &IZELServerParameter::getDefaultValue), "$(DATA)/a.lin");
    EXPECT_EQ(text<IZELServerParameter>(source, &IZELServerParameter::getDescription), "Source file");
    EXPECT_EQ(text<IZELServerParameter>(source, &IZELServerParameter::getOptionsType), "FILEFILTER_CONFIG");
    EXPECT_EQ(text<IZELServerParameter>(*parameters.element(3), &IZELServerParameter::getOptionsText), "0%10");
    ZELServerStringArray choices({"kept"});
    parameters.element(1)->getOptions(choices);
    EXPECT_EQ(choices.items(), (std::vector<std::string>{"kept", "fast", "safe", "exact"}));
}

TEST_F(WorkspaceReading, ReadingAgainReplacesEverythingAndListsReadEveryWorkspace)
{
    const std::string smaller =
        R"(<X><WORKSPACE_DEFINITIONS name="w2"><DATASET name="D" is_source="false"><FEATURE_TYPE name="f"/></DATASET>)"
        R"(</WORKSPACE_DEFINITIONS></X>)";
    ASSERT_EQ(readWorkspaceReply(smaller, nullptr, workspace), 0);
    EXPECT_EQ(text<IZELServerWorkspace>(workspace, &IZELServerWorkspace::getName), "w2");
    EXPECT_FALSE(workspace.isEnabled());
    EXPECT_EQ(workspace.getFileSize(), 0);
    EXPECT_EQ(workspace.getSourceDatasets().entries(), 0u);
    EXPECT_EQ(workspace.getSourceFeatureTypes().entries(), 0u);
    EXPECT_EQ(names(workspace.getDestinationFeatureTypes()), (std::vector<std::string>{"f"}));
    EXPECT_EQ(workspace.getParameters().entries(), 0u);
    EXPECT_EQ(workspace.getResources().entries(), 0u);
    ZELServerStringArray categories;
    workspace.getPropertyAccessor().getCategoryNames(categories);
    EXPECT_EQ(categories.entries(), 0u);

    // A list reader takes every workspace of the document, at any depth, into a cleared vector.
    ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
    workspaces.append(new ZELServerWorkspace(nullptr));
    ASSERT_EQ(readWorkspacesReply(R"(<L><WORKSPACE_DEFINITIONS name="one"><DATASET name="s" is_source="true"/>)"
                                  R"(</WORKSPACE_DEFINITIONS><G><WORKSPACE_DEFINITIONS name="two"/></G></L>)",
                                  nullptr, workspaces),
              0);
    EXPECT_EQ(names(workspaces), (std::vector<std::string>{"one", "two"}));
    EXPECT_EQ(names(workspaces.element(0)->getSourceDatasets()), (std::vector<std::string>{"s"}));
}

// ---- Summaries, items and stored files --------------------------------------------------------------

TEST(SummaryReading, MissingEnabledFlagReadsDisabledAndFlagsFollowTheServersTruthValues)
{
    const std::string body =
        R"(<R><WORKSPACE_SUMMARY name="a" title="A" description="first"/>)"
        R"(<WORKSPACE_SUMMARY name="b" is_enabled="true"/><WORKSPACE_SUMMARY name="c" is_enabled="0"/>)"
        R"(<WORKSPACE_SUMMARY name="d" is_enabled="Y"/><WORKSPACE_SUMMARY name="e" is_enabled="false"/></R>)";
    ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary> summaries;
    ASSERT_EQ(readWorkspaceSummariesReply(body, summaries), 0);
    EXPECT_EQ(names(summaries), (std::vector<std::string>{"a", "b", "c", "d", "e"}));
    const std::vector<bool> enabled = {false, true, false, true, false};
    for (unsigned i = 0; i < enabled.size(); ++i) {
        EXPECT_EQ(summaries.element(i)->isEnabled(), enabled[i]) << i;
    }
    EXPECT_EQ(text<IZELServerWorkspaceSummary>(*summaries.element(0), &IZELServerWorkspaceSummary::getTitle), "A");
}

TEST(ItemReading, TypeFollowsTheNameEndingCaseSensitivelyAndBadNumbersReadAsZero)
{
    const std::vector<std::pair<std::string, unsigned>> cases = {
        {"roads.zlw", 1}, {"reader.zds", 2}, {"clean.zlx", 3}, {"report.zlwt", 4},
        {"ROADS.ZLW", 0}, {"notes.txt", 0},  {"zlw", 0},       {"a.zlw.bak", 0},
    };
    for (const auto& [name, type] : cases) {
        ZELServerItem item;
        ASSERT_EQ(readItemReply("<R><ITEM name=\"" + name + "\"/></R>", item), 0);
        EXPECT_EQ(item.getItemType(), type) << name;
    }
    // Numbers that do not convert or fit read as zero.
    const std::vector<std::pair<std::string, int>> sizes = {
        {"0x10", 16}, {"-3", -3}, {"12abc", 0}, {"2147483648", 0}, {"-2147483648", -2147483647 - 1},
    };
    for (const auto& [size, expected] : sizes) {
        ZELServerItem item;
        ASSERT_EQ(readItemReply("<ITEM filesize=\"" + size + "\"/>", item), 0);
        EXPECT_EQ(item.getFileSize(), expected) << '"' << size << '"';
    }
}

TEST(ItemReading, EveryAttributeLandsInItsField)
{
    const std::string body =
        R"(<REP_GET_REGISTEREDITEMS><ITEM name="roads.zlw" repository_name="Samples" title="Roads" )"
        R"(description="Line one&#10;line two" filesize="4096" category="Transport" requirements="Needs &lt;LIBX&gt;" )"
        R"(requirementskeyword="LIBX" usage="Run nightly" history="v1; v2" lastsavedate="2024-03-01T10:00:00" )"
        R"(lastsavebuild="build 20240301" buildnumber="24117" legaltermsconditions="Free for all"/></REP_GET_REGISTEREDITEMS>)";
    ZELServerItem item;
    ASSERT_EQ(readItemReply(body, item), 0);
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getRepositoryName), "Samples");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getTitle), "Roads");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getDescription), "Line one\nline two");
    EXPECT_EQ(item.getFileSize(), 4096);
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getCategory), "Transport");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getRequirements), "Needs <LIBX>");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getRequirementsKeyword), "LIBX");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getUsage), "Run nightly");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getHistory), "v1; v2");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getLastSaveDate), "2024-03-01T10:00:00");
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getLastSaveBuild), "build 20240301");
    EXPECT_EQ(item.getBuildNumber(), 24117);
    EXPECT_EQ(text<IZELServerItem>(item, &IZELServerItem::getLegalTermsAndConditions), "Free for all");
    EXPECT_EQ(item.getItemType(), 1u);
}

TEST(StoredFileReading, CustomFormatsTransformersAndTemplatesShareOneLayout)
{
    const std::string body = R"(<R><CUSTOMFORMAT name="f.zds" title="F" description="fmt" filesize="5000000000"/>)"
                             R"(<CUSTOMTRANSFORMER name="t.zlx" title="ignored" description="xf" filesize="77"/>)"
                             R"(<TEMPLATE name="p.zlwt" title="P" description="tpl" filesize="9"/></R>)";
    ZELServerCustomFormat format;
    ZELServerCustomTransformer transformer;
    ZELServerTemplate templ;
    ASSERT_EQ(readCustomFormatReply(body, format), 0);
    ASSERT_EQ(readCustomTransformerReply(body, transformer), 0);
    ASSERT_EQ(readTemplateReply(body, templ), 0);

    EXPECT_EQ(text<IZELServerCustomFormat>(format, &IZELServerCustomFormat::getTitle), "F");
    EXPECT_EQ(format.getFileSize(), 5000000000LL);
    EXPECT_EQ(format.getItemType(), 2u);
    EXPECT_EQ(text<IZELServerCustomTransformer>(transformer, &IZELServerCustomTransformer::getTitle), "");
    EXPECT_EQ(text<IZELServerCustomTransformer>(transformer, &IZELServerCustomTransformer::getDescription), "xf");
    EXPECT_EQ(transformer.getFileSize(), 77);
    EXPECT_EQ(transformer.getItemType(), 3u);
    EXPECT_EQ(text<IZELServerTemplate>(templ, &IZELServerTemplate::getName), "p.zlwt");
    EXPECT_EQ(templ.getItemType(), 4u);
}

// ---- Reader results ---------------------------------------------------------------------------------

}  // namespace
}  // namespace zel
