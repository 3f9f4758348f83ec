// Repositories, items, resources, views, services, registrations and property accessors: every
// "REP_" command family with success and failure, and persistence across a restart.
#include <gtest/gtest.h>
#include <pugixml.hpp>

#include <chrono>
#include <thread>

#include "support/repository_fixture.h"

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

std::string service(const std::string& name, bool enabled, bool workspaces, bool templates) {
  auto f = [](bool b) { return b ? "true" : "false"; };
  return std::string("<REP_ADD_SERVICE><SERVICE service_id=\"-1\" name=\"") + name +
         "\" display_name=\"" + name + " service\" description=\"d\" url_pattern=\"/" + name +
         "\" is_enabled=\"" + f(enabled) + "\" is_workspace_reg_allowed=\"" + f(workspaces) +
         "\" is_customformat_reg_allowed=\"false\" is_customtransform_reg_allowed=\"false\" "
         "is_template_reg_allowed=\"" + f(templates) + "\"/></REP_ADD_SERVICE>";
}

std::string accessor(const std::string& root, const std::string& category,
                     const std::string& name, const std::string& value) {
  return "<" + root + "><PROPERTY category=\"" + category + "\" name=\"" + name +
         "\" value=\"" + value + "\"><ATTRIBUTE name=\"unit\" value=\"m\"/></PROPERTY></" + root +
         ">";
}

class Repository : public RepositoryFixture {
 protected:
  WireReply repo(const std::string& keyword, const Values& values = {}) {
    Values all = {{"repositoryName", "REPO"}};
    all.insert(all.end(), values.begin(), values.end());
    return admin_->command(keyword, all);
  }
  pugi::xml_node parse(const WireReply& reply) {
    EXPECT_TRUE(reply.ok()) << reply.body;
    EXPECT_TRUE(doc_.load_string(reply.body.c_str())) << reply.body;
    return doc_.document_element();
  }
  std::vector<std::string> names(pugi::xml_node root, const char* element,
                                 const char* attribute = "name") {
    std::vector<std::string> out;
    for (auto n : root.select_nodes((std::string("//") + element).c_str()))
      out.push_back(n.node().attribute(attribute).value());
    return out;
  }
  pugi::xml_document doc_;
};

using Names = std::vector<std::string>;

TEST_F(Repository, RepositoriesAreAddedListedAndRemoved) {
  EXPECT_EQ(admin_->command("REP_REPOSITORYEXISTS", {{"repositoryName", "REPO"}}).body, "true");
  EXPECT_EQ(admin_->command("REP_REPOSITORYEXISTS", {{"repositoryName", "NOPE"}}).body, "false");
  auto root = parse(admin_->command("REP_GET_REPOSITORIES", {{"enableFilter", "All"}}));
  EXPECT_EQ(names(root, "REPOSITORY"), Names{"REPO"});
  EXPECT_STREQ(root.child("REPOSITORY").attribute("description").value(), "Test repository");
  root = parse(admin_->command("REP_GET_REPOSITORY", {{"repositoryName", "NOPE"}}));
  EXPECT_FALSE(root.child("REPOSITORY"));

  auto add = [&](const std::string& name) {
    return admin_->command("REP_ADD_REPOSITORY",
                           {{"repositoryObject", "<REP_ADD_REPOSITORY><REPOSITORY name=\"" +
                                                     name + "\" description=\"\"/>"
                                                     "</REP_ADD_REPOSITORY>"}});
  };
  EXPECT_EQ(add("REPO").body, "repository 'REPO' already exists");
  EXPECT_EQ(add("a/b").body,
            "repository name 'a/b' holds the character '/', one of \\/:*?\"<>|&='+%");
  EXPECT_EQ(add("").body, "repository name is empty");
  EXPECT_EQ(admin_->command("REP_ADD_REPOSITORY", {{"repositoryObject", "<X/>"}}).body,
            "repositoryObject holds no REPOSITORY element");
  auto ann = connectAs("ann");
  EXPECT_EQ(ann->command("REP_REMOVE_REPOSITORY", {{"repositoryName", "REPO"}}).body,
            "Authorization Error: user 'ann' may not run REP_REMOVE_REPOSITORY");

  ASSERT_TRUE(addItem("a.zlx", "transformer").ok());
  std::size_t before = storedFiles();
  EXPECT_EQ(admin_->command("REP_REMOVE_REPOSITORY", {{"repositoryName", "REPO"}}).body, "true");
  EXPECT_EQ(storedFiles(), before - 1);
  EXPECT_EQ(admin_->command("REP_REMOVE_REPOSITORY", {{"repositoryName", "REPO"}}).body, "false");
  EXPECT_EQ(admin_->command("REP_ITEMEXISTS", {{"repositoryName", "REPO"}, {"itemName", "a.zlx"}})
                .body,
            "unknown repository 'REPO'");
}

