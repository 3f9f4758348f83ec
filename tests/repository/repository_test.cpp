// The repository manager, a repository and a service on the wire: every command byte for byte, the
// out values after answers, refusals and failures, the view filters, the file transfers, and the
// argument checks that run before anything is sent.

#include <functional>
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
#include "repository/ZELServerWorkspace.h"
#include "repository/reply_readers.h"
#include "repository/repository_objects.h"
#include "support/environment.h"
#include "support/wire_table.h"
#include "transport/ZELServerTCPIPRequest.h"

using namespace std::string_literals;
using namespace zeltest;

namespace zel {
namespace {

const std::string kForbidden = "\\/:*?\"<>|&='+%";

ZELServerString S(const std::string& text) { return ZELServerString(text); }

ZELServerStringDict dict(const std::vector<std::pair<std::string, std::string>>& pairs)
{
    ZELServerStringDict made;
    for (const auto& [key, value] : pairs) {
        made.insert(key, value);
    }
    return made;
}

class RepositoryWire : public WireTableTest {
protected:
    // A command of the repository "Samples": its name first, then the command's own values.
    static Bytes on(const std::string& keyword, Values values = {})
    {
        values.insert(values.begin(), {"repositoryName", "Samples"});
        return command(keyword, values);
    }
    static Bytes ok(const std::string& body) { return reply("SUCCESS", body); }

