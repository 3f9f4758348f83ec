// User tokens end to end: an administrator gives an account a token, and a new session signs in
// with it.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

TEST_F(EndToEnd, ATokenAddedForAnAccountSignsInANewSession)
{
    Client admin;
    ASSERT_EQ(admin.signIn(server->port(), "ann", "pw-ann"), 0u) << admin.lastMessage();
    IZELServerSecurityManager* security = admin.session().getSecurityManager();
    ASSERT_NE(security, nullptr);

    IZELServerUserToken* token = security->createUserToken(admin.text("tok-for-bob"), admin.text(""), 3600);
    ASSERT_NE(token, nullptr);
    EXPECT_EQ(admin.take(security->addUserToken(admin.text("bob"), *token)), 0u) << admin.lastMessage();
    security->destroyUserToken(&token);

    bool exists = false;
    EXPECT_EQ(admin.take(security->userTokenExists(admin.text("bob"), exists)), 0u);
    EXPECT_TRUE(exists);
    bool expired = true;
    EXPECT_EQ(admin.take(security->userTokenExpired(admin.text("bob"), expired)), 0u);
    EXPECT_FALSE(expired);

    Client bob;
    ASSERT_EQ(bob.signInWith(server->port(), {"USER_TOKEN", "tok-for-bob"}), 0u) << bob.lastMessage();
    IZELServerString& id = bob.text();
    bob.session().getIdentity()->getId(id);
    EXPECT_STREQ(id.c_str(), "bob");

    Client stranger;
    const unsigned refused = stranger.signInWith(server->port(), {"USER_TOKEN", "no-such-token"});
    EXPECT_EQ(refused, 393625u);
    EXPECT_EQ(stranger.session().getSecurityManager(), nullptr);
}

TEST_F(EndToEnd, WrongPasswordIsAnAuthenticationFailure)
{
    Client client;
    IZELServerSession& session = client.session();
    IZELServerConnectionInfo* info =
        session.createConnectionInfo(client.text("127.0.0.1"), server->port(), client.text("ann"), client.text("nope"));
    IZELServerStatus* status = session.init(*info, nullptr);
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), 393625u);
    EXPECT_EQ(status->getCode(), 1u) << "authentication failures carry kind 1";
    session.destroyStatus(&status);
    session.destroyConnectionInfo(&info);
}

TEST_F(EndToEnd, SessionPropertyAndIdentityAfterSignIn)
{
    Client client;
    ASSERT_EQ(client.signIn(server->port(), "bob", "pw-bob"), 0u) << client.lastMessage();
    IZELServerStringArray* roles = client.session().createStringArray();
    client.session().getIdentity()->getRoles(*roles);
    EXPECT_TRUE(roles->contains("user"));
    client.session().destroyStringArray(&roles);

    IZELServerString& user = client.text();
    EXPECT_EQ(client.take(client.session().getSessionProperty(client.text("USER_NAME"), user)), 0u);
    EXPECT_STREQ(user.c_str(), "bob");
    IZELServerString& untouched = client.text("kept");
    EXPECT_EQ(client.take(client.session().getSessionProperty(client.text("NO_SUCH"), untouched)), 393625u);
    EXPECT_STREQ(untouched.c_str(), "kept");

    EXPECT_EQ(client.take(client.session().disconnect()), 0u);
    EXPECT_EQ(client.take(client.session().disconnect()), 393622u);
}

}  // namespace
}  // namespace zeltest