TEST_F(Repository, ItemsAreUploadedReplacedDownloadedAndRemoved) {
  ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
  EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "roads.zlw"}}).body, "true");
  EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "other.zlw"}}).body, "false");
  // Refused before any content moves: the reply comes in place of the first acknowledgement.
  WireReply twice = addItem("roads.zlw", "x");
  EXPECT_EQ(twice.body, "item 'roads.zlw' already exists in 'REPO'");
  EXPECT_EQ(addItem("new.zlw", "x", "REP_UPDATE_ITEM").body,
            "item 'new.zlw' does not exist in 'REPO'");
  EXPECT_EQ(addItem("a:b", "x").body, "item name 'a:b' holds the character ':', one of "
                                      "\\/:*?\"<>|&='+%");

  std::string replacement = std::string(kRoads) + "echo more\n";
  ASSERT_TRUE(addItem("roads.zlw", replacement, "REP_UPDATE_ITEM").ok());
  Download down = admin_->download(
      "REP_GET_ITEM",
      {{"repositoryName", "REPO"}, {"itemName", "roads.zlw"}, {"itemFileCRCCheckingEnabled", "false"}});
  EXPECT_TRUE(down.gotFile);
  EXPECT_EQ(down.content, replacement);
  EXPECT_TRUE(down.reply.ok());
  EXPECT_EQ(storedFiles(), 1u);  // the replaced content is gone

  Download missing = admin_->download("REP_GET_ITEM",
                                      {{"repositoryName", "REPO"}, {"itemName", "none.zlw"}});
  EXPECT_FALSE(missing.gotFile);
  EXPECT_EQ(missing.reply.body, "unknown item 'none.zlw' in 'REPO'");

  EXPECT_EQ(repo("REP_REMOVE_ITEM", {{"itemName", "roads.zlw"}}).body, "true");
  EXPECT_EQ(repo("REP_REMOVE_ITEM", {{"itemName", "roads.zlw"}}).body, "false");
  EXPECT_EQ(storedFiles(), 0u);
  auto vic = connectAs("vic");
  EXPECT_EQ(vic->command("REP_REMOVE_ITEM", {{"repositoryName", "REPO"}, {"itemName", "x"}}).body,
            "Authorization Error: user 'vic' may not run REP_REMOVE_ITEM");
}

TEST_F(Repository, RefusedUploadsLeaveNothingBehind) {
  WireReply bad = addItem("bad.zlw", "# @title ok\n# @attribute x\n");
  EXPECT_EQ(bad.body, "bad workspace header: line 2: @attribute before any @featuretype");
  WireReply crc = admin_->upload("REP_ADD_ITEM",
                                 {{"repositoryName", "REPO"},
                                  {"itemName", "c.zds"},
                                  {"itemFileCRCCheckingEnabled", "true"}},
                                 "content", 12345u);
  EXPECT_EQ(crc.body.rfind("CRC mismatch", 0), 0u) << crc.body;
  // A client that vanishes in the middle of the content.
  TestClient gone;
  ASSERT_TRUE(gone.connect(port()));
  ASSERT_TRUE(gone.signIn("admin", "adminpw").ok());
  ASSERT_TRUE(gone.sendFrame(requestPayload(
      "REP_ADD_ITEM", {{"repositoryName", "REPO"}, {"itemName", "cut.zds"}})));
  ASSERT_TRUE(gone.readFrame());
  ASSERT_TRUE(gone.sendFrame("fileLength=100" + std::string(1, '\0') + "fileCRC=0"));
  ASSERT_TRUE(gone.readFrame());
  ASSERT_TRUE(gone.sendRaw("only part"));
  gone.close();
  // The server is still serving, and nothing of the three uploads was kept.
  EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "cut.zds"}}).body, "false");
  EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "bad.zlw"}}).body, "false");
  EXPECT_EQ(repo("REP_ITEMEXISTS", {{"itemName", "c.zds"}}).body, "false");
  // The connection thread discards the partial file once it notices the client is gone.
  auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
  while (storedFiles() != 0 && std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  EXPECT_EQ(storedFiles(), 0u);
}

