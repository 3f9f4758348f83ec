// Repositories, items, resources, views, services, registrations and property accessors: every
// "REP_" command family with success and failure, and persistence across a restart.
#include <gtest/gtest.h>

#include <map>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

const char* kRoads = R"(#!/bin/sh
# A workspace that describes itself.
# @title Roads
# @description Copies roads
# @description and checks them
# @parameter SOURCE | FILENAME | in.dat | Where to read | FILEFILTER_CONFIG | *.dat
# @parameter MODE | CHOICE | fast | How | SINGLECHOICE_CONFIG | fast%slow%exact
# @source CSV | roads | /data/roads.csv
# @featuretype road | A road
# @attribute id | zel_int32 | 10 | 0
# @attribute length | zel_real64 | 12 | 3
# @destination GPKG | out | out.gpkg
# @featuretype line
echo copying
)";

// The view of kRoads as the first item of a fresh server with one resource "lookup.csv" of one
// byte, and the properties listed in `properties` by the id of their owner.
std::string roadsView(const std::map<std::string, std::string>& properties = {})
{
    auto at = [&](const char* id) {
        auto found = properties.find(id);
        return found == properties.end() ? std::string() : found->second;
    };
    return R"(<WORKSPACE_DEFINITIONS workspace_id="1" name="roads.zlw" title="Roads" )"
           R"(description="Copies roads&#10;and checks them" is_enabled="true" filesize="503">)"
           R"(<PARAMETER name="SOURCE" param_type="FILENAME" default_val="in.dat" )"
           R"(description="Where to read" options_type="FILEFILTER_CONFIG" options="*.dat"/>)"
           R"(<PARAMETER name="MODE" param_type="CHOICE" default_val="fast" description="How" )"
           R"(options_type="SINGLECHOICE_CONFIG" options="fast%slow%exact"/><DATASET )"
           R"(dataset_id="1.1" format="CSV" name="roads" location="/data/roads.csv" )"
           R"(is_source="true"><FEATURE_TYPE feature_type_id="1.1.1" name="road" )"
           R"(description="A road"><ATTRIBUTE name="id" zel_type="zel_int32" decimals="0" )"
           R"(width="10"/><ATTRIBUTE name="length" zel_type="zel_real64" decimals="3" width="12"/>)" +
           at("1.1.1") + "</FEATURE_TYPE>" + at("1.1") +
           R"(</DATASET><DATASET dataset_id="1.2" format="GPKG" name="out" location="out.gpkg" )"
           R"(is_source="false"><FEATURE_TYPE feature_type_id="1.2.1" name="line" description=""/>)" +
           at("1.2") + R"(</DATASET><RESOURCE name="lookup.csv" description="" filesize="1"/>)" + at("1") +
           "</WORKSPACE_DEFINITIONS>";
}

std::string service(const std::string& name, bool enabled, bool workspaces, bool templates)
{
    auto f = [](bool b) { return b ? "true" : "false"; };
    return std::string("<REP_ADD_SERVICE><SERVICE service_id=\"-1\" name=\"") + name + "\" display_name=\"" + name +
           " service\" description=\"d\" url_pattern=\"/" + name + "\" is_enabled=\"" + f(enabled) +
           "\" is_workspace_reg_allowed=\"" + f(workspaces) +
           "\" is_customformat_reg_allowed=\"false\" is_customtransform_reg_allowed=\"false\" "
           "is_template_reg_allowed=\"" +
           f(templates) + "\"/></REP_ADD_SERVICE>";
}

// A property with one attribute, as accessors send it and views list it.
std::string property(const std::string& name, const std::string& value)
{
    return "<PROPERTY category=\"CAT\" name=\"" + name + "\" value=\"" + value +
           "\"><ATTRIBUTE name=\"unit\" value=\"m\"/></PROPERTY>";
}

// The "name" attributes of the root's children.
std::vector<std::string> names(pugi::xml_node root)
{
    std::vector<std::string> out;
    for (pugi::xml_node child : root.children())
        out.push_back(child.attribute("name").value());
    return out;
}

