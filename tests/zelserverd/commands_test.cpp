// Every command family as conversations of (user, request -> exact reply): the documents the server
// writes, its refusals, rights, and what a command leaves on disk. Whether each operation succeeds or
// is refused through the library is the end-to-end suites' part.
#include <gtest/gtest.h>

#include <regex>

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

// One request of a conversation and the reply body it must get, time stamps read as "TIME".
struct Exchange {
    std::string keyword;
    Values values;
    std::string reply;
};

class Commands : public ServerFixture {
protected:
    void converse(const std::vector<Exchange>& exchanges, TestClient* client = nullptr)
    {
        for (const Exchange& e : exchanges)
            EXPECT_EQ(withoutTimes((client ? client : admin_.get())->command(e.keyword, e.values).body), e.reply)
                << e.keyword;
    }
    WireReply addResource(const std::string& item, const std::string& name, const std::string& content,
                          const std::string& keyword = "REP_ADD_ITEMRESOURCE")
    {
        return admin_->upload(keyword, {{"repositoryName", "REPO"}, {"itemName", item}, {"resourceName", name}},
                              content);
    }
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
        {"REP_ADD_ITEM", "a:b", "", "item name 'a:b' " + bad},
        {"REP_ADD_ITEM", "bad.zlw", "", "bad workspace header: line 1: @attribute before any @featuretype"},
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

    const std::string resource = R"(<RESOURCE name="lookup.csv" description="" filesize="6"/>)";
    const Values lookup = repo({{"itemName", "roads.zlw"}, {"resourceName", "lookup.csv"}});
    auto add = [](const std::string& name) {
        return Values{{"repositoryObject", "<R><REPOSITORY name=\"" + name + "\"/></R>"}};
    };
    converse({
        {"REP_ADD_REPOSITORY", add("a/b"), "repository name 'a/b' holds the character '/', one of \\/:*?\"<>|&='+%"},
        {"REP_ADD_REPOSITORY", add(""), "repository name is empty"},
        // One property per item: repository, name and kind, with the details as attributes.
        {"REP_GLOBAL_GET_ALL_ITEMS",
         {{"enableFilter", "All"}},
         reply("REP_GLOBAL_GET_ALL_ITEMS", R"(<PROPERTY category="REPO" name="roads.zlw" value="WORKSPACE">)"
                                           R"(<ATTRIBUTE name="title" value="Roads"/><ATTRIBUTE name="description" )"
                                           R"(value="Copies roads&#10;and checks them"/><ATTRIBUTE name="filesize" )"
                                           R"(value="503"/><ATTRIBUTE name="lastsavedate" value="TIME"/></PROPERTY>)")},
        {"REP_GET_ITEMRESOURCEVIEW", lookup, reply("REP_GET_ITEMRESOURCEVIEW", resource)},
        {"REP_GET_ITEMRESOURCESVIEW", repo({{"itemName", "roads.zlw"}}), reply("REP_GET_ITEMRESOURCESVIEW", resource)},
    });
    EXPECT_EQ(storedFiles(), 2u) << "the replaced resource's content is gone";
    converse({{"REP_REMOVE_ITEM", repo({{"itemName", "roads.zlw"}}), "true"}});
    EXPECT_EQ(storedFiles(), 0u) << "an item takes its resources along";
    ASSERT_TRUE(addItem("a.zlx", "transformer").ok());
    converse({
        {"REP_REMOVE_REPOSITORY", repo({}), "true"},
        {"REP_ITEMEXISTS", repo({{"itemName", "a.zlx"}}), "unknown repository 'REPO'"},
    });
    EXPECT_EQ(storedFiles(), 0u) << "a repository takes its items along";
}

