// Every command family as conversations of (user, request -> exact reply): the documents the server
// writes, its refusals, rights, and what a command leaves on disk. Whether each operation succeeds or
// is refused through the library is the end-to-end suites' part.
#include <gtest/gtest.h>

#include <filesystem>
#include <regex>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

namespace fs = std::filesystem;

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

// One request of a conversation and the reply body it must get, time stamps read as "TIME".
struct Exchange {
    const char* user;
    std::string keyword;
    Values values;
    std::string reply;
};

class Commands : public ServerFixture {
protected:
    void converse(const std::vector<Exchange>& exchanges)
    {
        for (const Exchange& e : exchanges) {
            auto& client = clients_[e.user];
            if (!client)
                client = connectAs(e.user);
            EXPECT_EQ(withoutTimes(client->command(e.keyword, e.values).body), e.reply) << e.user << " " << e.keyword;
        }
    }
    WireReply addResource(const std::string& item, const std::string& name, const std::string& content,
                          const std::string& keyword = "REP_ADD_ITEMRESOURCE")
    {
        return admin_->upload(keyword, {{"repositoryName", "REPO"}, {"itemName", item}, {"resourceName", name}},
                              content);
    }

    std::map<std::string, std::unique_ptr<TestClient>> clients_;
};

// `values` with the repository REPO first.
Values repo(Values values)
{
    values.insert(values.begin(), {"repositoryName", "REPO"});
    return values;
}

// `elements` in a reply document named after `keyword`; an empty one without elements.
std::string reply(const std::string& keyword, const std::string& elements = "")
{
    return document(elements.empty() ? "<" + keyword + "/>" : "<" + keyword + ">" + elements + "</" + keyword + ">");
}

std::string service(const std::string& name, bool enabled, bool templates)
{
    auto f = [](bool b) { return b ? "true" : "false"; };
    return std::string("<REP_ADD_SERVICE><SERVICE service_id=\"-1\" name=\"") + name + "\" display_name=\"" + name +
           " service\" description=\"d\" url_pattern=\"/" + name + "\" is_enabled=\"" + f(enabled) +
           "\" is_workspace_reg_allowed=\"true\" is_customformat_reg_allowed=\"false\" "
           "is_customtransform_reg_allowed=\"false\" is_template_reg_allowed=\"" +
           f(templates) + "\"/></REP_ADD_SERVICE>";
}

// A property with one attribute, as accessors send it and views list it.
std::string property(const std::string& name, const std::string& value)
{
    return "<PROPERTY category=\"CAT\" name=\"" + name + "\" value=\"" + value +
           "\"><ATTRIBUTE name=\"unit\" value=\"m\"/></PROPERTY>";
}