using Names = std::vector<std::string>;

class Repository : public RepositoryFixture {
protected:
    WireReply repo(const std::string& keyword, const Values& values = {})
    {
        Values all = {{"repositoryName", "REPO"}};
        all.insert(all.end(), values.begin(), values.end());
        return admin_->command(keyword, all);
    }
    WireReply admin(const std::string& keyword, const Values& values) { return admin_->command(keyword, values); }
    // A registration command naming the service, REPO and an item under `valueName`.
    WireReply reg(const char* keyword, const char* service, const char* valueName, const char* item)
    {
        return repo(keyword, {{"serviceName", service}, {valueName, item}});
    }
};

TEST_F(Repository, RepositoriesAreAddedListedAndRemoved)
{
    EXPECT_EQ(admin("REP_REPOSITORYEXISTS", {{"repositoryName", "REPO"}}).body, "true");
    EXPECT_EQ(admin("REP_REPOSITORYEXISTS", {{"repositoryName", "NOPE"}}).body, "false");
    const std::string element = R"(<REPOSITORY name="REPO" description="Test repository"/>)";
    EXPECT_EQ(admin("REP_GET_REPOSITORIES", {{"enableFilter", "All"}}).body,
              document("<REP_GET_REPOSITORIES>" + element + "</REP_GET_REPOSITORIES>"));
    EXPECT_EQ(repo("REP_GET_REPOSITORY").body, document("<REP_GET_REPOSITORY>" + element + "</REP_GET_REPOSITORY>"));
    EXPECT_EQ(admin("REP_GET_REPOSITORY", {{"repositoryName", "NOPE"}}).body, document("<REP_GET_REPOSITORY/>"));

    auto add = [&](const std::string& name) {
        return admin("REP_ADD_REPOSITORY", {{"repositoryObject", "<R><REPOSITORY name=\"" + name + "\"/></R>"}}).body;
    };
    EXPECT_EQ(add("REPO"), "repository 'REPO' already exists");
    EXPECT_EQ(add("a/b"), "repository name 'a/b' holds the character '/', one of \\/:*?\"<>|&='+%");
    EXPECT_EQ(add(""), "repository name is empty");
    EXPECT_EQ(admin("REP_ADD_REPOSITORY", {{"repositoryObject", "<X/>"}}).body,
              "repositoryObject holds no REPOSITORY element");
    EXPECT_EQ(connectAs("ann")->command("REP_REMOVE_REPOSITORY", {{"repositoryName", "REPO"}}).body,
              "Authorization Error: user 'ann' may not run REP_REMOVE_REPOSITORY");

    ASSERT_TRUE(addItem("a.zlx", "transformer").ok());
    // One property per item: repository, name and kind, with the details as attributes.
    EXPECT_EQ(withoutTimes(admin("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}).body),
              document(R"(<REP_GLOBAL_GET_ALL_ITEMS><PROPERTY category="REPO" name="a.zlx" )"
                       R"(value="CUSTOMTRANSFORMER"><ATTRIBUTE name="title" value=""/><ATTRIBUTE )"
                       R"(name="description" value=""/><ATTRIBUTE name="filesize" value="11"/>)"
                       R"(<ATTRIBUTE name="lastsavedate" value="TIME"/></PROPERTY>)"
                       R"(</REP_GLOBAL_GET_ALL_ITEMS>)"));
    EXPECT_EQ(storedFiles(), 1u);
    EXPECT_EQ(repo("REP_REMOVE_REPOSITORY").body, "true");
    EXPECT_EQ(storedFiles(), 0u);
    EXPECT_EQ(repo("REP_REMOVE_REPOSITORY").body, "false");
    EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "a.zlx"}}).body, "unknown repository 'REPO'");
}