    ZELServerRepositoryManager manager{channel.get()};
    ZELServerRepository repository{channel.get(), S("Samples"), S("sample workspaces")};
    ZELServerService service{channel.get(), "download", "Data Download", "", "", false, true, false, false, false};
    ProgressLog progress;
};

TEST_F(RepositoryWire, ItemsResourcesAndTheirTransfers)
{
    const std::string item = file("roads.zlw", "workspace bytes\n");
    const std::string resource = file("up.csv", "0123456789");
    const std::string missing = (scratch.path() / "missing.zlw").string();
    const std::string destination = (scratch.path() / "down.zlw").string();
    const std::string big(200000, 'w');
    const Values crcOff = {{"itemFileCRCCheckingEnabled", "false"}};
    const auto resourceOf = [](const char* itemName, const char* resourceName) {
        return Values{
            {"itemName", itemName}, {"resourceName", resourceName}, {"resourceFileCRCCheckingEnabled", "false"}};
    };
    const auto downloaded = [&] { return slurp(destination).substr(0, 20); };
    run({
        {"only the exact truth word is true", on("REP_REMOVE_ITEM", {{"itemName", "a.zlw"}}), ok("True"),
         [&] { return outcome(repository.removeItem(S("a.zlw"), fresh()), flag); }, 0, "0 "},
        {"add item", on("REP_ADD_ITEM", {{"itemName", "roads.zlw"}, crcOff[0]}), readyAck(),
         [&] { return outcome(repository.addItem(S("roads.zlw"), S(item))); }, 0, "",
         uploadOf("workspace bytes\n", ok("true"))},
        {"update item lets any name through", on("REP_UPDATE_ITEM", {{"itemName", "dir/a.zlw"}, crcOff[0]}), readyAck(),
         [&] { return outcome(repository.updateItem(S("dir/a.zlw"), S(item))); }, 0, "",
         uploadOf("workspace bytes\n", ok("true"))},
        {"add resource", on("REP_ADD_ITEMRESOURCE", resourceOf("a.zlw", "up.csv")), readyAck(),
         [&] { return outcome(repository.addItemResource(S("a.zlw"), S("up.csv"), S(resource), &progress), progress); },
         0, "total 10,start,at 0,finish, ", uploadOf("0123456789", ok("true"))},
        {"a resource named as its item", none, none,
         [&] { return outcome(repository.addItemResource(S("a.zlw"), S("a.zlw"), S(missing))); },
         msg::kResourceNamedAsItem, ""},
        {"the character check comes first", none, none,
         [&] { return outcome(repository.addItemResource(S("a%"), S("a%"), S(missing))); }, msg::kForbiddenCharacter,
         ""},
        {"get item", on("REP_GET_ITEM", {{"itemName", "roads.zlw"}, crcOff[0]}), fileHeader(big.size(), crc32(big)),
         [&] { return outcome(repository.getItem(S("roads.zlw"), S(destination), fresh()), flag, downloaded); }, 0,
         "1 wwwwwwwwwwwwwwwwwwww ", downloadOf(big, ok("true"))},
    });
}

TEST_F(RepositoryWire, ViewsFiltersAndRegistrations)
{
    ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary> summaries;
    ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
    ZELServerVector<IZELServerCustomFormat, ZELServerCustomFormat> formats;
    ZELServerVector<IZELServerResource, ZELServerResource> resources;
    ZELServerVector<IZELServerWorkspaceService, ZELServerWorkspaceService> registrations;
    ZELServerResource resource;
    const ZELServerStringDict disabled = dict({{"ENABLE_FILTER", "DISABLED"}});
    const auto summariesWith = [&](const ZELServerStringDict* filter) {
        return [&, filter] { return outcome(repository.getWorkspaceSummariesView(filter, summaries), summaries); };
    };
    const Bytes twoSummaries = ok(R"(<R><WORKSPACE_SUMMARY name="s1"/><WORKSPACE_SUMMARY name="s2"/></R>)");
    const ZELServerStringDict onlyWorkspace = dict({{"WORKSPACE_NAME", "roads.zlw"}});
    const auto registrationText = [&] {
        ZELServerString name;
        registrations.element(0)->getService().getName(name);
        return name.str() + " " + std::to_string(registrations.element(0)->getWorkspaceSummary().isEnabled());
    };
    run({
        {"no filter asks for all", on("REP_GET_WORKSPACESUMMARIESVIEW", {{"enableFilter", "All"}}), twoSummaries,
         summariesWith(nullptr), 0, "s1,s2, "},
        {"DISABLED", on("REP_GET_WORKSPACESVIEW", {{"enableFilter", "Disabled"}}),
         ok(R"(<R><WORKSPACE_DEFINITIONS name="w"/></R>)"),
         [&] { return outcome(repository.getWorkspacesView(&disabled, workspaces), workspaces); }, 0, "w, "},
        {"list views ignore their directives", on("REP_GET_CUSTOMFORMATSVIEW", {{"enableFilter", "All"}}),
         ok(R"(<R><CUSTOMFORMAT name="f.zds"/></R>)"),
         [&] { return outcome(repository.getCustomFormatsView(&disabled, formats), formats); }, 0, "f.zds, "},
        {"item resources, even of no item",
         on("REP_GET_ITEMRESOURCESVIEW", {{"itemName", ""}, {"enableFilter", "All"}}),
         ok(R"(<R><RESOURCE name="r1"/><RESOURCE name="r2"/></R>)"),
         [&] { return outcome(repository.getItemResourcesView(S(""), &disabled, resources), resources); }, 0,
         "r1,r2, "},
        {"resource view of no resource", on("REP_GET_ITEMRESOURCEVIEW", {{"itemName", "a.zlw"}, {"resourceName", ""}}),
         ok("<R/>"),
         [&] { return outcome(repository.getItemResourceView(S("a.zlw"), S(""), resource, fresh()), flag); }, 0, "0 "},
        {"registrations of one workspace",
         on("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}, {"workspaceName", "roads.zlw"}}),
         ok(R"(<R><WORKSPACE_SERVICE><WORKSPACE_SUMMARY name="roads.zlw" is_enabled="true"/>)"
            R"(<SERVICE name="download"/></WORKSPACE_SERVICE></R>)"),
         [&] { return outcome(repository.getWorkspaceServices(&onlyWorkspace, registrations), registrationText); }, 0,
         "download 1 "},
    });
}

TEST_F(RepositoryWire, ManagerAndServiceCommands)
{
    ZELServerVector<IZELServerService, ZELServerService> services;
    ZELServerVector<IZELServerRepository, ZELServerRepository> repositories;
    ZELServerVector<IZELServerItem, ZELServerItem> items;
    ZELServerPropertyAccessor accessor;
    accessor.setProperty(S("run"), S("priority"), S("high"));
    const ZELServerService unsaved(channel.get(), "download", "Data Download", "Serves & stores", "/dl/{ws}", true,
                                   true, false, false, true);
    const std::string added = xmlDocument(
        "REP_ADD_SERVICE",
        R"(<SERVICE description="Serves &amp; stores" display_name="Data Download" is_customformat_reg_allowed="false" )"
        R"(is_customtransform_reg_allowed="false" is_enabled="true" is_template_reg_allowed="true" )"
        R"(is_workspace_reg_allowed="true" name="download" service_id="-1" url_pattern="/dl/{ws}"/>)");
    const ZELServerStringDict lowerCase = dict({{"ENABLE_FILTER", "enabled"}, {"GLOBAL", "allitems"}});
    const ZELServerStringDict allItems = dict({{"GLOBAL", "ALLITEMS"}});
    const ZELServerStringDict templatesOnly = dict({{"ITEM_TYPE", "4"}, {"item_type", "1"}});
    const Values registration = {{"serviceName", "download"}, {"repositoryName", "Samples"}, {"itemName", "a.zlw"}};
    const auto servicesWith = [&](const ZELServerStringDict* filter) {
        return [&, filter] { return outcome(manager.getServices(filter, services), services); };
    };
    const auto description = [&](const IZELServerRepository& repository) {
        ZELServerString text;
        repository.getDescription(text);
        return text.str();
    };
    ZELServerPropertyAccessor globalItems;
    const auto categories = [&] {
        ZELServerStringArray all;
        globalItems.getCategoryNames(all);
        return joined(all.entries(), [&](std::size_t i) { return all.items()[i]; });
    };
    run({
        {"service exists checks no characters", command("REP_SERVICEEXISTS", {{"serviceName", "a/b"}}), ok("true"),
         [&] { return outcome(manager.serviceExists(S("a/b"), fresh()), flag); }, 0, "1 "},
        {"services", command("REP_GET_SERVICES", {{"enableFilter", "All"}}),
         ok(R"(<R><SERVICE name="download"/><SERVICE name="s2"/></R>)"), servicesWith(nullptr), 0, "download,s2, "},
        {"services filter is exact", none, none, servicesWith(&lowerCase), msg::kRequiredValueMissing, "download,s2, "},
        {"a listed service works on the manager's connection", command("REP_ITEMREGISTERED", registration), ok("true"),
         [&] { return outcome(services.element(0)->itemRegistered(S("Samples"), S("a.zlw"), fresh()), flag); }, 0,
         "1 "},
        {"add service", command("REP_ADD_SERVICE", {{"serviceObject", added}}), ok("true"),
         [&] { return outcome(manager.addService(unsaved)); }, 0, ""},
        {"repository exists checks no characters", command("REP_REPOSITORYEXISTS", {{"repositoryName", "a/b"}}),
         ok("false"), [&] { return outcome(manager.repositoryExists(S("a/b"), fresh()), flag); }, 0, "0 "},
        {"repositories refuse directives", none, none,
         [&] { return outcome(manager.getRepositories(&lowerCase, repositories)); }, msg::kRequiredValueMissing, ""},
        {"repositories at any depth", command("REP_GET_REPOSITORIES", {{"enableFilter", "All"}}),
         ok(R"(<R><REPOSITORY name="Samples" description="d1"/><X><REPOSITORY name="Other"/></X></R>)"),
         [&] {
             return outcome(manager.getRepositories(nullptr, repositories), repositories,
                            [&] { return description(*repositories.element(0)); });
         },
         0, "Samples,Other, d1 "},
        {"a listed repository works on the manager's connection",
         command("REP_ITEMEXISTS", {{"repositoryName", "Other"}, {"itemName", "a.zlw"}}), ok("true"),
         [&] { return outcome(repositories.element(1)->itemExists(S("a.zlw"), fresh()), flag); }, 0, "1 "},
        {"global items only for exactly ALLITEMS", none, none,
         [&] { return outcome(manager.getGlobalItems(&lowerCase, globalItems), categories); }, 0, " "},
        {"global items", command("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}),
         ok(R"(<R><REPOSITORY name="Samples"><PROPERTY category="Samples" name="roads.zlw" value="1"/></REPOSITORY>)"
            R"(<PROPERTY category="Other" name="t.zlwt" value="4"/></R>)"),
         [&] { return outcome(manager.getGlobalItems(&allItems, globalItems), categories); }, 0, "Other,Samples, "},
        {"global items not XML", command("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}), ok("not xml"),
         [&] { return outcome(manager.getGlobalItems(&allItems, globalItems)); }, msg::kXmlFailure, ""},
        // A service's own commands.
        {"register a kind the service takes", command("REP_REGISTERITEM", registration), ok("true"),
         [&] { return outcome(service.registerItem(S("Samples"), S("a.zlw"))); }, 0, ""},
        {"a kind the service does not take", none, none,
         [&] { return outcome(service.registerItem(S("Samples"), S("report.zlwt"))); }, msg::kRegistrationRefused, ""},
        {"no name", none, none, [&] { return outcome(service.registerItem(S("Samples"), S(""))); },
         msg::kRequiredValueMissing, ""},
        {"registered items of one type",
         command("REP_GET_REGISTEREDITEMS", {{"serviceName", "download"}, {"itemType", "4"}}),
         ok(R"(<R><ITEM name="b.zlwt"/></R>)"),
         [&] { return outcome(service.getRegisteredItems(&templatesOnly, items)); }, 0, ""},
        // The property-accessor document is named after its command.
        {"service not saved yet",
         command(
             "REP_UPDATE_SERVICEPROPERTYACCESSOR",
             {{"serviceID", "-1"},
              {"propertyAccessorObject", xmlDocument("REP_UPDATE_SERVICEPROPERTYACCESSOR",
                                                     R"(<PROPERTY category="run" name="priority" value="high"/>)")}}),
         ok("true"), [&] { return outcome(service.updatePropertyAccessor(accessor)); }, 0, ""},
    });
}

// Every operation of a repository that takes an item name, with the names it also takes.
struct Call {
    const char* operation;
    bool takesResource;
    bool takesPath;
    std::function<IZELServerStatus*(IZELServerRepository&, const ZELServerString& item, const ZELServerString& resource,
                                    const ZELServerString& path)>
        call;
};

std::vector<Call> itemOperations()
{
    static unsigned flag = 0;
    return {
        {"itemExists", false, false, [](auto& r, auto& i, auto&, auto&) { return r.itemExists(i, flag); }},
        {"getItem", false, true, [](auto& r, auto& i, auto&, auto& p) { return r.getItem(i, p, flag); }},
        {"addItem", false, true, [](auto& r, auto& i, auto&, auto& p) { return r.addItem(i, p); }},
        {"updateItem", false, true, [](auto& r, auto& i, auto&, auto& p) { return r.updateItem(i, p); }},
        {"removeItem", false, false, [](auto& r, auto& i, auto&, auto&) { return r.removeItem(i, flag); }},
        {"itemResourceExists", true, false,
         [](auto& r, auto& i, auto& n, auto&) { return r.itemResourceExists(i, n, flag); }},
        {"getItemResource", true, true,
         [](auto& r, auto& i, auto& n, auto& p) { return r.getItemResource(i, n, p, flag); }},
        {"addItemResource", true, true, [](auto& r, auto& i, auto& n, auto& p) { return r.addItemResource(i, n, p); }},
        {"updateItemResource", true, true,
         [](auto& r, auto& i, auto& n, auto& p) { return r.updateItemResource(i, n, p); }},
        {"removeItemResource", true, false,
         [](auto& r, auto& i, auto& n, auto&) { return r.removeItemResource(i, n, flag); }},
    };
}

unsigned numberOf(IZELServerStatus* status) { return outcome(status).number; }

// The channel is never opened: a check that let a command through would answer "not connected".
TEST(RepositoryChecks, EmptyOrForbiddenNamesAreRefusedBeforeAnythingIsSent)
{
    ZELServerTCPIPChannel channel;
    ZELServerRepository repository(&channel, S("Samples"), S(""));
    const ZELServerString path = S("any");
    for (const Call& c : itemOperations()) {
        SCOPED_TRACE(c.operation);
        EXPECT_EQ(numberOf(c.call(repository, S(""), S("r.csv"), path)), msg::kRequiredValueMissing);
        if (c.takesResource) {
            EXPECT_EQ(numberOf(c.call(repository, S("a.zlw"), S(""), path)), msg::kRequiredValueMissing);
        }
        if (c.takesPath) {
            EXPECT_EQ(numberOf(c.call(repository, S("a.zlw"), S("r.csv"), S(""))), msg::kRequiredValueMissing);
        }
        // An empty name wins over a forbidden character in the other name.
        EXPECT_EQ(numberOf(c.call(repository, S(""), S("r/1"), path)), msg::kRequiredValueMissing);
        // updateItem deliberately lets any item name through.
        const std::string forbiddenHere = std::string(c.operation) == "updateItem" ? "" : kForbidden;
        for (const char forbidden : forbiddenHere) {
            const std::string bad = "a"s + forbidden + "b";
            EXPECT_EQ(numberOf(c.call(repository, S(bad), S("r.csv"), path)), msg::kForbiddenCharacter) << bad;
            if (c.takesResource) {
                EXPECT_EQ(numberOf(c.call(repository, S("a.zlw"), S(bad), path)), msg::kForbiddenCharacter) << bad;
            }
        }
    }
    ZELServerRepositoryManager manager(&channel);
    unsigned flag = 7;
    ZELServerWorkspace workspace(nullptr);
    ZELServerResource resource;
    ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
    ZELServerVector<IZELServerService, ZELServerService> services;
    ZELServerVector<IZELServerWorkspaceService, ZELServerWorkspaceService> registrations;
    const ZELServerStringDict unknown = dict({{"ENABLE_FILTER", "Enabled"}});
    const ZELServerStringDict spaced = dict({{"ENABLE_FILTER", "ENABLED "}});
    const ZELServerStringDict none = dict({{"OTHER", "x"}});
    for (IZELServerStatus* status : {
             manager.repositoryExists(S(""), flag),
             manager.serviceExists(S(""), flag),
             manager.getServices(&none, services),
             repository.registerWorkspaceService(S(""), S("svc")),
             repository.getWorkspaceView(S(""), workspace, flag),
             repository.getItemResourceView(S(""), S("r.csv"), resource, flag),
             repository.getWorkspacesView(&unknown, workspaces),
             repository.getWorkspacesView(&spaced, workspaces),
             repository.getWorkspacesView(&none, workspaces),
             repository.getWorkspaceServices(&unknown, registrations),
         }) {
        EXPECT_EQ(numberOf(status), msg::kRequiredValueMissing);
    }
    for (IZELServerStatus* status :
         {manager.getRepository(S("a/b"), repository, flag), manager.addRepository(S("a:b"), S("d")),
          manager.removeRepository(S("a%"), flag)}) {
        EXPECT_EQ(numberOf(status), msg::kForbiddenCharacter);
    }
    // Past the checks, the unopened channel answers; the flag is cleared.
    EXPECT_EQ(numberOf(repository.itemExists(S("a.zlw"), flag)), msg::kNotConnected);
    EXPECT_EQ(flag, 0u);
}

// The repository object model read from reply documents, the property accessor with the document
// the update commands send, and a service's registration flags. No connection needed.
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
  </WORKSPACE_DEFINITIONS>
</REP_GET_WORKSPACEVIEW>)";

TEST(WorkspaceReading, EveryPartLandsInItsPlace)
{
    ZELServerWorkspace workspace(nullptr);
    ASSERT_EQ(readWorkspaceReply(kWorkspaceDocument, nullptr, workspace), 0);
    EXPECT_TRUE(workspace.isEnabled());
    EXPECT_EQ(workspace.getFileSize(), 1234567);
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

    ZELServerVector<IZELServerWorkspace, ZELServerWorkspace> workspaces;
    EXPECT_EQ(readWorkspacesReply("not xml", nullptr, workspaces), static_cast<int>(msg::kXmlFailure));
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

    ZELServerItem item;
    // A 32-bit size holds what fits, a 64-bit one more; what does not convert or fit reads as zero.
    const std::pair<const char*, long long> sizes[] = {{"2147483647", 2147483647},
                                                       {"-2147483648", -2147483648LL},
                                                       {"2147483648", 0},
                                                       {"-2147483649", 0},
                                                       {"12abc", 0}};
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
    service.setRegistrationAllowed(4, 1);
    service.setRegistrationAllowed(5, 1);
    service.setRegistrationAllowed(0, 1);
    EXPECT_EQ(flags(), "0,0,0,0,1,0,");
    service.setWorkspaceRegistrationAllowed(9);
    service.setRegistrationAllowed(3, 1);
    EXPECT_EQ(flags(), "0,1,0,1,1,0,");
    service.setRegistrationAllowed(1, 0);
    EXPECT_EQ(service.isWorkspaceRegistrationAllowed(), 0u);
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

TEST(PropertyAccessor, LookupsAreExactAndDocumentsHoldEveryAttributeInByteOrder)
{
    ZELServerWorkspace workspace(nullptr);
    ASSERT_EQ(readWorkspaceReply(R"(<R><WORKSPACE_DEFINITIONS><PROPERTY category="run" name="n" value="v">)"
                                 R"(<ATTRIBUTE name="unit" value="1"/><ATTRIBUTE name="by" value="ann"/></PROPERTY>)"
                                 R"(<PROPERTY name="bare"/></WORKSPACE_DEFINITIONS></R>)",
                                 nullptr, workspace),
              0);
    IZELServerPropertyAccessor& accessor = workspace.getPropertyAccessor();
    accessor.setProperty(S("run"), S("n"), S("changed"));
    accessor.setProperty(S("a"), S("Y"), S("x & y"));
    accessor.setProperty(S("a"), S("b"), S("K\xf6ln"));
    ZELServerString value("stale");
    EXPECT_TRUE(accessor.getPropertyValue(S(""), S("bare"), value)) << "missing attributes are empty texts";
    EXPECT_EQ(value.str(), "");
    value.assign("stale");
    EXPECT_FALSE(accessor.getPropertyValue(S("Run"), S("n"), value)) << "names are exact";
    EXPECT_EQ(value.str(), "");
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