TEST_F(Repository, ResourcesBelongToTheirItem) {
  ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
  ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "a,b\n").ok());
  EXPECT_EQ(addResource("roads.zlw", "lookup.csv", "x").body,
            "resource 'lookup.csv' already exists on 'roads.zlw'");
  EXPECT_EQ(addResource("roads.zlw", "roads.zlw", "x").body,
            "a resource cannot have the name of its item");
  EXPECT_EQ(addResource("none.zlw", "r", "x").body, "unknown item 'none.zlw' in 'REPO'");
  ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "a,b,c\n", "REP_UPDATE_ITEMRESOURCE").ok());
  EXPECT_EQ(repo("REP_ITEMRESOURCEEXISTS", {{"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}})
                .body,
            "true");
  Download down = admin_->download("REP_GET_ITEMRESOURCE", {{"repositoryName", "REPO"},
                                                            {"itemName", "roads.zlw"},
                                                            {"resourceName", "lookup.csv"}});
  EXPECT_EQ(down.content, "a,b,c\n");
  auto root = parse(repo("REP_GET_ITEMRESOURCEVIEW",
                         {{"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}}));
  EXPECT_STREQ(root.child("RESOURCE").attribute("filesize").value(), "6");
  root = parse(repo("REP_GET_ITEMRESOURCEVIEW", {{"itemName", "roads.zlw"}, {"resourceName", ""}}));
  EXPECT_FALSE(root.child("RESOURCE"));
  ASSERT_TRUE(addResource("roads.zlw", "style.txt", "s").ok());
  root = parse(repo("REP_GET_ITEMRESOURCESVIEW", {{"itemName", "roads.zlw"}, {"enableFilter", "All"}}));
  EXPECT_EQ(names(root, "RESOURCE"), (Names{"lookup.csv", "style.txt"}));
  EXPECT_EQ(repo("REP_REMOVE_ITEMRESOURCE", {{"itemName", "roads.zlw"}, {"resourceName", "style.txt"}})
                .body,
            "true");
  EXPECT_EQ(storedFiles(), 2u);
  // Removing the item takes its resources along.
  ASSERT_EQ(repo("REP_REMOVE_ITEM", {{"itemName", "roads.zlw"}}).body, "true");
  EXPECT_EQ(storedFiles(), 0u);
}

TEST_F(Repository, WorkspaceViewsComeFromTheHeader) {
  ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
  ASSERT_TRUE(addItem("off.zlw", "# @title Off\n# @enabled false\n").ok());
  ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "x").ok());
  auto root = parse(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}));
  pugi::xml_node ws = root.child("WORKSPACE_DEFINITIONS");
  EXPECT_STREQ(ws.attribute("title").value(), "Roads");
  EXPECT_STREQ(ws.attribute("description").value(), "Copies roads\nand checks them");
  EXPECT_STREQ(ws.attribute("is_enabled").value(), "true");
  EXPECT_EQ(std::string(ws.attribute("filesize").value()), std::to_string(std::string(kRoads).size()));
  std::string id = ws.attribute("workspace_id").value();
  pugi::xml_node mode = ws.find_child_by_attribute("PARAMETER", "name", "MODE");
  EXPECT_STREQ(mode.attribute("param_type").value(), "CHOICE");
  EXPECT_STREQ(mode.attribute("default_val").value(), "fast");
  EXPECT_STREQ(mode.attribute("options_type").value(), "SINGLECHOICE_CONFIG");
  EXPECT_STREQ(mode.attribute("options").value(), "fast%slow%exact");
  pugi::xml_node source = ws.child("DATASET");
  EXPECT_EQ(std::string(source.attribute("dataset_id").value()), id + ".1");
  EXPECT_STREQ(source.attribute("is_source").value(), "true");
  EXPECT_STREQ(source.attribute("location").value(), "/data/roads.csv");
  pugi::xml_node road = source.child("FEATURE_TYPE");
  EXPECT_EQ(std::string(road.attribute("feature_type_id").value()), id + ".1.1");
  EXPECT_EQ(names(road, "ATTRIBUTE"), (Names{"id", "length"}));
  pugi::xml_node length = road.find_child_by_attribute("ATTRIBUTE", "name", "length");
  EXPECT_STREQ(length.attribute("zel_type").value(), "zel_real64");
  EXPECT_STREQ(length.attribute("width").value(), "12");
  EXPECT_STREQ(length.attribute("decimals").value(), "3");
  EXPECT_STREQ(source.next_sibling("DATASET").attribute("is_source").value(), "false");
  EXPECT_EQ(names(ws, "RESOURCE"), Names{"lookup.csv"});

  root = parse(repo("REP_GET_WORKSPACESUMMARIESVIEW", {{"enableFilter", "All"}}));
  EXPECT_EQ(names(root, "WORKSPACE_SUMMARY"), (Names{"off.zlw", "roads.zlw"}));
  root = parse(repo("REP_GET_WORKSPACESUMMARIESVIEW", {{"enableFilter", "Disabled"}}));
  EXPECT_EQ(names(root, "WORKSPACE_SUMMARY"), Names{"off.zlw"});
  root = parse(repo("REP_GET_WORKSPACESVIEW", {{"enableFilter", "Enabled"}}));
  EXPECT_EQ(names(root, "WORKSPACE_DEFINITIONS"), Names{"roads.zlw"});
  EXPECT_EQ(repo("REP_GET_WORKSPACESVIEW", {{"enableFilter", "enabled"}}).body,
            "bad enableFilter 'enabled' (All, Enabled or Disabled)");
  root = parse(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "nope.zlw"}}));
  EXPECT_FALSE(root.first_child());
}