TEST_F(Repository, ItemsAreUploadedReplacedDownloadedAndRemoved)
{
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "roads.zlw"}}).body, "true");
    EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "other.zlw"}}).body, "false");
    // Refused before any content moves: the reply comes in place of the first acknowledgement.
    EXPECT_EQ(addItem("roads.zlw", "x").body, "item 'roads.zlw' already exists in 'REPO'");
    EXPECT_EQ(addItem("new.zlw", "x", "REP_UPDATE_ITEM").body, "item 'new.zlw' does not exist in 'REPO'");
    EXPECT_EQ(addItem("a:b", "x").body, "item name 'a:b' holds the character ':', one of \\/:*?\"<>|&='+%");

    std::string replacement = std::string(kRoads) + "echo more\n";
    ASSERT_TRUE(addItem("roads.zlw", replacement, "REP_UPDATE_ITEM").ok());
    Download down = admin_->download(
        "REP_GET_ITEM",
        {{"repositoryName", "REPO"}, {"itemName", "roads.zlw"}, {"itemFileCRCCheckingEnabled", "false"}});
    EXPECT_TRUE(down.gotFile);
    EXPECT_EQ(down.content, replacement);
    EXPECT_TRUE(down.reply.ok());
    EXPECT_EQ(storedFiles(), 1u);  // the replaced content is gone
    // A refusal is one "ERROR" frame in place of the file header; the connection stays in step.
    Download missing = admin_->download("REP_GET_ITEM", {{"repositoryName", "REPO"}, {"itemName", "none.zlw"}});
    EXPECT_FALSE(missing.gotFile);
    EXPECT_EQ(missing.reply.body, "unknown item 'none.zlw' in 'REPO'");

    EXPECT_EQ(repo("REP_REMOVE_ITEM", {{"itemName", "roads.zlw"}}).body, "true");
    EXPECT_EQ(repo("REP_REMOVE_ITEM", {{"itemName", "roads.zlw"}}).body, "false");
    EXPECT_EQ(storedFiles(), 0u);
    EXPECT_EQ(connectAs("vic")->command("REP_REMOVE_ITEM", {{"repositoryName", "REPO"}}).body,
              "Authorization Error: user 'vic' may not run REP_REMOVE_ITEM");
}

TEST_F(Repository, RefusedUploadsLeaveNothingBehind)
{
    EXPECT_EQ(addItem("bad.zlw", "# @title ok\n# @attribute x\n").body,
              "bad workspace header: line 2: @attribute before any @featuretype");
    WireReply crc = admin_->upload(
        "REP_ADD_ITEM", {{"repositoryName", "REPO"}, {"itemName", "c.zds"}, {"itemFileCRCCheckingEnabled", "true"}},
        "content", 12345u);
    EXPECT_EQ(crc.body.rfind("CRC mismatch", 0), 0u) << crc.body;
    // A client that vanishes in the middle of the content.
    TestClient gone;
    ASSERT_TRUE(gone.connect(port()));
    ASSERT_TRUE(gone.signIn("admin", "adminpw").ok());
    ASSERT_TRUE(gone.sendFrame(requestPayload("REP_ADD_ITEM", {{"repositoryName", "REPO"}, {"itemName", "cut.zds"}})));
    ASSERT_TRUE(gone.readFrame());
    ASSERT_TRUE(gone.sendFrame("fileLength=100" + std::string(1, '\0') + "fileCRC=0"));
    ASSERT_TRUE(gone.readFrame());
    ASSERT_TRUE(gone.sendRaw("only part"));
    gone.close();
    // The server is still serving, and nothing of the three uploads was kept.
    for (const char* name : {"cut.zds", "bad.zlw", "c.zds"})
        EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", name}}).body, "false") << name;
    EXPECT_TRUE(eventually([&] { return storedFiles() == 0; }));
}

