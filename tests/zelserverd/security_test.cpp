// User tokens: every "SEC_" command, account scope, persistence.
#include <gtest/gtest.h>
#include <pugixml.hpp>

#include "support/server_fixture.h"

namespace zeltest {
namespace {

class Tokens : public ServerFixture {
 protected:
  static std::string tokenDoc(const std::string& token, const std::string& timeout,
                              const std::string& address = "") {
    return "<?xml version=\"1.0\"?><SEC_ADD_USERTOKEN><USERTOKEN token=\"" + token +
           "\" clientaddress=\"" + address + "\" expirationtimeout=\"" + timeout +
           "\" firsttokendate=\"x\" lasttokendate=\"y\" expirationdate=\"z\"/></SEC_ADD_USERTOKEN>";
  }
  static WireReply run(TestClient& client, const std::string& keyword, const std::string& account,
                       const std::string& doc = "") {
    Values values{{"userAccountName", account}};
    if (!doc.empty()) values.emplace_back("userTokenObject", doc);
    return client.command(keyword, values);
  }
};

TEST_F(Tokens, LifeCycleOfOwnToken) {
  auto ann = connectAs("ann");
  EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXISTS", "ann").body, "false");
  WireReply none = run(*ann, "SEC_GET_USERTOKEN", "ann");
  ASSERT_TRUE(none.ok());
  pugi::xml_document empty;
  ASSERT_TRUE(empty.load_string(none.body.c_str()));
  EXPECT_FALSE(empty.document_element().child("USERTOKEN"));
  WireReply noToken = run(*ann, "SEC_USERTOKEN_EXPIRED", "ann");
  EXPECT_EQ(noToken.status, "ERROR");
  EXPECT_EQ(noToken.body, "account 'ann' has no user token");

  WireReply added = run(*ann, "SEC_ADD_USERTOKEN", "ann", tokenDoc("abc", "3600", "localhost"));
  ASSERT_TRUE(added.ok()) << added.body;
  EXPECT_EQ(added.body, "true");
  EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXISTS", "ann").body, "true");
  EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXPIRED", "ann").body, "false");
  WireReply twice = run(*ann, "SEC_ADD_USERTOKEN", "ann", tokenDoc("def", "10"));
  EXPECT_EQ(twice.body, "account 'ann' already has a user token");

  WireReply got = run(*ann, "SEC_GET_USERTOKEN", "ann");
  pugi::xml_document doc;
  ASSERT_TRUE(doc.load_string(got.body.c_str()));
  pugi::xml_node token = doc.document_element().child("USERTOKEN");
  ASSERT_TRUE(token);
  EXPECT_STREQ(token.attribute("token").value(), "abc");
  EXPECT_STREQ(token.attribute("clientaddress").value(), "localhost");
  EXPECT_STREQ(token.attribute("expirationtimeout").value(), "3600");
  // The dates are the server's, not what the client sent.
  std::string first = token.attribute("firsttokendate").value();
  EXPECT_EQ(first.size(), 20u);
  EXPECT_EQ(first, token.attribute("lasttokendate").value());
  EXPECT_EQ(std::string(token.attribute("expirationdate").value()).size(), 20u);
  EXPECT_NE(first, token.attribute("expirationdate").value());

  ASSERT_TRUE(run(*ann, "SEC_UPDATE_USERTOKEN", "ann", tokenDoc("ghi", "0")).ok());
  ASSERT_TRUE(doc.load_string(run(*ann, "SEC_GET_USERTOKEN", "ann").body.c_str()));
  token = doc.document_element().child("USERTOKEN");
  EXPECT_STREQ(token.attribute("token").value(), "ghi");
  EXPECT_STREQ(token.attribute("expirationtimeout").value(), "0");
  EXPECT_STREQ(token.attribute("expirationdate").value(), "");
  EXPECT_EQ(first, token.attribute("firsttokendate").value());

  EXPECT_EQ(run(*ann, "SEC_REMOVE_USERTOKEN", "ann").body, "true");
  EXPECT_EQ(run(*ann, "SEC_REMOVE_USERTOKEN", "ann").body, "false");
  WireReply update = run(*ann, "SEC_UPDATE_USERTOKEN", "ann", tokenDoc("x", "1"));
  EXPECT_EQ(update.body, "account 'ann' has no user token");
}

TEST_F(Tokens, EmptyTokenTextIsGeneratedAndWorksForSignIn) {
  auto ann = connectAs("ann");
  ASSERT_TRUE(run(*ann, "SEC_ADD_USERTOKEN", "ann", tokenDoc("", "60")).ok());
  pugi::xml_document doc;
  ASSERT_TRUE(doc.load_string(run(*ann, "SEC_GET_USERTOKEN", "ann").body.c_str()));
  std::string token = doc.document_element().child("USERTOKEN").attribute("token").value();
  EXPECT_EQ(token.size(), 48u);
  TestClient other;
  ASSERT_TRUE(other.connect(port()));
  EXPECT_TRUE(other.command("SERVER_SESSION_INIT", {{"userToken", token}}).ok());
}

TEST_F(Tokens, OtherAccountsNeedTheAdminRight) {
  auto ann = connectAs("ann");
  WireReply refused = run(*ann, "SEC_USERTOKEN_EXISTS", "vic");
  EXPECT_EQ(refused.body, "Authorization Error: user 'ann' may not manage the user token of 'vic'");
  auto admin = connectAs("admin");
  EXPECT_TRUE(run(*admin, "SEC_ADD_USERTOKEN", "vic", tokenDoc("v1", "60")).ok());
  EXPECT_EQ(run(*admin, "SEC_USERTOKEN_EXISTS", "vic").body, "true");
  WireReply unknown = run(*admin, "SEC_USERTOKEN_EXISTS", "ghost");
  EXPECT_EQ(unknown.body, "unknown user account 'ghost'");
  // A token text belongs to one account only.
  WireReply taken = run(*admin, "SEC_ADD_USERTOKEN", "ann", tokenDoc("v1", "60"));
  EXPECT_EQ(taken.body, "this token text is already in use");
}

TEST_F(Tokens, MalformedTokenDocumentsAreRefused) {
  auto ann = connectAs("ann");
  struct Case {
    std::string doc;
    std::string expected;
  };
  const Case cases[] = {
      {"not xml", "\"userTokenObject\" holds no USERTOKEN element: malformed XML"},
      {"<?xml version=\"1.0\"?><X><OTHER/></X>", "\"userTokenObject\" holds no USERTOKEN element"},
      {tokenDoc("t", "soon"), "expirationtimeout 'soon' is not a number of seconds"},
  };
  for (const Case& c : cases) {
    WireReply reply = run(*ann, "SEC_ADD_USERTOKEN", "ann", c.doc);
    EXPECT_EQ(reply.status, "ERROR");
    EXPECT_EQ(reply.body.rfind(c.expected, 0), 0u) << reply.body;
  }
  WireReply missing = run(*ann, "SEC_ADD_USERTOKEN", "ann");
  EXPECT_EQ(missing.body, "missing value \"userTokenObject\"");
  EXPECT_EQ(run(*ann, "SEC_USERTOKEN_EXISTS", "ann").body, "false");
}

TEST_F(Tokens, ExpiryIsReportedAndPersisted) {
  auto ann = connectAs("ann");
  ASSERT_TRUE(run(*ann, "SEC_ADD_USERTOKEN", "ann", tokenDoc("e", "60")).ok());
  {
    std::lock_guard lock(state().db.mutex());
    ASSERT_EQ(state().db.exec("UPDATE user_tokens SET expires_at = 1"), "");
  }
  ann.reset();
  startServer();
  auto again = connectAs("ann");
  EXPECT_EQ(run(*again, "SEC_USERTOKEN_EXPIRED", "ann").body, "true");
}

}  // namespace
}  // namespace zeltest