TEST_F(Repository, CustomFormatsTransformersAndTemplates) {
  ASSERT_TRUE(addItem("fmt.zds", "# @title Format\n# @description A format\n").ok());
  ASSERT_TRUE(addItem("tr.zlx", "binary\x01stuff").ok());
  ASSERT_TRUE(addItem("t.zlwt", "# @title Template\n").ok());
  ASSERT_TRUE(addItem("notes.txt", "plain").ok());
  struct Case {
    const char* list;
    const char* single;
    const char* valueName;
    const char* element;
    const char* name;
    const char* title;
  };
  for (const Case& c : {Case{"REP_GET_CUSTOMFORMATSVIEW", "REP_GET_CUSTOMFORMATVIEW",
                             "customFormatName", "CUSTOMFORMAT", "fmt.zds", "Format"},
                        Case{"REP_GET_CUSTOMTRANSFORMERSVIEW", "REP_GET_CUSTOMTRANSFORMERVIEW",
                             "customTransformerName", "CUSTOMTRANSFORMER", "tr.zlx", ""},
                        Case{"REP_GET_TEMPLATESVIEW", "REP_GET_TEMPLATEVIEW", "templateName",
                             "TEMPLATE", "t.zlwt", "Template"}}) {
    auto root = parse(repo(c.list, {{"enableFilter", "All"}}));
    EXPECT_EQ(names(root, c.element), Names{c.name}) << c.list;
    root = parse(repo(c.single, {{c.valueName, c.name}}));
    EXPECT_STREQ(root.child(c.element).attribute("title").value(), c.title) << c.single;
    // An item of another kind is not found under this view.
    root = parse(repo(c.single, {{c.valueName, "notes.txt"}}));
    EXPECT_FALSE(root.child(c.element)) << c.single;
  }
  auto root = parse(admin_->command("REP_GLOBAL_GET_ALL_ITEMS", {{"enableFilter", "All"}}));
  EXPECT_EQ(names(root, "PROPERTY"), (Names{"fmt.zds", "notes.txt", "t.zlwt", "tr.zlx"}));
  EXPECT_EQ(names(root, "PROPERTY", "value"),
            (Names{"CUSTOMFORMAT", "OTHER", "TEMPLATE", "CUSTOMTRANSFORMER"}));
  EXPECT_EQ(names(root, "PROPERTY", "category"), (Names{"REPO", "REPO", "REPO", "REPO"}));
}