TEST_F(Repository, ResourcesBelongToTheirItem)
{
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "a,b\n").ok());
    EXPECT_EQ(addResource("roads.zlw", "lookup.csv", "x").body, "resource 'lookup.csv' already exists on 'roads.zlw'");
    EXPECT_EQ(addResource("roads.zlw", "new.csv", "x", "REP_UPDATE_ITEMRESOURCE").body,
              "resource 'new.csv' does not exist on 'roads.zlw'");
    EXPECT_EQ(addResource("roads.zlw", "roads.zlw", "x").body, "a resource cannot have the name of its item");
    EXPECT_EQ(addResource("none.zlw", "r", "x").body, "unknown item 'none.zlw' in 'REPO'");
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "a,b,c\n", "REP_UPDATE_ITEMRESOURCE").ok());
    const Values lookup = {{"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}};
    EXPECT_EQ(repo("REP_ITEMRESOURCEEXISTS", lookup).body, "true");
    EXPECT_EQ(repo("REP_ITEMRESOURCEEXISTS", {{"itemName", "roads.zlw"}}).body, "missing value \"resourceName\"");
    Download down =
        admin_->download("REP_GET_ITEMRESOURCE",
                         {{"repositoryName", "REPO"}, {"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}});
    EXPECT_EQ(down.content, "a,b,c\n");
    const std::string element = R"(<RESOURCE name="lookup.csv" description="" filesize="6"/>)";
    EXPECT_EQ(repo("REP_GET_ITEMRESOURCEVIEW", lookup).body,
              document("<REP_GET_ITEMRESOURCEVIEW>" + element + "</REP_GET_ITEMRESOURCEVIEW>"));
    EXPECT_EQ(repo("REP_GET_ITEMRESOURCEVIEW", {{"itemName", "roads.zlw"}}).body,
              document("<REP_GET_ITEMRESOURCEVIEW/>"));
    ASSERT_TRUE(addResource("roads.zlw", "style.txt", "s").ok());
    EXPECT_EQ(repo("REP_GET_ITEMRESOURCESVIEW", {{"itemName", "roads.zlw"}}).body,
              document("<REP_GET_ITEMRESOURCESVIEW>" + element +
                       R"(<RESOURCE name="style.txt" description="" filesize="1"/>)"
                       "</REP_GET_ITEMRESOURCESVIEW>"));
    const Values style = {{"itemName", "roads.zlw"}, {"resourceName", "style.txt"}};
    EXPECT_EQ(repo("REP_REMOVE_ITEMRESOURCE", style).body, "true");
    EXPECT_EQ(storedFiles(), 2u);
    // Removing the item takes its resources along.
    ASSERT_EQ(repo("REP_REMOVE_ITEM", {{"itemName", "roads.zlw"}}).body, "true");
    EXPECT_EQ(storedFiles(), 0u);
}

TEST_F(Repository, WorkspaceViewsComeFromTheHeader)
{
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addItem("off.zlw", "# @title Off\n# @enabled false\n").ok());
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "x").ok());
    std::string roads = roadsView();
    EXPECT_EQ(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}).body,
              document("<REP_GET_WORKSPACEVIEW>" + roads + "</REP_GET_WORKSPACEVIEW>"));
    EXPECT_EQ(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "nope.zlw"}}).body,
              document("<REP_GET_WORKSPACEVIEW/>"));

    const std::string off = R"(<WORKSPACE_SUMMARY name="off.zlw" title="Off" description="" )"
                            R"(is_enabled="false"/>)";
    const std::string on = R"(<WORKSPACE_SUMMARY name="roads.zlw" title="Roads" )"
                           R"(description="Copies roads&#10;and checks them" is_enabled="true"/>)";
    struct Case {
        const char* keyword;
        const char* filter;
        std::string elements;
    };
    for (const Case& c :
         {Case{"REP_GET_WORKSPACESUMMARIESVIEW", "All", off + on},
          Case{"REP_GET_WORKSPACESUMMARIESVIEW", "Disabled", off}, Case{"REP_GET_WORKSPACESVIEW", "Enabled", roads}}) {
        EXPECT_EQ(repo(c.keyword, {{"enableFilter", c.filter}}).body,
                  document("<" + std::string(c.keyword) + ">" + c.elements + "</" + c.keyword + ">"));
    }
    EXPECT_EQ(repo("REP_GET_WORKSPACESVIEW", {{"enableFilter", "enabled"}}).body,
              "bad enableFilter 'enabled' (All, Enabled or Disabled)");
}