TEST_F(Commands, RepositoriesItemsAndResources)
{
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "a,b\n").ok());
    const std::string bad = "holds the character ':', one of \\/:*?\"<>|&='+%";
    const struct {
        std::string keyword, item, resource, reply;
    } uploads[] = {
        {"REP_ADD_ITEM", "roads.zlw", "", "item 'roads.zlw' already exists in 'REPO'"},
        {"REP_UPDATE_ITEM", "new.zlw", "", "item 'new.zlw' does not exist in 'REPO'"},
        {"REP_ADD_ITEM", "a:b", "", "item name 'a:b' " + bad},
        {"REP_ADD_ITEM", "bad.zlw", "", "bad workspace header: line 1: @attribute before any @featuretype"},
        {"REP_ADD_ITEMRESOURCE", "roads.zlw", "lookup.csv", "resource 'lookup.csv' already exists on 'roads.zlw'"},
        {"REP_UPDATE_ITEMRESOURCE", "roads.zlw", "new.csv", "resource 'new.csv' does not exist on 'roads.zlw'"},
        {"REP_ADD_ITEMRESOURCE", "roads.zlw", "roads.zlw", "a resource cannot have the name of its item"},
        {"REP_ADD_ITEMRESOURCE", "none.zlw", "r", "unknown item 'none.zlw' in 'REPO'"},
        {"REP_UPDATE_ITEMRESOURCE", "roads.zlw", "lookup.csv", "true"},
    };
    for (const auto& u : uploads) {
        WireReply got = u.resource.empty() ? addItem(u.item, "# @attribute x\n", u.keyword)
                                           : addResource(u.item, u.resource, "a,b,c\n", u.keyword);
        EXPECT_EQ(got.body, u.reply) << u.keyword << " " << u.item;
    }
    WireReply crc = admin_->upload(
        "REP_ADD_ITEM", repo({{"itemName", "c.zds"}, {"itemFileCRCCheckingEnabled", "true"}}), "content", 12345u);
    EXPECT_EQ(crc.body.rfind("CRC mismatch", 0), 0u) << crc.body;

    const std::string repository = R"(<REPOSITORY name="REPO" description="Test repository"/>)";
    const std::string resource = R"(<RESOURCE name="lookup.csv" description="" filesize="6"/>)";
    const Values lookup = repo({{"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}});
    auto add = [](const std::string& name) {
        return Values{{"repositoryObject", "<R><REPOSITORY name=\"" + name + "\"/></R>"}};
    };
    converse({
        {"admin", "REP_GET_REPOSITORIES", {{"enableFilter", "All"}}, reply("REP_GET_REPOSITORIES", repository)},
        {"admin", "REP_GET_REPOSITORY", repo({}), reply("REP_GET_REPOSITORY", repository)},
        {"admin", "REP_GET_REPOSITORY", {{"repositoryName", "NOPE"}}, reply("REP_GET_REPOSITORY")},
        {"admin", "REP_ADD_REPOSITORY", add("REPO"), "repository 'REPO' already exists"},
        {"admin", "REP_ADD_REPOSITORY", add("a/b"),
         "repository name 'a/b' holds the character '/', one of \\/:*?\"<>|&='+%"},
        {"admin", "REP_ADD_REPOSITORY", add(""), "repository name is empty"},
        {"admin", "REP_ADD_REPOSITORY", {{"repositoryObject", "<X/>"}}, "repositoryObject holds no REPOSITORY element"},
        {"ann", "REP_REMOVE_REPOSITORY", repo({}), "Authorization Error: user 'ann' may not run REP_REMOVE_REPOSITORY"},
        {"vic", "REP_REMOVE_ITEM", repo({}), "Authorization Error: user 'vic' may not run REP_REMOVE_ITEM"},
        // One property per item: repository, name and kind, with the details as attributes.
        {"admin",
         "REP_GLOBAL_GET_ALL_ITEMS",
         {{"enableFilter", "All"}},
         reply("REP_GLOBAL_GET_ALL_ITEMS", R"(<PROPERTY category="REPO" name="roads.zlw" value="WORKSPACE">)"
                                           R"(<ATTRIBUTE name="title" value="Roads"/><ATTRIBUTE name="description" )"
                                           R"(value="Copies roads&#10;and checks them"/><ATTRIBUTE name="filesize" )"
                                           R"(value="503"/><ATTRIBUTE name="lastsavedate" value="TIME"/></PROPERTY>)")},
        {"admin", "REP_ITEMRESOURCEEXISTS", repo({{"itemName", "roads.zlw"}}), "missing value \"resourceName\""},
        {"admin", "REP_GET_ITEMRESOURCEVIEW", lookup, reply("REP_GET_ITEMRESOURCEVIEW", resource)},
        {"admin", "REP_GET_ITEMRESOURCEVIEW", repo({{"itemName", "roads.zlw"}}), reply("REP_GET_ITEMRESOURCEVIEW")},
        {"admin", "REP_GET_ITEMRESOURCESVIEW", repo({{"itemName", "roads.zlw"}}),
         reply("REP_GET_ITEMRESOURCESVIEW", resource)},
    });
    EXPECT_EQ(storedFiles(), 2u) << "the replaced resource's content is gone";
    converse({{"admin", "REP_REMOVE_ITEM", repo({{"itemName", "roads.zlw"}}), "true"}});
    EXPECT_EQ(storedFiles(), 0u) << "an item takes its resources along";
    ASSERT_TRUE(addItem("a.zlx", "transformer").ok());
    converse({
        {"admin", "REP_REMOVE_REPOSITORY", repo({}), "true"},
        {"admin", "REP_REMOVE_REPOSITORY", repo({}), "false"},
        {"admin", "REP_ITEMEXISTS", repo({{"itemName", "a.zlx"}}), "unknown repository 'REPO'"},
    });
    EXPECT_EQ(storedFiles(), 0u) << "a repository takes its items along";
}

TEST_F(Commands, ViewsByKindServicesRegistrationsAndProperties)
{
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "x").ok());
    ASSERT_TRUE(addItem("off.zlw", "# @title Off\n# @enabled false\n").ok());
    ASSERT_TRUE(addItem("fmt.zds", "# @title Format\n# @description A format\n").ok());
    ASSERT_TRUE(addItem("tr.zlx", "binary\x01stuff").ok());
    ASSERT_TRUE(addItem("t.zlwt", "# @title T\n").ok());
    ASSERT_TRUE(addItem("notes.txt", "plain").ok());
    const std::string off = R"(<WORKSPACE_SUMMARY name="off.zlw" title="Off" description="" is_enabled="false"/>)";
    const std::string on = R"(<WORKSPACE_SUMMARY name="roads.zlw" title="Roads" )"
                           R"(description="Copies roads&#10;and checks them" is_enabled="true"/>)";
    const std::string format = R"(<CUSTOMFORMAT name="fmt.zds" title="Format" description="A format" filesize="40"/>)";
    const std::string transformer = R"(<CUSTOMTRANSFORMER name="tr.zlx" title="" description="" filesize="12"/>)";
    const std::string page = R"(<TEMPLATE name="t.zlwt" title="T" description="" filesize="11"/>)";
    // The id is the server's: the client's "-1" only marks a new object.
    const std::string run = R"(<SERVICE service_id="1" name="run" display_name="run service" description="d" )"
                            R"(url_pattern="/run" is_enabled="true" is_workspace_reg_allowed="true" )"
                            R"(is_customformat_reg_allowed="false" is_customtransform_reg_allowed="false" )"
                            R"(is_template_reg_allowed="true"/>)";
    auto reg = [](const char* service, const char* valueName, const char* item) {
        return repo({{"serviceName", service}, {valueName, item}});
    };
    auto accessor = [](const char* idName, const char* id) {
        return Values{{idName, id}, {"propertyAccessorObject", "<A>" + property(idName, id) + "</A>"}};
    };
    converse({
        {"admin", "REP_GET_WORKSPACESUMMARIESVIEW", repo({{"enableFilter", "All"}}),
         reply("REP_GET_WORKSPACESUMMARIESVIEW", off + on)},
        {"admin", "REP_GET_WORKSPACESUMMARIESVIEW", repo({{"enableFilter", "Disabled"}}),
         reply("REP_GET_WORKSPACESUMMARIESVIEW", off)},
        {"admin", "REP_GET_WORKSPACESVIEW", repo({{"enableFilter", "enabled"}}),
         "bad enableFilter 'enabled' (All, Enabled or Disabled)"},
        {"admin", "REP_GET_WORKSPACEVIEW", repo({{"workspaceName", "nope.zlw"}}), reply("REP_GET_WORKSPACEVIEW")},
        {"admin", "REP_GET_CUSTOMFORMATSVIEW", repo({}), reply("REP_GET_CUSTOMFORMATSVIEW", format)},
        {"admin", "REP_GET_CUSTOMFORMATVIEW", repo({{"customFormatName", "fmt.zds"}}),
         reply("REP_GET_CUSTOMFORMATVIEW", format)},
        {"admin", "REP_GET_CUSTOMTRANSFORMERSVIEW", repo({}), reply("REP_GET_CUSTOMTRANSFORMERSVIEW", transformer)},
        {"admin", "REP_GET_TEMPLATEVIEW", repo({{"templateName", "t.zlwt"}}), reply("REP_GET_TEMPLATEVIEW", page)},
        // An item of another kind is not found under a view.
        {"admin", "REP_GET_TEMPLATEVIEW", repo({{"templateName", "notes.txt"}}), reply("REP_GET_TEMPLATEVIEW")},
        {"admin", "REP_ADD_SERVICE", {{"serviceObject", service("run", true, false)}}, "true"},
        {"admin", "REP_ADD_SERVICE", {{"serviceObject", service("off", false, true)}}, "true"},
        {"admin", "REP_ADD_SERVICE", {{"serviceObject", service("run", true, false)}}, "service 'run' already exists"},
        {"admin", "REP_UPDATE_SERVICE", {{"serviceObject", service("zz", true, true)}}, "unknown service 'zz'"},
        {"admin", "REP_UPDATE_SERVICE", {{"serviceObject", service("run", true, true)}}, "true"},
        {"admin", "REP_GET_SERVICES", {{"enableFilter", "Enabled"}}, reply("REP_GET_SERVICES", run)},
        {"ann",
         "REP_ADD_SERVICE",
         {{"serviceObject", service("x", 1, 1)}},
         "Authorization Error: user 'ann' may not run REP_ADD_SERVICE"},
        {"admin", "REP_REGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "roads.zlw"), "true"},
        {"admin", "REP_REGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "roads.zlw"),
         "'REPO/roads.zlw' is already registered with 'run'"},
        {"admin", "REP_REGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "t.zlwt"),
         "'t.zlwt' is not a workspace"},
        {"admin", "REP_REGISTERITEM", reg("run", "itemName", "t.zlwt"), "true"},
        {"admin", "REP_REGISTERITEM", reg("off", "itemName", "fmt.zds"),
         "service 'off' does not accept items of kind CUSTOMFORMAT ('fmt.zds')"},
        {"admin", "REP_REGISTERITEM", reg("nope", "itemName", "t.zlwt"), "unknown service 'nope'"},
        {"admin", "REP_REGISTERITEM", reg("run", "itemName", "none"), "unknown item 'none' in 'REPO'"},
        {"admin",
         "REP_GET_REGISTEREDITEMS",
         {{"serviceName", "run"}, {"itemType", "4"}},
         reply("REP_GET_REGISTEREDITEMS", R"(<ITEM name="t.zlwt" repository_name="REPO" title="T" description="" )"
                                          R"(filesize="11" category="" requirements="" requirementskeyword="" )"
                                          R"(usage="" history="" lastsavedate="TIME" lastsavebuild="zelserverd )"
                                          R"(0.1.0" buildnumber="0" legaltermsconditions=""/>)")},
        {"admin",
         "REP_GET_REGISTEREDITEMS",
         {{"serviceName", "run"}, {"itemType", "9"}},
         "bad itemType '9' (0 to 4, or WORKSPACE, CUSTOMFORMAT, CUSTOMTRANSFORMER, TEMPLATE, OTHER)"},
        {"admin", "REP_GET_WORKSPACESERVICES", repo({{"enableFilter", "Enabled"}, {"workspaceName", "roads.zlw"}}),
         reply("REP_GET_WORKSPACESERVICES", "<WORKSPACE_SERVICE>" + on + run + "</WORKSPACE_SERVICE>")},
        {"admin", "REP_GET_WORKSPACESERVICES", repo({{"workspaceName", "x.zlw"}}), reply("REP_GET_WORKSPACESERVICES")},
        {"admin", "REP_UPDATE_SERVICEPROPERTYACCESSOR", accessor("serviceID", "1"), "true"},
        {"admin", "REP_UPDATE_SERVICEPROPERTYACCESSOR", accessor("serviceID", "999"), "unknown service id '999'"},
        {"admin", "REP_UPDATE_WORKSPACEPROPERTYACCESSOR", accessor("workspaceID", "1"), "true"},
        {"admin", "REP_UPDATE_WORKSPACEPROPERTYACCESSOR", accessor("workspaceID", "99"), "unknown workspace '99'"},
        {"admin", "REP_UPDATE_DATASETPROPERTYACCESSOR", accessor("datasetID", "1.2"), "true"},
        {"admin", "REP_UPDATE_DATASETPROPERTYACCESSOR", accessor("datasetID", "1.3"), "unknown dataset '1.3'"},
        {"admin", "REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", accessor("featureTypeID", "1.1.1"), "true"},
        {"admin", "REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", accessor("featureTypeID", "1.1.2"),
         "unknown featuretype '1.1.2'"},
        {"admin",
         "REP_GET_SERVICE",
         {{"serviceName", "run"}},
         reply("REP_GET_SERVICE", run.substr(0, run.size() - 2) + ">" + property("serviceID", "1") + "</SERVICE>")},
        // An update replaces the whole set of its owner.
        {"admin",
         "REP_UPDATE_SERVICEPROPERTYACCESSOR",
         {{"serviceID", "1"}, {"propertyAccessorObject", "<EMPTY/>"}},
         "true"},
        {"admin", "REP_GET_SERVICE", {{"serviceName", "run"}}, reply("REP_GET_SERVICE", run)},
        {"admin", "REP_DEREGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "roads.zlw"), "true"},
        {"admin", "REP_DEREGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "roads.zlw"), "false"},
        {"admin", "REP_REGISTER_WORKSPACESERVICE", reg("off", "workspaceName", "roads.zlw"), "true"},
        {"admin", "REP_REMOVE_SERVICE", {{"serviceName", "run"}}, "true"},
        {"admin", "REP_ITEMREGISTERED", reg("run", "itemName", "t.zlwt"), "unknown service 'run'"},
    });

    // The workspace view comes from the header, with the properties of each owner by its id; it and
    // everything else survive a restart, and a stray file in the content directory (as a crash
    // between rename and commit leaves) goes.
    writeFile(dataDir_ + "/store/orphan", "x");
    startServer();
    clients_.clear();
    EXPECT_EQ(storedFiles(), 7u);
    converse({{"admin", "REP_GET_WORKSPACEVIEW", repo({{"workspaceName", "roads.zlw"}}),
               reply("REP_GET_WORKSPACEVIEW",
                     R"(<WORKSPACE_DEFINITIONS workspace_id="1" name="roads.zlw" title="Roads" )"
                     R"(description="Copies roads&#10;and checks them" is_enabled="true" filesize="503">)"
                     R"(<PARAMETER name="SOURCE" param_type="FILENAME" default_val="in.dat" )"
                     R"(description="Where to read" options_type="FILEFILTER_CONFIG" options="*.dat"/>)"
                     R"(<PARAMETER name="MODE" param_type="CHOICE" default_val="fast" description="How" )"
                     R"(options_type="SINGLECHOICE_CONFIG" options="fast%slow%exact"/><DATASET )"
                     R"(dataset_id="1.1" format="CSV" name="roads" location="/data/roads.csv" )"
                     R"(is_source="true"><FEATURE_TYPE feature_type_id="1.1.1" name="road" )"
                     R"(description="A road"><ATTRIBUTE name="id" zel_type="zel_int32" decimals="0" )"
                     R"(width="10"/><ATTRIBUTE name="length" zel_type="zel_real64" decimals="3" width="12"/>)" +
                         property("featureTypeID", "1.1.1") +
                         R"(</FEATURE_TYPE></DATASET><DATASET dataset_id="1.2" format="GPKG" name="out" )"
                         R"(location="out.gpkg" is_source="false"><FEATURE_TYPE feature_type_id="1.2.1" )"
                         R"(name="line" description=""/>)" +
                         property("datasetID", "1.2") +
                         R"(</DATASET><RESOURCE name="lookup.csv" description="" filesize="1"/>)" +
                         property("workspaceID", "1") + "</WORKSPACE_DEFINITIONS>")},
              {"admin", "REP_WORKSPACESERVICEEXISTS", reg("off", "workspaceName", "roads.zlw"), "true"}});
}

TEST_F(Commands, SessionsRightsAndTokens)
{
    const std::string head = R"(<SERVER_SESSION_INIT security_enabled="true" security_pubparm="false">)";
    const std::string roles = R"(<ROLES><ROLE name="user"/></ROLES>)";
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    EXPECT_EQ(client.signIn("ann", "annpw").body, document(head + R"(<IDENTITY id="ann" is_authenticated="true">)" +
                                                           roles + "</IDENTITY></SERVER_SESSION_INIT>"));
    WireReply sso = client.command("SERVER_SESSION_INIT", {{"ssoAuthData", std::string("ann:") + kSsoSecret}});
    std::smatch data;
    ASSERT_TRUE(std::regex_search(sso.body, data, std::regex(" auth_data=\"[^\"]{32}\""))) << sso.body;
    EXPECT_EQ(sso.body, document(head + R"(<SSO_IDENTITY id="ann" is_authenticated="true" state="SUCCEEDED")" +
                                 data.str() + ">" + roles + "</SSO_IDENTITY></SERVER_SESSION_INIT>"));

    // A refused sign-in also ends the earlier one on that connection; a good one afterwards works.
    for (const Values& values : std::vector<Values>{{{"userID", "ann"}, {"userPassword", "wrong"}},
                                                    {{"userID", "nobody"}, {"userPassword", "annpw"}},
                                                    {{"userID", "ann"}},
                                                    {{"userToken", "not-a-token"}},
                                                    {{"userToken", ""}},
                                                    {{"ssoAuthData", "ann:wrong-secret"}},
                                                    {{"ssoAuthData", "no-colon"}},
                                                    {{"ssoAuthData", std::string("nobody:") + kSsoSecret}}}) {
        auto vic = connectAs("vic");
        EXPECT_EQ(vic->command("SERVER_SESSION_INIT", values).body.rfind("Authentication Error: ", 0), 0u);
        EXPECT_EQ(userOf(*vic), "Authentication Error: sign in with SERVER_SESSION_INIT first");
    }

    auto prop = [](const char* name) { return Values{{"sessionPropName", name}}; };
    // Rights come from the connection's sign-in, never from an identity object in the request.
    const std::string forged = "<?xml version=\"1.0\"?><SR_MAKE><IDENTITY id=\"admin\" is_authenticated=\"true\">"
                               "<ROLES><ROLE name=\"admin\"/></ROLES></IDENTITY></SR_MAKE>";
    auto token = [](const std::string& text, const std::string& timeout, const std::string& address = "") {
        return "<?xml version=\"1.0\"?><SEC_ADD_USERTOKEN><USERTOKEN token=\"" + text + "\" clientaddress=\"" +
               address + "\" expirationtimeout=\"" + timeout +
               "\" firsttokendate=\"x\" lasttokendate=\"y\" expirationdate=\"z\"/></SEC_ADD_USERTOKEN>";
    };
    auto of = [](const char* account, const std::string& doc = "") {
        Values values{{"userAccountName", account}};
        if (!doc.empty())
            values.emplace_back("userTokenObject", doc);
        return values;
    };
    converse({
        {"ann", "SERVER_SESSION_GET_PROP", prop("SERVER_NAME"), "zelserverd"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("SERVER_VERSION"), "0.1.0"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("API_VERSION"), "1"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("USER_ROLES"), "user"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("SECURITY_ENABLED"), "true"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("MAX_REQUEST_BYTES"), "65536"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("MAX_FILE_BYTES"), "4294967295"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("JOB_SERVICES"), "zeljob"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("SERVER_TIME"), "TIME"},
        {"ann", "SERVER_SESSION_GET_PROP", prop("COLOUR"), "unknown session property \"COLOUR\""},
        {"ann", "SERVER_SESSION_GET_PROP", {}, "missing value \"sessionPropName\""},
        {"admin", "NO_SUCH_COMMAND", {}, "unknown command \"NO_SUCH_COMMAND\""},
        {"vic",
         "SR_MAKE",
         {{"identityObject", forged}, {"srName", "AREA"}, {"srPath", pathDocument("x")}},
         "Authorization Error: user 'vic' may not run SR_MAKE"},
        // A custom role grants its rights and nothing else.
        {"aud", "SR_EXISTS", {{"srName", "AREA"}, {"srPath", pathDocument("x")}}, "false"},
        {"aud", "SEC_USERTOKEN_EXISTS", of("aud"),
         "Authorization Error: user 'aud' may not manage the user token of 'aud'"},
        {"ann", "SEC_USERTOKEN_EXISTS", of("vic"),
         "Authorization Error: user 'ann' may not manage the user token of 'vic'"},
        {"ann", "SEC_GET_USERTOKEN", of("ann"), reply("SEC_GET_USERTOKEN")},
        {"ann", "SEC_USERTOKEN_EXPIRED", of("ann"), "account 'ann' has no user token"},
        {"ann", "SEC_ADD_USERTOKEN", of("ann", "not xml"),
         "\"userTokenObject\" holds no USERTOKEN element: malformed XML: No document element found"},
        {"ann", "SEC_ADD_USERTOKEN", of("ann", "<X><OTHER/></X>"), "\"userTokenObject\" holds no USERTOKEN element"},
        {"ann", "SEC_ADD_USERTOKEN", of("ann", token("t", "soon")),
         "expirationtimeout 'soon' is not a number of seconds"},
        {"ann", "SEC_ADD_USERTOKEN", of("ann"), "missing value \"userTokenObject\""},
        {"ann", "SEC_ADD_USERTOKEN", of("ann", token("abc", "3600", "localhost")), "true"},
        {"ann", "SEC_USERTOKEN_EXPIRED", of("ann"), "false"},
        // The dates are the server's, not what the client sent.
        {"ann", "SEC_GET_USERTOKEN", of("ann"),
         reply("SEC_GET_USERTOKEN", R"(<USERTOKEN token="abc" clientaddress="localhost" expirationtimeout="3600" )"
                                    R"(firsttokendate="TIME" lasttokendate="TIME" expirationdate="TIME"/>)")},
        {"ann", "SEC_UPDATE_USERTOKEN", of("ann", token("ghi", "0")), "true"},
        {"ann", "SEC_GET_USERTOKEN", of("ann"),
         reply("SEC_GET_USERTOKEN", R"(<USERTOKEN token="ghi" clientaddress="" expirationtimeout="0" )"
                                    R"(firsttokendate="TIME" lasttokendate="TIME" expirationdate=""/>)")},
        {"admin", "SEC_USERTOKEN_EXISTS", of("ghost"), "unknown user account 'ghost'"},
        // A token text belongs to one account only.
        {"admin", "SEC_ADD_USERTOKEN", of("vic", token("ghi", "60")), "this token text is already in use"},
        {"admin", "SEC_ADD_USERTOKEN", of("vic", token("elsewhere", "3600", "10.1.2.3")), "true"},
        {"admin", "SEC_ADD_USERTOKEN", of("aud", token("", "60")), "true"},
    });
    // A token signs in, also after a restart (an empty text got one generated); one bound to another
    // address or expired is refused, and the expiry is kept too.
    const std::string generated = std::regex_replace(admin_->command("SEC_GET_USERTOKEN", of("aud")).body,
                                                     std::regex(".* token=\"([^\"]*)\".*"), "$1");
    EXPECT_EQ(generated.size(), 48u);
    startServer();
    auto signIn = [&](const std::string& text) {
        return withoutTimes(client.command("SERVER_SESSION_INIT", {{"userToken", text}}).body);
    };
    ASSERT_TRUE(client.connect(port()));
    EXPECT_NE(signIn("ghi").find(R"(<IDENTITY id="ann")"), std::string::npos);
    EXPECT_NE(signIn(generated).find(R"(<IDENTITY id="aud")"), std::string::npos);
    EXPECT_EQ(signIn("elsewhere"), "Authentication Error: user token is not valid from this address");
    {
        std::lock_guard lock(state().db.mutex());
        ASSERT_EQ(state().db.exec("UPDATE user_tokens SET expires_at = 1"), "");
    }
    EXPECT_EQ(signIn(generated), "Authentication Error: user token has expired");
    startServer();
    EXPECT_EQ(admin_->command("SEC_USERTOKEN_EXPIRED", of("aud")).body, "true");
}

}  // namespace
}  // namespace zeltest
