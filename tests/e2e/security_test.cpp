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

namespace zeltest {
namespace {

TEST_F(EndToEnd, AViewerMayReadButNotWrite)
{
    Client admin;
    ASSERT_EQ(admin.signIn(server->port(), "ann", "pw-ann"), 0u) << admin.lastMessage();
    IZELServerRepository* own = admin.repository("shelf");
    writeFile(local("item.txt"), "item");
    ASSERT_EQ(admin.take(own->addItem(admin.text("item.txt"), admin.text(local("item.txt")))), 0u);
    admin.session().destroyRepository(&own);

    Client viewer;
    ASSERT_EQ(viewer.signIn(server->port(), "vic", "pw-vic"), 0u) << viewer.lastMessage();
    IZELServerRepository* shelf = viewer.repository("shelf");
    unsigned exists = 0;
    EXPECT_EQ(viewer.take(shelf->itemExists(viewer.text("item.txt"), exists)), 0u) << viewer.lastMessage();
    EXPECT_EQ(exists, 1u);
    EXPECT_EQ(viewer.take(shelf->addItem(viewer.text("new.txt"), viewer.text(local("item.txt")))), 393625u);
    EXPECT_EQ(viewer.lastCode(), 2u) << viewer.lastMessage();
    unsigned removed = 1;
    EXPECT_EQ(viewer.take(shelf->removeItem(viewer.text("item.txt"), removed)), 393625u);
    EXPECT_EQ(removed, 0u);
    viewer.session().destroyRepository(&shelf);
    EXPECT_EQ(viewer.take(viewer.session().getRepositoryManager()->addRepository(viewer.text("mine"), viewer.text(""))),
              393625u);

    IZELServerMountPoint* area = viewer.area("DATA");
    ASSERT_NE(area, nullptr);
    IZELServerPath* folder = area->createPath(viewer.text("/made"));
    EXPECT_EQ(viewer.take(area->makeDirectory(*folder)), 393625u);
    EXPECT_EQ(viewer.lastCode(), 2u) << viewer.lastMessage();
    area->releaseObject(folder);
    viewer.session().destroyMountPoint(&area);

    IZELServerTransformationRequest* request = viewer.session().createTransformationRequest(
        viewer.text("zeljob"), viewer.text("shelf"), viewer.text("item.zlw"));
    unsigned id = 0;
    EXPECT_EQ(viewer.take(viewer.session().getTransformationManager()->submitJob(*request, id)), 393625u);
    EXPECT_EQ(viewer.lastCode(), 2u) << viewer.lastMessage();
    viewer.session().destroyTransformationRequest(&request);

    bool found = true;
    IZELServerUserToken* token = viewer.session().getSecurityManager()->createUserToken();
    EXPECT_EQ(viewer.take(viewer.session().getSecurityManager()->getUserToken(viewer.text("ann"), *token, found)),
              393625u) << "another account's token needs tokens.admin";
    viewer.session().getSecurityManager()->destroyUserToken(&token);
}

TEST_F(EndToEnd, AnExpiredTokenNoLongerSignsIn)
{
    Client admin;
    ASSERT_EQ(admin.signIn(server->port(), "ann", "pw-ann"), 0u) << admin.lastMessage();
    IZELServerSecurityManager* security = admin.session().getSecurityManager();
    IZELServerUserToken* token = security->createUserToken(admin.text("short-lived"), admin.text(""), 1);
    ASSERT_EQ(admin.take(security->addUserToken(admin.text("bob"), *token)), 0u) << admin.lastMessage();
    security->destroyUserToken(&token);

    std::this_thread::sleep_for(std::chrono::seconds(2));
    bool expired = false;
    EXPECT_EQ(admin.take(security->userTokenExpired(admin.text("bob"), expired)), 0u);
    EXPECT_TRUE(expired);
    Client late;
    EXPECT_EQ(late.signInWith(server->port(), {"USER_TOKEN", "short-lived"}), 393625u);
    EXPECT_EQ(late.session().getRepositoryManager(), nullptr);
}

TEST_F(EndToEnd, TokenOperationsSucceedAndFail)
{
    Client admin;
    ASSERT_EQ(admin.signIn(server->port(), "ann", "pw-ann"), 0u) << admin.lastMessage();
    IZELServerSecurityManager* security = admin.session().getSecurityManager();
    IZELServerUserToken* token = security->createUserToken(admin.text(""), admin.text("localhost"), 0);
    ASSERT_EQ(admin.take(security->addUserToken(admin.text("bob"), *token)), 0u) << admin.lastMessage();
    bool found = false;
    ASSERT_EQ(admin.take(security->getUserToken(admin.text("bob"), *token, found)), 0u) << admin.lastMessage();
    ASSERT_TRUE(found);
    IZELServerString& generated = admin.text();
    token->getToken(generated);
    EXPECT_EQ(generated.length(), 48u) << "an empty token is generated by the server";

    Client bob;
    EXPECT_EQ(bob.signInWith(server->port(), {"USER_TOKEN", generated.c_str()}), 0u) << bob.lastMessage();

    IZELServerUserToken* renewed = security->createUserToken(admin.text("renewed"), admin.text(""), 0);
    EXPECT_EQ(admin.take(security->updateUserToken(admin.text("bob"), *renewed)), 0u) << admin.lastMessage();
    security->destroyUserToken(&renewed);
    bool expired = true;
    EXPECT_EQ(admin.take(security->userTokenExpired(admin.text("bob"), expired)), 0u);
    EXPECT_FALSE(expired) << "a timeout of 0 never expires";
    bool removed = false;
    EXPECT_EQ(admin.take(security->removeUserToken(admin.text("bob"), removed)), 0u);
    EXPECT_TRUE(removed);
    EXPECT_EQ(admin.take(security->removeUserToken(admin.text("bob"), removed)), 0u);
    EXPECT_FALSE(removed);
    EXPECT_EQ(admin.take(security->userTokenExpired(admin.text("bob"), expired)), 393625u)
        << "an account without a token cannot have expired";
    EXPECT_EQ(admin.take(security->addUserToken(admin.text("nobody"), *token)), 393625u) << "unknown account";
    bool exists = true;
    EXPECT_EQ(admin.take(security->userTokenExists(admin.text("nobody"), exists)), 393625u);
    found = true;
    EXPECT_EQ(admin.take(security->getUserToken(admin.text("bob"), *token, found)), 0u);
    EXPECT_FALSE(found);
    security->destroyUserToken(&token);

    Client stale;
    EXPECT_EQ(stale.signInWith(server->port(), {"USER_TOKEN", "renewed"}), 393625u) << "the token was removed";
}

// A user whose only right is tokens signs in and is refused every read of every manager.
TEST_F(EndToEnd, AUserWithoutReadRightsIsRefusedEveryList)
{
    Client zed;
    ASSERT_EQ(zed.signIn(server->port(), "zed", "pw-zed"), 0u) << zed.lastMessage();
    IZELServerSession& session = zed.session();

    IZELServerVector<IZELServerMountPoint>* areas = session.createMountPointVector();
    EXPECT_EQ(zed.take(session.getMountPointManager()->getSharedResources(*areas)), 393625u);
    EXPECT_EQ(zed.lastCode(), 2u);
    session.destroyMountPointVector(&areas);
    IZELServerMountPoint* area = session.createMountPoint();
    unsigned found = 1;
    EXPECT_EQ(zed.take(session.getMountPointManager()->getSharedResource(zed.text("DATA"), *area, found)), 393625u);
    EXPECT_EQ(found, 0u);
    session.destroyMountPoint(&area);

    IZELServerRepositoryManager* manager = session.getRepositoryManager();
    IZELServerVector<IZELServerRepository>* repositories = session.createRepositoryVector();
    EXPECT_EQ(zed.take(manager->getRepositories(nullptr, *repositories)), 393625u);
    EXPECT_EQ(zed.lastCode(), 2u);
    session.destroyRepositoryVector(&repositories);
    IZELServerVector<IZELServerService>* services = session.createServiceVector();
    EXPECT_EQ(zed.take(manager->getServices(nullptr, *services)), 393625u);
    ZELServerStringDict badFilter;
    badFilter.insert("ENABLE_FILTER", "enabled");
    EXPECT_EQ(zed.take(manager->getServices(&badFilter, *services)), 393619u) << "refused before sending";
    session.destroyServiceVector(&services);
    ZELServerStringDict global;
    global.insert("GLOBAL", "ALLITEMS");
    IZELServerPropertyAccessor* items = session.createPropertyAccessor();
    EXPECT_EQ(zed.take(manager->getGlobalItems(&global, *items)), 393625u);
    session.destroyPropertyAccessor(&items);
    unsigned exists = 1;
    EXPECT_EQ(zed.take(manager->serviceExists(zed.text("any"), exists)), 393625u);
    EXPECT_EQ(exists, 0u);

    IZELServerTransformationResult* result = session.createTransformationResult();
    EXPECT_EQ(zed.take(session.getTransformationManager()->getJobResult(1, found, *result)), 393625u);
    EXPECT_EQ(zed.lastCode(), 2u);
    session.destroyTransformationResult(&result);
    IZELServerString& text = zed.text("untouched");
    EXPECT_EQ(zed.take(session.getTransformationManager()->getJobResultString(1, found, text)), 393625u);
    EXPECT_STREQ(text.c_str(), "untouched");

    bool has = true;
    EXPECT_EQ(zed.take(session.getSecurityManager()->userTokenExists(zed.text("zed"), has)), 0u) << zed.lastMessage();
    EXPECT_FALSE(has) << "its own token is within its rights";
}

}  // namespace
}  // namespace zeltest
