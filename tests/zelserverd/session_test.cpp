// Sign-in, rights and session properties over loopback.
#include <gtest/gtest.h>
#include <pugixml.hpp>

#include <filesystem>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

class Session : public ServerFixture {};

pugi::xml_node parseBody(pugi::xml_document& doc, const std::string& body) {
  EXPECT_TRUE(doc.load_string(body.c_str())) << body;
  return doc.document_element();
}

TEST_F(Session, PasswordSignInAnswersTheIdentityDocument) {
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  WireReply reply = client.signIn("ann", "annpw");
  ASSERT_TRUE(reply.ok()) << reply.body;
  EXPECT_EQ(reply.body.rfind("<?xml", 0), 0u);
  pugi::xml_document doc;
  pugi::xml_node root = parseBody(doc, reply.body);
  EXPECT_STREQ(root.attribute("security_enabled").value(), "true");
  EXPECT_STREQ(root.attribute("security_pubparm").value(), "false");
  pugi::xml_node identity = root.child("IDENTITY");
  ASSERT_TRUE(identity);
  EXPECT_STREQ(identity.attribute("id").value(), "ann");
  EXPECT_STREQ(identity.attribute("is_authenticated").value(), "true");
  std::vector<std::string> roles;
  for (pugi::xml_node role : identity.child("ROLES").children("ROLE"))
    roles.push_back(role.attribute("name").value());
  EXPECT_EQ(roles, std::vector<std::string>{"user"});
  EXPECT_FALSE(root.child("SSO_IDENTITY"));
}

TEST_F(Session, WrongCredentialsAreAuthenticationErrors) {
  struct Case {
    Values values;
  };
  const Case cases[] = {
      {{{"userID", "ann"}, {"userPassword", "wrong"}}},
      {{{"userID", "nobody"}, {"userPassword", "annpw"}}},
      {{{"userID", "ann"}, {"userPassword", ""}}},
      {{{"userID", "ann"}}},
      {{{"userToken", "not-a-token"}}},
      {{{"userToken", ""}}},
      {{{"ssoAuthData", "ann:wrong-secret"}}},
      {{{"ssoAuthData", "no-colon"}}},
      {{{"ssoAuthData", std::string("nobody:") + kSsoSecret}}},
  };
  for (const Case& c : cases) {
    TestClient client;
    ASSERT_TRUE(client.connect(port()));
    WireReply reply = client.command("SERVER_SESSION_INIT", c.values);
    EXPECT_EQ(reply.status, "ERROR");
    EXPECT_EQ(reply.body.rfind("Authentication Error: ", 0), 0u) << reply.body;
    // The connection stays usable: a correct sign-in afterwards works.
    EXPECT_TRUE(client.signIn("ann", "annpw").ok());
  }
}

TEST_F(Session, CommandsBeforeSignInAreRefused) {
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  WireReply reply = client.command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}});
  EXPECT_EQ(reply.status, "ERROR");
  EXPECT_EQ(reply.body.rfind("Authentication Error: ", 0), 0u) << reply.body;
}

TEST_F(Session, FailedSignInEndsTheEarlierOne) {
  auto client = connectAs("ann");
  EXPECT_EQ(client->signIn("ann", "wrong").status, "ERROR");
  WireReply reply = client->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}});
  EXPECT_EQ(reply.body.rfind("Authentication Error: ", 0), 0u) << reply.body;
}

TEST_F(Session, SignInAgainSwitchesUser) {
  auto client = connectAs("ann");
  ASSERT_TRUE(client->signIn("vic", "vicpw").ok());
  EXPECT_EQ(client->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", "USER_NAME"}}).body,
            "vic");
}

TEST_F(Session, RightsComeFromTheConnectionNotFromTheIdentityObject) {
  auto client = connectAs("vic");
  std::string forged =
      "<?xml version=\"1.0\"?><SR_MAKE><IDENTITY id=\"admin\" is_authenticated=\"true\">"
      "<ROLES><ROLE name=\"admin\"/></ROLES></IDENTITY></SR_MAKE>";
  WireReply reply = client->command(
      "SR_MAKE", {{"identityObject", forged}, {"srName", "AREA"}, {"srPath", pathDocument("x")}});
  EXPECT_EQ(reply.status, "ERROR");
  EXPECT_EQ(reply.body.rfind("Authorization Error: ", 0), 0u) << reply.body;
  EXPECT_FALSE(std::filesystem::exists(areaDir_ + "/x"));
}

TEST_F(Session, CustomRoleGrantsOnlyItsRights) {
  auto client = connectAs("aud");
  EXPECT_TRUE(client->command("SR_GET_SHAREDRESOURCES").ok());
  WireReply reply = client->command("SEC_USERTOKEN_EXISTS", {{"userAccountName", "aud"}});
  EXPECT_EQ(reply.body.rfind("Authorization Error: ", 0), 0u) << reply.body;
}

TEST_F(Session, UnknownCommandIsAPlainError) {
  auto client = connectAs("admin");
  WireReply reply = client->command("NO_SUCH_COMMAND");
  EXPECT_EQ(reply.status, "ERROR");
  EXPECT_EQ(reply.body, "unknown command \"NO_SUCH_COMMAND\"");
}