TEST_F(Repository, ServicesAndRegistrations) {
  ASSERT_TRUE(admin_->command("REP_ADD_SERVICE", {{"serviceObject", service("run", true, true, false)}}).ok());
  ASSERT_TRUE(admin_->command("REP_ADD_SERVICE", {{"serviceObject", service("off", false, true, true)}}).ok());
  EXPECT_EQ(admin_->command("REP_ADD_SERVICE", {{"serviceObject", service("run", true, true, false)}}).body,
            "service 'run' already exists");
  EXPECT_EQ(admin_->command("REP_SERVICEEXISTS", {{"serviceName", "run"}}).body, "true");
  auto root = parse(admin_->command("REP_GET_SERVICES", {{"enableFilter", "Enabled"}}));
  EXPECT_EQ(names(root, "SERVICE"), Names{"run"});
  root = parse(admin_->command("REP_GET_SERVICES", {{"enableFilter", "All"}}));
  EXPECT_EQ(names(root, "SERVICE"), (Names{"off", "run"}));
  root = parse(admin_->command("REP_GET_SERVICE", {{"serviceName", "run"}}));
  pugi::xml_node run = root.child("SERVICE");
  EXPECT_STREQ(run.attribute("display_name").value(), "run service");
  EXPECT_STREQ(run.attribute("url_pattern").value(), "/run");
  EXPECT_STREQ(run.attribute("is_template_reg_allowed").value(), "false");
  EXPECT_NE(std::string(run.attribute("service_id").value()), "-1");
  ASSERT_TRUE(admin_->command("REP_UPDATE_SERVICE", {{"serviceObject", service("run", true, true, true)}}).ok());
  root = parse(admin_->command("REP_GET_SERVICE", {{"serviceName", "run"}}));
  EXPECT_STREQ(root.child("SERVICE").attribute("is_template_reg_allowed").value(), "true");
  EXPECT_EQ(admin_->command("REP_UPDATE_SERVICE", {{"serviceObject", service("zz", true, true, true)}}).body,
            "unknown service 'zz'");
  root = parse(admin_->command("REP_GET_SERVICE", {{"serviceName", "zz"}}));
  EXPECT_FALSE(root.child("SERVICE"));

  ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
  ASSERT_TRUE(addItem("t.zlwt", "template").ok());
  ASSERT_TRUE(addItem("fmt.zds", "format").ok());
  auto reg = [&](const char* keyword, const char* service, const char* valueName, const char* item) {
    return admin_->command(keyword, {{"serviceName", service},
                                     {"repositoryName", "REPO"},
                                     {valueName, item}});
  };
  ASSERT_TRUE(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "roads.zlw").ok());
  ASSERT_TRUE(reg("REP_REGISTER_WORKSPACESERVICE", "off", "workspaceName", "roads.zlw").ok());
  EXPECT_EQ(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "roads.zlw").body,
            "'REPO/roads.zlw' is already registered with 'run'");
  EXPECT_EQ(reg("REP_REGISTER_WORKSPACESERVICE", "run", "workspaceName", "t.zlwt").body,
            "'t.zlwt' is not a workspace");
  ASSERT_TRUE(reg("REP_REGISTERITEM", "run", "itemName", "t.zlwt").ok());
  EXPECT_EQ(reg("REP_REGISTERITEM", "run", "itemName", "fmt.zds").body,
            "service 'run' does not accept items of kind CUSTOMFORMAT ('fmt.zds')");
  EXPECT_EQ(reg("REP_ITEMREGISTERED", "run", "itemName", "t.zlwt").body, "true");
  EXPECT_EQ(reg("REP_ITEMREGISTERED", "off", "itemName", "t.zlwt").body, "false");
  EXPECT_EQ(reg("REP_WORKSPACESERVICEEXISTS", "off", "workspaceName", "roads.zlw").body, "true");

  root = parse(admin_->command("REP_GET_REGISTEREDITEMS", {{"serviceName", "run"}}));
  EXPECT_EQ(names(root, "ITEM"), (Names{"roads.zlw", "t.zlwt"}));
  EXPECT_STREQ(root.child("ITEM").attribute("title").value(), "Roads");
  EXPECT_STREQ(root.child("ITEM").attribute("repository_name").value(), "REPO");
  root = parse(admin_->command("REP_GET_REGISTEREDITEMS", {{"serviceName", "run"}, {"itemType", "4"}}));
  EXPECT_EQ(names(root, "ITEM"), Names{"t.zlwt"});
  EXPECT_EQ(admin_->command("REP_GET_REGISTEREDITEMS", {{"serviceName", "run"}, {"itemType", "9"}})
                .body.rfind("bad itemType '9'", 0),
            0u);

  root = parse(repo("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}}));
  EXPECT_EQ(names(root, "SERVICE"), (Names{"off", "run"}));
  root = parse(repo("REP_GET_WORKSPACESERVICES",
                    {{"enableFilter", "Enabled"}, {"workspaceName", "roads.zlw"}}));
  ASSERT_EQ(names(root, "WORKSPACE_SERVICE", "name").size(), 1u);
  EXPECT_STREQ(root.child("WORKSPACE_SERVICE").child("WORKSPACE_SUMMARY").attribute("name").value(),
               "roads.zlw");
  EXPECT_STREQ(root.child("WORKSPACE_SERVICE").child("SERVICE").attribute("name").value(), "run");
  root = parse(repo("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}, {"workspaceName", "x.zlw"}}));
  EXPECT_FALSE(root.first_child());

  EXPECT_EQ(reg("REP_DEREGISTER_WORKSPACESERVICE", "off", "workspaceName", "roads.zlw").body, "true");
  EXPECT_EQ(reg("REP_DEREGISTER_WORKSPACESERVICE", "off", "workspaceName", "roads.zlw").body, "false");
  EXPECT_EQ(reg("REP_DEREGISTERITEM", "run", "itemName", "t.zlwt").body, "true");
  EXPECT_EQ(reg("REP_REGISTERITEM", "nope", "itemName", "t.zlwt").body, "unknown service 'nope'");
  EXPECT_EQ(admin_->command("REP_REMOVE_SERVICE", {{"serviceName", "run"}}).body, "true");
  EXPECT_EQ(admin_->command("REP_REMOVE_SERVICE", {{"serviceName", "run"}}).body, "false");
  root = parse(repo("REP_GET_WORKSPACESERVICES", {{"enableFilter", "All"}}));
  EXPECT_FALSE(root.first_child());
  auto ann = connectAs("ann");
  EXPECT_EQ(ann->command("REP_ADD_SERVICE", {{"serviceObject", service("x", true, true, true)}}).body,
            "Authorization Error: user 'ann' may not run REP_ADD_SERVICE");
}

TEST_F(Repository, PropertyAccessors) {
  ASSERT_TRUE(admin_->command("REP_ADD_SERVICE", {{"serviceObject", service("run", true, true, false)}}).ok());
  ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
  auto root = parse(admin_->command("REP_GET_SERVICE", {{"serviceName", "run"}}));
  std::string serviceId = root.child("SERVICE").attribute("service_id").value();
  root = parse(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}));
  std::string ws = root.child("WORKSPACE_DEFINITIONS").attribute("workspace_id").value();

  struct Case {
    const char* keyword;
    const char* idName;
    std::string id;
  };
  for (const Case& c : {Case{"REP_UPDATE_SERVICEPROPERTYACCESSOR", "serviceID", serviceId},
                        Case{"REP_UPDATE_WORKSPACEPROPERTYACCESSOR", "workspaceID", ws},
                        Case{"REP_UPDATE_DATASETPROPERTYACCESSOR", "datasetID", ws + ".2"},
                        Case{"REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", "featureTypeID", ws + ".1.1"}}) {
    WireReply r = admin_->command(c.keyword, {{c.idName, c.id},
                                              {"propertyAccessorObject",
                                               accessor(c.keyword, "CAT", c.idName, "v1")}});
    EXPECT_TRUE(r.ok()) << c.keyword << ": " << r.body;
    WireReply unknown = admin_->command(c.keyword, {{c.idName, "999"},
                                                    {"propertyAccessorObject", accessor(c.keyword, "C", "n", "v")}});
    EXPECT_EQ(unknown.status, "ERROR") << c.keyword;
  }
  EXPECT_EQ(admin_->command("REP_UPDATE_DATASETPROPERTYACCESSOR",
                            {{"datasetID", ws + ".3"}, {"propertyAccessorObject", "<A/>"}})
                .body,
            "unknown dataset '" + ws + ".3'");
  root = parse(admin_->command("REP_GET_SERVICE", {{"serviceName", "run"}}));
  pugi::xml_node p = root.child("SERVICE").child("PROPERTY");
  EXPECT_STREQ(p.attribute("name").value(), "serviceID");
  EXPECT_STREQ(p.child("ATTRIBUTE").attribute("value").value(), "m");
  root = parse(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}));
  pugi::xml_node def = root.child("WORKSPACE_DEFINITIONS");
  EXPECT_STREQ(def.child("PROPERTY").attribute("name").value(), "workspaceID");
  pugi::xml_node destination = def.child("DATASET").next_sibling("DATASET");
  EXPECT_STREQ(destination.child("PROPERTY").attribute("name").value(), "datasetID");
  EXPECT_STREQ(def.child("DATASET").child("FEATURE_TYPE").child("PROPERTY").attribute("name").value(),
               "featureTypeID");
  // An update replaces the whole set.
  ASSERT_TRUE(admin_->command("REP_UPDATE_SERVICEPROPERTYACCESSOR",
                              {{"serviceID", serviceId},
                               {"propertyAccessorObject", "<REP_UPDATE_SERVICEPROPERTYACCESSOR/>"}})
                  .ok());
  root = parse(admin_->command("REP_GET_SERVICE", {{"serviceName", "run"}}));
  EXPECT_FALSE(root.child("SERVICE").child("PROPERTY"));
}

