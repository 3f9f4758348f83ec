// Sign-in, rights, session properties and user tokens (every "SEC_" command, account scope,
// signing in with a token, persistence) over loopback.
#include <gtest/gtest.h>

#include <filesystem>
#include <regex>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

class Session : public ServerFixture {};

TEST_F(Session, PasswordAndSingleSignOnAnswerTheIdentityDocument)
{
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    const std::string head = R"(<SERVER_SESSION_INIT security_enabled="true" security_pubparm="false">)";
    const std::string roles = R"(<ROLES><ROLE name="user"/></ROLES>)";
    EXPECT_EQ(client.signIn("ann", "annpw").body, document(head + R"(<IDENTITY id="ann" is_authenticated="true">)" +
                                                           roles + "</IDENTITY></SERVER_SESSION_INIT>"));
    WireReply sso = client.command("SERVER_SESSION_INIT", {{"ssoAuthData", std::string("ann:") + kSsoSecret}});
    std::smatch data;
    ASSERT_TRUE(std::regex_search(sso.body, data, std::regex(" auth_data=\"[^\"]{32}\""))) << sso.body;
    EXPECT_EQ(sso.body, document(head +
                                 R"(<SSO_IDENTITY id="ann" is_authenticated="true" )"
                                 R"(state="SUCCEEDED")" +
                                 data.str() + ">" + roles + "</SSO_IDENTITY></SERVER_SESSION_INIT>"));
}

// A refused sign-in also ends the earlier one on that connection; a good one afterwards works.
TEST_F(Session, WrongCredentialsAreAuthenticationErrors)
{
    const Values cases[] = {
        {{"userID", "ann"}, {"userPassword", "wrong"}},
        {{"userID", "nobody"}, {"userPassword", "annpw"}},
        {{"userID", "ann"}, {"userPassword", ""}},
        {{"userID", "ann"}},
        {{"userToken", "not-a-token"}},
        {{"userToken", ""}},
        {{"ssoAuthData", "ann:wrong-secret"}},
        {{"ssoAuthData", "no-colon"}},
        {{"ssoAuthData", std::string("nobody:") + kSsoSecret}},
    };
    for (const Values& values : cases) {
        auto client = connectAs("vic");
        WireReply reply = client->command("SERVER_SESSION_INIT", values);
        EXPECT_EQ(reply.status, "ERROR");
        EXPECT_EQ(reply.body.rfind("Authentication Error: ", 0), 0u) << reply.body;
        EXPECT_EQ(userOf(*client), "Authentication Error: sign in with SERVER_SESSION_INIT first");
        EXPECT_TRUE(client->signIn("ann", "annpw").ok());
        EXPECT_EQ(userOf(*client), "ann");
    }
}

TEST_F(Session, RefusalsNameTheUserAndWhatWasRefused)
{
    // Rights come from the connection's sign-in, never from an identity object in the request.
    std::string forged = "<?xml version=\"1.0\"?><SR_MAKE><IDENTITY id=\"admin\" is_authenticated=\"true\">"
                         "<ROLES><ROLE name=\"admin\"/></ROLES></IDENTITY></SR_MAKE>";
    struct Case {
        const char* user;
        const char* keyword;
        Values values;
        std::string reply;
    };
    const Case cases[] = {
        {"vic",
         "SR_MAKE",
         {{"identityObject", forged}, {"srName", "AREA"}, {"srPath", pathDocument("x")}},
         "Authorization Error: user 'vic' may not run SR_MAKE"},
        // A custom role grants its rights and nothing else.
        {"aud",
         "SEC_USERTOKEN_EXISTS",
         {{"userAccountName", "aud"}},
         "Authorization Error: user 'aud' may not manage the user token of 'aud'"},
        {"aud", "SR_EXISTS", {{"srName", "AREA"}, {"srPath", pathDocument("x")}}, "false"},
        {"admin", "NO_SUCH_COMMAND", {}, "unknown command \"NO_SUCH_COMMAND\""},
        {"ann", "SERVER_SESSION_GET_PROP", {}, "missing value \"sessionPropName\""},
        {"ann", "SERVER_SESSION_GET_PROP", {{"sessionPropName", "COLOUR"}}, "unknown session property \"COLOUR\""},
    };
    for (const Case& c : cases)
        EXPECT_EQ(connectAs(c.user)->command(c.keyword, c.values).body, c.reply) << c.keyword;
    EXPECT_FALSE(std::filesystem::exists(areaDir_ + "/x"));
}

