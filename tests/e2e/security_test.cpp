// Signing in, rights and user tokens end to end: what the library reports when the server refuses,
// and a token added by an administrator signing in a new session.

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

TEST_F(EndToEnd, SignInIdentityAndSessionProperties)
{
    Client refused;
    EXPECT_EQ(refused.signIn(server->port(), "ann", "nope"), kRefused);
    EXPECT_EQ(refused.lastCode(), 1u) << "authentication failures carry kind 1";
    EXPECT_EQ(refused.session().getRepositoryManager(), nullptr);

    Client client;
    ASSERT_EQ(client.signIn(server->port(), "bob", "pw-bob"), 0u) << client.lastMessage();
    IZELServerSession& session = client.session();
    IZELServerString& untouched = client.text("kept");
    EXPECT_EQ(client.take(session.getSessionProperty(client.text("NO_SUCH"), untouched)), kRefused);
    EXPECT_STREQ(untouched.c_str(), "kept");
    EXPECT_EQ(client.take(session.disconnect()), 0u);
}

// An administrator manages another account's token, which signs in a new session until it is
// replaced or removed.
TEST_F(EndToEnd, TokensAreManagedAndSignInNewSessions)
{
    Client admin;
    ASSERT_EQ(admin.signIn(server->port(), "ann", "pw-ann"), 0u) << admin.lastMessage();
    IZELServerSecurityManager* security = admin.session().getSecurityManager();
    auto token = admin.own(security->createUserToken(admin.text(""), admin.text("localhost"), 0));
    auto renewed = admin.own(security->createUserToken(admin.text("renewed"), admin.text(""), 0));
    IZELServerString& bob = admin.text("bob");
    IZELServerString& nobody = admin.text("nobody");
    IZELServerString& generated = admin.text();
    admin.run({
        {"add", [&](unsigned&) { return security->addUserToken(bob, *token); }, kUntouched},
        {"add a second", [&](unsigned&) { return security->addUserToken(bob, *renewed); }, kDenied},
        {"add for an unknown account", [&](unsigned&) { return security->addUserToken(nobody, *token); }, kDenied},
        {"exists", boolean([&](bool& f) { return security->userTokenExists(bob, f); }), 1},
        {"of an unknown account", boolean([&](bool& f) { return security->userTokenExists(nobody, f); }), kDenied},
        {"get, with the text the server made",
         checking(boolean([&](bool& f) { return security->getUserToken(bob, *token, f); }),
                  [&] {
                      token->getToken(generated);
                      return generated.length() == 48;
                  }),
         1},
    });
    Client signedIn;
    ASSERT_EQ(signedIn.signInWith(server->port(), {"USER_TOKEN", generated.c_str()}), 0u) << signedIn.lastMessage();
    IZELServerString& id = signedIn.text();
    signedIn.session().getIdentity()->getId(id);
    EXPECT_STREQ(id.c_str(), "bob");

    admin.run({
        {"update", [&](unsigned&) { return security->updateUserToken(bob, *renewed); }, kUntouched},
        {"a timeout of 0 never expires", boolean([&](bool& f) { return security->userTokenExpired(bob, f); }), 0},
        {"remove", boolean([&](bool& f) { return security->removeUserToken(bob, f); }), 1},
        {"remove again", boolean([&](bool& f) { return security->removeUserToken(bob, f); }), 0},
        {"get the removed", boolean([&](bool& f) { return security->getUserToken(bob, *token, f); }), 0},
        {"update the removed", [&](unsigned&) { return security->updateUserToken(bob, *renewed); }, kDenied},
        {"no token cannot have expired", boolean([&](bool& f) { return security->userTokenExpired(bob, f); }), kDenied},
    });
    Client stale;
    EXPECT_EQ(stale.signInWith(server->port(), {"USER_TOKEN", "renewed"}), kRefused) << "the token was removed";
}

// Refusals for want of a right come with kind 2, change nothing and answer nothing: a viewer may read
// but not write, and a user whose only right is its own token may not even read.
TEST_F(EndToEnd, RefusalsForWantOfARight)
{
    auto refused = [](Client& client, const std::vector<std::pair<const char*, Operation>>& steps) {
        for (const auto& [what, operation] : steps) {
            EXPECT_EQ(client.outcome(operation), kDenied) << what;
            EXPECT_EQ(client.lastCode(), 2u) << what;
        }
    };
    Client admin;
    ASSERT_EQ(admin.signIn(server->port(), "ann", "pw-ann"), 0u) << admin.lastMessage();
    ASSERT_EQ(addItem(admin, *admin.repository("shelf"), "item.txt", "item"), 0u);

    Client vic;
    ASSERT_EQ(vic.signIn(server->port(), "vic", "pw-vic"), 0u) << vic.lastMessage();
    IZELServerSession& session = vic.session();
    auto shelf = vic.repository("shelf");
    auto area = vic.area("DATA");
    ASSERT_NE(area, nullptr);
    IZELServerPath* folder = area->createPath(vic.text("/made"));
    auto token = vic.own(session.getSecurityManager()->createUserToken());
    EXPECT_EQ(vic.outcome([&](unsigned& f) { return shelf->itemExists(vic.text("item.txt"), f); }), 1);
    refused(
        vic,
        {
            {"addItem", [&](unsigned&) { return shelf->addItem(vic.text("new.txt"), vic.text(local("item.txt"))); }},
            {"makeDirectory", [&](unsigned&) { return area->makeDirectory(*folder); }},
            {"another account's token",
             boolean([&](bool& f) { return session.getSecurityManager()->getUserToken(vic.text("ann"), *token, f); })},
        });
    area->releaseObject(folder);

    Client zed;
    ASSERT_EQ(zed.signIn(server->port(), "zed", "pw-zed"), 0u) << zed.lastMessage();
    IZELServerSession& outsider = zed.session();
    IZELServerRepositoryManager* manager = outsider.getRepositoryManager();
    IZELServerTransformationManager* jobs = outsider.getTransformationManager();
    auto areas = zed.own(outsider.createMountPointVector());
    auto repositories = zed.own(outsider.createRepositoryVector());
    IZELServerString& text = zed.text("untouched");
    refused(zed, {
                     {"getSharedResources",
                      [&](unsigned&) { return outsider.getMountPointManager()->getSharedResources(*areas); }},
                     {"getRepositories", [&](unsigned&) { return manager->getRepositories(nullptr, *repositories); }},
                     {"getJobResultString", checking([&](unsigned& f) { return jobs->getJobResultString(1, f, text); },
                                                     [&] { return text.equals("untouched"); })},
                 });
    EXPECT_EQ(zed.outcome(
                  boolean([&](bool& f) { return outsider.getSecurityManager()->userTokenExists(zed.text("zed"), f); })),
              0)
        << "its own token is within its rights";
}

}  // namespace
}  // namespace zeltest