TEST_F(Repository, CustomFormatsTransformersAndTemplates)
{
    ASSERT_TRUE(addItem("fmt.zds", "# @title Format\n# @description A format\n").ok());
    ASSERT_TRUE(addItem("tr.zlx", "binary\x01stuff").ok());
    ASSERT_TRUE(addItem("t.zlwt", "# @title Template\n").ok());
    ASSERT_TRUE(addItem("notes.txt", "plain").ok());
    struct Case {
        std::string list, single, valueName, name, element;
    };
    for (const Case& c : {Case{"CUSTOMFORMATSVIEW", "CUSTOMFORMATVIEW", "customFormatName", "fmt.zds",
                               R"(<CUSTOMFORMAT name="fmt.zds" title="Format" description="A format" )"
                               R"(filesize="40"/>)"},
                          Case{"CUSTOMTRANSFORMERSVIEW", "CUSTOMTRANSFORMERVIEW", "customTransformerName", "tr.zlx",
                               R"(<CUSTOMTRANSFORMER name="tr.zlx" title="" description="" filesize="12"/>)"},
                          Case{"TEMPLATESVIEW", "TEMPLATEVIEW", "templateName", "t.zlwt",
                               R"(<TEMPLATE name="t.zlwt" title="Template" description="" filesize="18"/>)"}}) {
        auto reply = [](const std::string& root, const std::string& content) {
            return document("<REP_GET_" + root + ">" + content + "</REP_GET_" + root + ">");
        };
        EXPECT_EQ(repo("REP_GET_" + c.list).body, reply(c.list, c.element));
        EXPECT_EQ(repo("REP_GET_" + c.single, {{c.valueName, c.name}}).body, reply(c.single, c.element));
        // An item of another kind is not found under this view.
        EXPECT_EQ(repo("REP_GET_" + c.single, {{c.valueName, "notes.txt"}}).body,
                  document("<REP_GET_" + c.single + "/>"));
    }
}