TEST_F(Repository, EverythingSurvivesARestart) {
  ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
  ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "a,b\n").ok());
  ASSERT_TRUE(admin_->command("REP_ADD_SERVICE", {{"serviceObject", service("run", true, true, false)}}).ok());
  ASSERT_TRUE(admin_->command("REP_REGISTER_WORKSPACESERVICE", {{"serviceName", "run"},
                                                                {"repositoryName", "REPO"},
                                                                {"workspaceName", "roads.zlw"}})
                  .ok());
  auto root = parse(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}));
  std::string ws = root.child("WORKSPACE_DEFINITIONS").attribute("workspace_id").value();
  ASSERT_TRUE(admin_->command("REP_UPDATE_WORKSPACEPROPERTYACCESSOR",
                              {{"workspaceID", ws}, {"propertyAccessorObject", accessor("A", "c", "n", "v")}})
                  .ok());
  // A stray file in the content directory (as a crash between rename and commit leaves) goes.
  writeFile(dataDir_ + "/store/orphan", "x");
  admin_.reset();
  startServer();
  admin_ = connectAs("admin");
  EXPECT_EQ(storedFiles(), 2u);
  EXPECT_EQ(admin_->command("REP_REPOSITORYEXISTS", {{"repositoryName", "REPO"}}).body, "true");
  Download down = admin_->download("REP_GET_ITEMRESOURCE", {{"repositoryName", "REPO"},
                                                            {"itemName", "roads.zlw"},
                                                            {"resourceName", "lookup.csv"}});
  EXPECT_EQ(down.content, "a,b\n");
  root = parse(repo("REP_GET_WORKSPACEVIEW", {{"workspaceName", "roads.zlw"}}));
  EXPECT_STREQ(root.child("WORKSPACE_DEFINITIONS").child("PROPERTY").attribute("value").value(), "v");
  EXPECT_EQ(admin_->command("REP_WORKSPACESERVICEEXISTS", {{"serviceName", "run"},
                                                           {"repositoryName", "REPO"},
                                                           {"workspaceName", "roads.zlw"}})
                .body,
            "true");
}

}  // namespace
}  // namespace zeltest