TEST_F(Commands, ServicesRegistrationsAndPropertiesSurviveARestart)
{
    ASSERT_TRUE(addItem("roads.zlw", kRoads).ok());
    ASSERT_TRUE(addResource("roads.zlw", "lookup.csv", "x").ok());
    ASSERT_TRUE(addItem("fmt.zds", "# @title Format\n").ok());
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
        {"REP_ADD_SERVICE", {{"serviceObject", service("run", true, false)}}, "true"},
        {"REP_UPDATE_SERVICE", {{"serviceObject", service("run", true, true)}}, "true"},
        {"REP_GET_SERVICES", {{"enableFilter", "Enabled"}}, reply("REP_GET_SERVICES", run)},
        {"REP_REGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "roads.zlw"), "true"},
        {"REP_REGISTER_WORKSPACESERVICE", reg("run", "workspaceName", "roads.zlw"),
         "'REPO/roads.zlw' is already registered with 'run'"},
        {"REP_REGISTERITEM", reg("run", "itemName", "fmt.zds"),
         "service 'run' does not accept items of kind CUSTOMFORMAT ('fmt.zds')"},
        {"REP_UPDATE_WORKSPACEPROPERTYACCESSOR", accessor("workspaceID", "1"), "true"},
        {"REP_UPDATE_DATASETPROPERTYACCESSOR", accessor("datasetID", "1.2"), "true"},
        {"REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", accessor("featureTypeID", "1.1.1"), "true"},
        {"REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", accessor("featureTypeID", "1.1.2"), "unknown featuretype '1.1.2'"},
    });

    // The workspace view comes from the header, with the properties of each owner by its id; it and
    // everything else survive a restart, and a stray file in the content directory (as a crash
    // between rename and commit leaves) goes.
    spew(dataDir_ + "/store/orphan", "x");
    startServer();
    EXPECT_EQ(storedFiles(), 3u);
    converse({{"REP_GET_WORKSPACEVIEW", repo({{"workspaceName", "roads.zlw"}}),
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
              {"REP_WORKSPACESERVICEEXISTS", reg("run", "workspaceName", "roads.zlw"), "true"}});
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

    // Rights come from the connection's sign-in, never from an identity object in the request; a
    // custom role grants its rights and nothing else.
    const std::string forged = "<?xml version=\"1.0\"?><SR_MAKE><IDENTITY id=\"admin\" is_authenticated=\"true\">"
                               "<ROLES><ROLE name=\"admin\"/></ROLES></IDENTITY></SR_MAKE>";
    converse({{"SR_MAKE",
               {{"identityObject", forged}, {"srName", "AREA"}, {"srPath", pathDocument("x")}},
               "Authorization Error: user 'vic' may not run SR_MAKE"}},
             connectAs("vic").get());
    auto of = [](const char* account, const std::string& doc = "") {
        Values values{{"userAccountName", account}};
        if (!doc.empty())
            values.emplace_back("userTokenObject", doc);
        return values;
    };
    converse(
        {{"SR_EXISTS", {{"srName", "AREA"}, {"srPath", pathDocument("x")}}, "false"},
         {"SEC_USERTOKEN_EXISTS", of("aud"), "Authorization Error: user 'aud' may not manage the user token of 'aud'"}},
        connectAs("aud").get());
    auto token = [](const std::string& text, const std::string& timeout, const std::string& address = "") {
        return "<?xml version=\"1.0\"?><SEC_ADD_USERTOKEN><USERTOKEN token=\"" + text + "\" clientaddress=\"" +
               address + "\" expirationtimeout=\"" + timeout +
               "\" firsttokendate=\"x\" lasttokendate=\"y\" expirationdate=\"z\"/></SEC_ADD_USERTOKEN>";
    };
    converse({
        {"SEC_ADD_USERTOKEN", of("ann", token("t", "soon")), "expirationtimeout 'soon' is not a number of seconds"},
        {"SEC_ADD_USERTOKEN", of("ann", token("abc", "3600", "localhost")), "true"},
        // The dates are the server's, not what the client sent.
        {"SEC_GET_USERTOKEN", of("ann"),
         reply("SEC_GET_USERTOKEN", R"(<USERTOKEN token="abc" clientaddress="localhost" expirationtimeout="3600" )"
                                    R"(firsttokendate="TIME" lasttokendate="TIME" expirationdate="TIME"/>)")},
        {"SEC_UPDATE_USERTOKEN", of("ann", token("ghi", "0")), "true"},
        {"SEC_GET_USERTOKEN", of("ann"),
         reply("SEC_GET_USERTOKEN", R"(<USERTOKEN token="ghi" clientaddress="" expirationtimeout="0" )"
                                    R"(firsttokendate="TIME" lasttokendate="TIME" expirationdate=""/>)")},
        // A token text belongs to one account only.
        {"SEC_ADD_USERTOKEN", of("vic", token("ghi", "60")), "this token text is already in use"},
        {"SEC_ADD_USERTOKEN", of("vic", token("elsewhere", "3600", "10.1.2.3")), "true"},
        {"SEC_ADD_USERTOKEN", of("aud", token("", "60")), "true"},
        {"NO_SUCH_COMMAND", {}, "unknown command \"NO_SUCH_COMMAND\""},
    });
    // A token signs in, also after a restart (an empty text got one generated); one bound to another
    // address or expired is refused, and the expiry is kept too.
    const std::string generated = std::regex_replace(admin_->command("SEC_GET_USERTOKEN", of("aud")).body,
                                                     std::regex(".* token=\"([^\"]*)\".*"), "$1");
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