TEST_F(Repository, ServicesAndRegistrations)
{
    auto put = [&](const char* keyword, const std::string& object) {
        return admin(keyword, {{"serviceObject", object}}).body;
    };
    ASSERT_EQ(put("REP_ADD_SERVICE", service("run", true, true, false)), "true");
    ASSERT_EQ(put("REP_ADD_SERVICE", service("off", false, true, true)), "true");
    EXPECT_EQ(put("REP_ADD_SERVICE", service("run", true, true, false)), "service 'run' already exists");
    EXPECT_EQ(put("REP_UPDATE_SERVICE", service("zz", true, true, true)), "unknown service 'zz'");
    EXPECT_EQ(admin("REP_SERVICEEXISTS", {{"serviceName", "run"}}).body, "true");
    // The id is the server's: the client's "-1" only marks a new object.
    auto element = [](const char* templates) {
        return R"(<SERVICE service_id="1" name="run" display_name="run service" description="d" )"
               R"(url_pattern="/run" is_enabled="true" is_workspace_reg_allowed="true" )"
               R"(is_customformat_reg_allowed="false" is_customtransform_reg_allowed="false" )"
               R"(is_template_reg_allowed=")" +
               std::string(templates) + "\"/>";
    };
    EXPECT_EQ(admin("REP_GET_SERVICE", {{"serviceName", "run"}}).body,
              document("<REP_GET_SERVICE>" + element("false") + "</REP_GET_SERVICE>"));
    ASSERT_EQ(put("REP_UPDATE_SERVICE", service("run", true, true, true)), "true");
    const std::string run = element("true");
    EXPECT_EQ(admin("REP_GET_SERVICES", {{"enableFilter", "Enabled"}}).body,
              document("<REP_GET_SERVICES>" + run + "</REP_GET_SERVICES>"));
    EXPECT_EQ(names(parse(admin("REP_GET_SERVICES", {{"enableFilter", "All"}}))), (Names{"off", "run"}));
    EXPECT_EQ(admin("REP_GET_SERVICE", {{"serviceName", "zz"}}).body, document("<REP_GET_SERVICE/>"));

    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addItem("t.zlwt", "# @title T\n").ok());
    ASSERT_TRUE(addItem("fmt.zds", "format").ok());
    ASSERT_TRUE(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "roads.zlw").ok());
    ASSERT_TRUE(reg("REP_REGISTER_WORKSPACESERVICE", "off", "workspaceName", "roads.zlw").ok());
    EXPECT_EQ(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "roads.zlw").body,
              "'REPO/roads.zlw' is already registered with 'run'");
    EXPECT_EQ(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "t.zlwt").body,
              "'t.zlwt' is not a workspace");
    ASSERT_TRUE(reg("REP_REGISTERITEM", "run", "itemName", "t.zlwt").ok());
    EXPECT_EQ(reg("REP_REGISTERITEM", "run", "itemName", "fmt.zds").body,
              "service 'run' does not accept items of kind CUSTOMFORMAT ('fmt.zds')");
    EXPECT_EQ(reg("REP_REGISTERITEM", "nope", "itemName", "t.zlwt").body, "unknown service 'nope'");
    EXPECT_EQ(reg("REP_REGISTERITEM", "run", "itemName", "none").body, "unknown item 'none' in 'REPO'");
    EXPECT_EQ(reg("REP_ITEMREGISTERED", "run", "itemName", "t.zlwt").body, "true");
    EXPECT_EQ(reg("REP_ITEMREGISTERED", "off", "itemName", "t.zlwt").body, "false");
    EXPECT_EQ(reg("REP_WORKSPACESERVICEEXISTS", "off", "workspaceName", "roads.zlw").body, "true");

    EXPECT_EQ(names(parse(admin("REP_GET_REGISTEREDITEMS", {{"serviceName", "run"}}))), (Names{"roads.zlw", "t.zlwt"}));
    EXPECT_EQ(withoutTimes(admin("REP_GET_REGISTEREDITEMS", {{"serviceName", "run"}, {"itemType", "4"}}).body),
              document(R"(<REP_GET_REGISTEREDITEMS><ITEM name="t.zlwt" repository_name="REPO" )"
                       R"(title="T" description="" filesize="11" category="" requirements="" )"
                       R"(requirementskeyword="" usage="" history="" lastsavedate="TIME" )"
                       R"(lastsavebuild="zelserverd 0.1.0" buildnumber="0" )"
                       R"(legaltermsconditions=""/></REP_GET_REGISTEREDITEMS>)"));
    EXPECT_EQ(admin("REP_GET_REGISTEREDITEMS", {{"serviceName", "run"}, {"itemType", "9"}}).body,
              "bad itemType '9' (0 to 4, or WORKSPACE, CUSTOMFORMAT, CUSTOMTRANSFORMER, TEMPLATE, "
              "OTHER)");

    auto pairs = parse(repo("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}}));
    EXPECT_EQ(std::distance(pairs.begin(), pairs.end()), 2);
    EXPECT_EQ(repo("REP_GET_WORKSPACESERVICES", {{"enableFilter", "Enabled"}, {"workspaceName", "roads.zlw"}}).body,
              document(R"(<REP_GET_WORKSPACESERVICES><WORKSPACE_SERVICE><WORKSPACE_SUMMARY )"
                       R"(name="roads.zlw" title="Roads" description="Copies roads&#10;and )"
                       R"(checks them" is_enabled="true"/>)" +
                       run + "</WORKSPACE_SERVICE></REP_GET_WORKSPACESERVICES>"));
    EXPECT_EQ(repo("REP_GET_WORKSPACESERVICES", {{"workspaceName", "x.zlw"}}).body,
              document("<REP_GET_WORKSPACESERVICES/>"));

    auto deregister = [&](const char* service) {
        return reg("REP_DEREGISTER_WORKSPACESERVICE", service, "workspaceName", "roads.zlw").body;
    };
    EXPECT_EQ(deregister("off"), "true");
    EXPECT_EQ(deregister("off"), "false");
    EXPECT_EQ(reg("REP_DEREGISTERITEM", "run", "itemName", "t.zlwt").body, "true");
    EXPECT_EQ(admin("REP_REMOVE_SERVICE", {{"serviceName", "run"}}).body, "true");
    EXPECT_EQ(admin("REP_REMOVE_SERVICE", {{"serviceName", "run"}}).body, "false");
    EXPECT_EQ(repo("REP_GET_WORKSPACESERVICES").body, document("<REP_GET_WORKSPACESERVICES/>"));
    auto ann = connectAs("ann");
    EXPECT_EQ(ann->command("REP_ADD_SERVICE", {{"serviceObject", service("x", 1, 1, 1)}}).body,
              "Authorization Error: user 'ann' may not run REP_ADD_SERVICE");
}