TEST_F(Session, SessionPropertiesAnswerTheDocumentedSet) {
  auto client = connectAs("ann");
  auto prop = [&](const std::string& name) {
    return client->command("SERVER_SESSION_GET_PROP", {{"sessionPropName", name}});
  };
  EXPECT_EQ(prop("SERVER_NAME").body, "zelserverd");
  EXPECT_EQ(prop("SERVER_VERSION").body, "0.1.0");
  EXPECT_EQ(prop("API_VERSION").body, "1");
  EXPECT_EQ(prop("USER_NAME").body, "ann");
  EXPECT_EQ(prop("USER_ROLES").body, "user");
  EXPECT_EQ(prop("SECURITY_ENABLED").body, "true");
  EXPECT_EQ(prop("MAX_REQUEST_BYTES").body, "65536");
  EXPECT_EQ(prop("MAX_FILE_BYTES").body, "4294967295");
  EXPECT_EQ(prop("JOB_SERVICES").body, "zeljob");
  EXPECT_EQ(prop("SERVER_TIME").body.size(), 20u);
  WireReply unknown = prop("COLOUR");
  EXPECT_EQ(unknown.status, "ERROR");
  EXPECT_EQ(unknown.body, "unknown session property \"COLOUR\"");
  WireReply missing = client->command("SERVER_SESSION_GET_PROP");
  EXPECT_EQ(missing.status, "ERROR");
  EXPECT_EQ(missing.body, "missing value \"sessionPropName\"");
}

TEST_F(Session, SingleSignOnAnswersAnSsoIdentity) {
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  WireReply reply =
      client.command("SERVER_SESSION_INIT", {{"ssoAuthData", std::string("ann:") + kSsoSecret}});
  ASSERT_TRUE(reply.ok()) << reply.body;
  pugi::xml_document doc;
  pugi::xml_node root = parseBody(doc, reply.body);
  EXPECT_FALSE(root.child("IDENTITY"));
  pugi::xml_node sso = root.child("SSO_IDENTITY");
  ASSERT_TRUE(sso);
  EXPECT_STREQ(sso.attribute("id").value(), "ann");
  EXPECT_STREQ(sso.attribute("is_authenticated").value(), "true");
  EXPECT_STREQ(sso.attribute("state").value(), "SUCCEEDED");
  EXPECT_EQ(std::string(sso.attribute("auth_data").value()).size(), 32u);
  EXPECT_STREQ(sso.child("ROLES").child("ROLE").attribute("name").value(), "user");
}

TEST_F(Session, TokenSignInWorksAndSurvivesRestart) {
  auto ann = connectAs("ann");
  std::string tokenDoc =
      "<?xml version=\"1.0\"?><SEC_ADD_USERTOKEN><USERTOKEN token=\"tok-123\" "
      "clientaddress=\"localhost\" expirationtimeout=\"3600\" firsttokendate=\"\" "
      "lasttokendate=\"\" expirationdate=\"\"/></SEC_ADD_USERTOKEN>";
  ASSERT_TRUE(ann->command("SEC_ADD_USERTOKEN",
                           {{"userAccountName", "ann"}, {"userTokenObject", tokenDoc}})
                  .ok());
  ann.reset();
  startServer();
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  WireReply reply = client.command("SERVER_SESSION_INIT", {{"userToken", "tok-123"}});
  ASSERT_TRUE(reply.ok()) << reply.body;
  pugi::xml_document doc;
  EXPECT_STREQ(parseBody(doc, reply.body).child("IDENTITY").attribute("id").value(), "ann");
}

TEST_F(Session, ExpiredOrForeignAddressTokensAreRefused) {
  auto admin = connectAs("admin");
  auto add = [&](const std::string& account, const std::string& token,
                 const std::string& address) {
    std::string doc = "<?xml version=\"1.0\"?><X><USERTOKEN token=\"" + token +
                      "\" clientaddress=\"" + address +
                      "\" expirationtimeout=\"3600\"/></X>";
    return admin->command("SEC_ADD_USERTOKEN",
                          {{"userAccountName", account}, {"userTokenObject", doc}});
  };
  ASSERT_TRUE(add("ann", "expiring", "").ok());
  ASSERT_TRUE(add("vic", "elsewhere", "10.1.2.3").ok());
  {
    std::lock_guard lock(state().db.mutex());
    ASSERT_EQ(state().db.exec("UPDATE user_tokens SET expires_at = 1 WHERE account = 'ann'"), "");
  }
  TestClient client;
  ASSERT_TRUE(client.connect(port()));
  WireReply expired = client.command("SERVER_SESSION_INIT", {{"userToken", "expiring"}});
  EXPECT_EQ(expired.body, "Authentication Error: user token has expired");
  WireReply foreign = client.command("SERVER_SESSION_INIT", {{"userToken", "elsewhere"}});
  EXPECT_EQ(foreign.body, "Authentication Error: user token is not valid from this address");
}

}  // namespace
}  // namespace zeltest