TEST_F(Session, SessionPropertiesAnswerTheDocumentedSet)
{
    auto client = connectAs("ann");
    const std::pair<const char*, const char*> expected[] = {
        {"SERVER_NAME", "zelserverd"},  {"SERVER_VERSION", "0.1.0"},      {"API_VERSION", "1"},
        {"USER_NAME", "ann"},           {"USER_ROLES", "user"},           {"SECURITY_ENABLED", "true"},
        {"MAX_REQUEST_BYTES", "65536"}, {"MAX_FILE_BYTES", "4294967295"}, {"JOB_SERVICES", "zeljob"},
        {"SERVER_TIME", "TIME"},
    };
    for (auto [name, value] : expected) {
        WireReply reply = client->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", name}});
        EXPECT_TRUE(reply.ok());
        EXPECT_EQ(withoutTimes(reply.body), value) << name;
    }
}

class Tokens : public ServerFixture {
protected:
    static std::string tokenDoc(const std::string& token, const std::string& timeout, const std::string& address = "")
    {
        return "<?xml version=\"1.0\"?><SEC_ADD_USERTOKEN><USERTOKEN token=\"" + token + "\" clientaddress=\"" +
               address + "\" expirationtimeout=\"" + timeout +
               "\" firsttokendate=\"x\" lasttokendate=\"y\" expirationdate=\"z\"/></SEC_ADD_USERTOKEN>";
    }
    static WireReply run(TestClient& client, const std::string& keyword, const std::string& account,
                         const std::string& doc = "")
    {
        Values values{{"userAccountName", account}};
        if (!doc.empty())
            values.emplace_back("userTokenObject", doc);
        return client.command(keyword, values);
    }
    // The USERTOKEN element of an account; valid until the next call.
    pugi::xml_node token(TestClient& client, const std::string& account)
    {
        return parse(run(client, "SEC_GET_USERTOKEN", account)).child("USERTOKEN");
    }
    // Sets the expiry of every token to long ago.
    void expireAll()
    {
        std::lock_guard lock(state().db.mutex());
        ASSERT_EQ(state().db.exec("UPDATE user_tokens SET expires_at = 1"), "");
    }
};

TEST_F(Tokens, LifeCycleOfOwnToken)
{
    auto ann = connectAs("ann");
    EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXISTS", "ann").body, "false");
    EXPECT_EQ(run(*ann, "SEC_GET_USERTOKEN", "ann").body, document("<SEC_GET_USERTOKEN/>"));
    EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXPIRED", "ann").body, "account 'ann' has no user token");
    EXPECT_EQ(run(*ann, "SEC_UPDATE_USERTOKEN", "ann", tokenDoc("x", "1")).body, "account 'ann' has no user token");

    EXPECT_EQ(run(*ann, "SEC_ADD_USERTOKEN", "ann", tokenDoc("abc", "3600", "localhost")).body, "true");
    EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXISTS", "ann").body, "true");
    EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXPIRED", "ann").body, "false");
    EXPECT_EQ(run(*ann, "SEC_ADD_USERTOKEN", "ann", tokenDoc("def", "10")).body,
              "account 'ann' already has a user token");
    // The dates are the server's, not what the client sent.
    std::string got = run(*ann, "SEC_GET_USERTOKEN", "ann").body;
    EXPECT_EQ(withoutTimes(got), document(R"(<SEC_GET_USERTOKEN><USERTOKEN token="abc" clientaddress="localhost" )"
                                          R"(expirationtimeout="3600" firsttokendate="TIME" lasttokendate="TIME" )"
                                          R"(expirationdate="TIME"/></SEC_GET_USERTOKEN>)"));
    pugi::xml_node added = token(*ann, "ann");
    std::string first = added.attribute("firsttokendate").value();
    EXPECT_EQ(first, added.attribute("lasttokendate").value());
    EXPECT_NE(first, added.attribute("expirationdate").value());

    ASSERT_TRUE(run(*ann, "SEC_UPDATE_USERTOKEN", "ann", tokenDoc("ghi", "0")).ok());
    pugi::xml_node updated = token(*ann, "ann");
    EXPECT_STREQ(updated.attribute("token").value(), "ghi");
    EXPECT_STREQ(updated.attribute("expirationtimeout").value(), "0");
    EXPECT_STREQ(updated.attribute("expirationdate").value(), "");
    EXPECT_EQ(first, updated.attribute("firsttokendate").value());

    EXPECT_EQ(run(*ann, "SEC_REMOVE_USERTOKEN", "ann").body, "true");
    EXPECT_EQ(run(*ann, "SEC_REMOVE_USERTOKEN", "ann").body, "false");
}