// Properties set through the accessors appear in the views and, with everything else, survive a
// restart; an update replaces the whole set of its owner.
TEST_F(Repository, PropertyAccessorsAndEverythingSurviveARestart)
{
    ASSERT_TRUE(admin("REP_ADD_SERVICE", {{"serviceObject", service("run", true, true, false)}}).ok());
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "x").ok());
    ASSERT_TRUE(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "roads.zlw").ok());
    struct Case {
        const char *keyword, *idName, *id, *unknownId, *unknown;
    };
    for (const Case& c :
         {Case{"REP_UPDATE_SERVICEPROPERTYACCESSOR", "serviceID", "1", "999", "unknown service id '999'"},
          Case{"REP_UPDATE_WORKSPACEPROPERTYACCESSOR", "workspaceID", "1", "2", "unknown workspace '2'"},
          Case{"REP_UPDATE_DATASETPROPERTYACCESSOR", "datasetID", "1.2", "1.3", "unknown dataset '1.3'"},
          Case{"REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", "featureTypeID", "1.1.1", "1.1.2",
               "unknown featuretype '1.1.2'"}}) {
        auto update = [&](const char* id) {
            return admin(c.keyword,
                         {{c.idName, id}, {"propertyAccessorObject", "<A>" + property(c.idName, id) + "</A>"}});
        };
        EXPECT_EQ(update(c.id).body, "true") << c.keyword;
        EXPECT_EQ(update(c.unknownId).body, c.unknown);
    }
    // A stray file in the content directory (as a crash between rename and commit leaves) goes.
    writeFile(dataDir_ + "/store/orphan", "x");
    restart();
    EXPECT_EQ(storedFiles(), 2u);
    EXPECT_EQ(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}).body,
              document("<REP_GET_WORKSPACEVIEW>" +
                       roadsView({{"1", property("workspaceID", "1")},
                                  {"1.2", property("datasetID", "1.2")},
                                  {"1.1.1", property("featureTypeID", "1.1.1")}}) +
                       "</REP_GET_WORKSPACEVIEW>"));
    EXPECT_EQ(reg("REP_WORKSPACESERVICEEXISTS", "run", "workspaceName", "roads.zlw").body, "true");
    Download down =
        admin_->download("REP_GET_ITEMRESOURCE",
                         {{"repositoryName", "REPO"}, {"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}});
    EXPECT_EQ(down.content, "x");
    auto root = parse(admin("REP_GET_SERVICE", {{"serviceName", "run"}}));
    EXPECT_STREQ(root.child("SERVICE").first_child().attribute("name").value(), "serviceID");
    ASSERT_TRUE(
        admin("REP_UPDATE_SERVICEPROPERTYACCESSOR", {{"serviceID", "1"}, {"propertyAccessorObject", "<EMPTY/>"}}).ok());
    root = parse(admin("REP_GET_SERVICE", {{"serviceName", "run"}}));
    EXPECT_FALSE(root.child("SERVICE").first_child());
}

}  // namespace
}  // namespace zeltest