TEST_F(Tokens, OtherAccountsNeedTheAdminRight)
{
    EXPECT_EQ(run(*connectAs("ann"), "SEC_USERTOKEN_EXISTS", "vic").body,
              "Authorization Error: user 'ann' may not manage the user token of 'vic'");
    auto admin = connectAs("admin");
    EXPECT_TRUE(run(*admin, "SEC_ADD_USERTOKEN", "vic", tokenDoc("v1", "60")).ok());
    EXPECT_EQ(run(*admin, "SEC_USERTOKEN_EXISTS", "vic").body, "true");
    EXPECT_EQ(run(*admin, "SEC_USERTOKEN_EXISTS", "ghost").body, "unknown user account 'ghost'");
    // A token text belongs to one account only.
    EXPECT_EQ(run(*admin, "SEC_ADD_USERTOKEN", "ann", tokenDoc("v1", "60")).body, "this token text is already in use");
}

TEST_F(Tokens, MalformedTokenDocumentsAreRefused)
{
    auto ann = connectAs("ann");
    const std::pair<std::string, std::string> cases[] = {
        {"not xml", "\"userTokenObject\" holds no USERTOKEN element: malformed XML"},
        {"<?xml version=\"1.0\"?><X><OTHER/></X>", "\"userTokenObject\" holds no USERTOKEN element"},
        {tokenDoc("t", "soon"), "expirationtimeout 'soon' is not a number of seconds"},
        {"", "missing value \"userTokenObject\""},
    };
    for (const auto& [doc, expected] : cases) {
        WireReply reply = run(*ann, "SEC_ADD_USERTOKEN", "ann", doc);
        EXPECT_EQ(reply.status, "ERROR");
        EXPECT_EQ(reply.body.rfind(expected, 0), 0u) << reply.body;
    }
    EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXISTS", "ann").body, "false");
}

// Tokens sign in, also after a restart; an empty token text gets one generated; an expired token
// or one bound to another address is refused, and the expiry is kept too.
TEST_F(Tokens, SignInWithATokenAcrossARestart)
{
    auto admin = connectAs("admin");
    ASSERT_TRUE(run(*admin, "SEC_ADD_USERTOKEN", "ann", tokenDoc("tok-123", "3600")).ok());
    ASSERT_TRUE(run(*admin, "SEC_ADD_USERTOKEN", "vic", tokenDoc("elsewhere", "3600", "10.1.2.3")).ok());
    ASSERT_TRUE(run(*admin, "SEC_ADD_USERTOKEN", "aud", tokenDoc("", "60")).ok());
    std::string generated = token(*admin, "aud").attribute("token").value();
    EXPECT_EQ(generated.size(), 48u);
    admin.reset();
    startServer();

    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    EXPECT_EQ(parse(client.command("SERVER_SESSION_INIT", {{"userToken", "tok-123"}}))
                  .child("IDENTITY")
                  .attribute("id")
                  .value(),
              std::string("ann"));
    EXPECT_EQ(parse(client.command("SERVER_SESSION_INIT", {{"userToken", generated}}))
                  .child("IDENTITY")
                  .attribute("id")
                  .value(),
              std::string("aud"));
    EXPECT_EQ(client.command("SERVER_SESSION_INIT", {{"userToken", "elsewhere"}}).body,
              "Authentication Error: user token is not valid from this address");
    expireAll();
    EXPECT_EQ(client.command("SERVER_SESSION_INIT", {{"userToken", "tok-123"}}).body,
              "Authentication Error: user token has expired");
    startServer();
    EXPECT_EQ(run(*connectAs("ann"), "SEC_USERTOKEN_EXPIRED", "ann").body, "true");
}

}  // namespace
}  // namespace zeltest
