// The session through the exported entry points, against the scriptable fake server: sign-in, the
// manager getters in each state, disconnect, session properties, the factories.

#include <gtest/gtest.h>

#include <string>

#include "hostile_fixture.h"

namespace zeltest {
namespace {

using namespace std::string_literals;

bool hasManagers(IZELServerSession& session)
{
    const int made = (session.getTransformationManager() != nullptr) + (session.getRepositoryManager() != nullptr) +
                     (session.getSecurityManager() != nullptr) + (session.getMountPointManager() != nullptr);
    EXPECT_TRUE(made == 0 || made == 4) << made << " of 4 managers";
    return made == 4;
}

TEST_F(HostileSessionTest, FailedInitsLeaveNoManagersAndARefusedSignInKeepsTheConnection)
{
    EXPECT_EQ(sessionProperty().number, 393622u) << "before init";
    Texts t(*session);
    const auto web = zelServerOwn(*session, session->createConnectionInfo(t("http://h:1"), t("ann"), t("pw1")));
    EXPECT_EQ(outcome(session->init(*web, nullptr)).number, 393639u);
    EXPECT_EQ(init(1).number, 393601u);
    EXPECT_FALSE(hasManagers(*session));
    EXPECT_EQ(outcome(session->disconnect()).number, 0u) << "disconnect without a connection is harmless";

    // A refusal keeps the connection until disconnect; a sign-in without an identity leaves an
    // unauthenticated one.
    FakeServer server;
    server.exchange(firstHandshake(), reply("ERROR", "Authentication Error: bad password")).expectPeerClose();
    server.acceptNext().exchange(firstHandshake(), reply("SUCCESS", "<S/>"));
    server.start();
    const Outcome refused = init(server.port());
    EXPECT_EQ(refused.number, 393625u);
    EXPECT_EQ(refused.code, 1u);
    EXPECT_FALSE(hasManagers(*session));
    EXPECT_EQ(outcome(session->disconnect()).number, 0u);
    EXPECT_EQ(init(server.port()).number, 393631u);
    ASSERT_NE(session->getIdentity(), nullptr);
    EXPECT_FALSE(session->getIdentity()->isAuthenticated());
    EXPECT_TRUE(server.verify());
}

TEST_F(HostileSessionTest, SessionPropertiesCarryTheIdentityAndTheClientIdOfTheOptions)
{
    const std::string identity =
        R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><SERVER_SESSION_GET_PROP>)"
        R"(<IDENTITY id="ann" is_authenticated="true"><ROLES/></IDENTITY></SERVER_SESSION_GET_PROP>)";
    const Bytes property =
        request("SERVER_SESSION_GET_PROP",
                {{"identityObject", identity}, {"clientID", "tool-7"}, {"sessionPropName", "BUILD"}});
    FakeServer server;
    server
        .exchange(request("SERVER_SESSION_INIT", {{"clientID", "tool-7"}, {"userID", "ann"}, {"userPassword", "pw1"}}),
                  signedIn())
        .exchange(property, reply("SUCCESS", "24\0x"s))
        .exchange(property, reply("ERROR", "Authorization Error: no rights"))
        .expectPeerClose();
    server.start();
    IZELServerStringArray* options = session->createStringArray();
    options->appendTokens("CLIENT_ID;tool-7", ";");
    const PropertyConnection info(server.port(), {});
    ASSERT_EQ(outcome(session->init(info, options)).number, 0u);
    session->destroyStringArray(&options);
    EXPECT_TRUE(hasManagers(*session));

    std::string value;
    EXPECT_EQ(sessionProperty(&value).number, 0u);
    EXPECT_EQ(value, "24\0x"s) << "the body is copied whole";
    const Outcome refused = sessionProperty(&value);
    EXPECT_EQ(refused.number, 393625u);
    EXPECT_EQ(refused.code, 2u);
    EXPECT_EQ(value, "24\0x"s) << "a failure keeps the output";
    EXPECT_EQ(outcome(session->disconnect()).number, 0u);
    EXPECT_EQ(outcome(session->disconnect()).number, 393622u);
    EXPECT_EQ(sessionProperty().number, 393622u);
    unsigned received = 7;
    EXPECT_EQ(outcome(getItem(*session, "x", received)).number, 393622u);
    EXPECT_TRUE(hasManagers(*session)) << "disconnect keeps the objects";
    EXPECT_TRUE(server.verify());
}

// A token in the properties signs in with the token; the client id of the options wins over theirs.
TEST_F(HostileSessionTest, TokenSignInTakesTheClientIdFromTheOptionsBeforeTheProperties)
{
    FakeServer server;
    server.exchange(request("SERVER_SESSION_INIT", {{"clientID", "from-options"}, {"userToken", "t"}}), signedIn());
    server.start();
    Texts t(*session);
    const auto properties = zelServerOwn(*session, session->createStringArray());
    properties->appendTokens("USER_TOKEN;t;CLIENT_ID;from-properties", ";");
    const auto info = zelServerOwn(*session, session->createConnectionInfo(t("127.0.0.1"), server.port(), *properties));
    properties->clear();
    properties->appendTokens("CLIENT_ID;from-options", ";");
    EXPECT_EQ(outcome(session->init(*info, properties.get())).number, 0u);
    EXPECT_TRUE(server.verify());
}

// Every factory hands out a live object that its destroy operation takes back, leaving null (the
// vectors the listing calls use are left to the end-to-end suites).
template <class T>
void roundTrip(IZELServerSession& session, T* (IZELServerSession::*create)(), void (IZELServerSession::*destroy)(T**))
{
    T* object = (session.*create)();
    EXPECT_NE(object, nullptr);
    (session.*destroy)(&object);
    EXPECT_EQ(object, nullptr);
}

template <class T>
using Vector = IZELServerVector<T>;

TEST_F(HostileSessionTest, EveryFactoryMakesAnObjectItsDestroyTakesBack)
{
    IZELServerSession& s = *session;
    using S = IZELServerSession;
    roundTrip<IZELServerTransformationResult>(s, &S::createTransformationResult, &S::destroyTransformationResult);
    roundTrip<IZELServerService>(s, &S::createService, &S::destroyService);
    roundTrip<IZELServerWorkspace>(s, &S::createWorkspace, &S::destroyWorkspace);
    roundTrip<IZELServerWorkspaceSummary>(s, &S::createWorkspaceSummary, &S::destroyWorkspaceSummary);
    roundTrip<IZELServerWorkspaceService>(s, &S::createWorkspaceService, &S::destroyWorkspaceService);
    roundTrip<IZELServerCustomFormat>(s, &S::createCustomFormat, &S::destroyCustomFormat);
    roundTrip<IZELServerCustomTransformer>(s, &S::createCustomTransformer, &S::destroyCustomTransformer);
    roundTrip<IZELServerResource>(s, &S::createResource, &S::destroyResource);
    roundTrip<Vector<IZELServerResource>>(s, &S::createResourceVector, &S::destroyResourceVector);
    roundTrip<IZELServerPropertyAccessor>(s, &S::createPropertyAccessor, &S::destroyPropertyAccessor);
    roundTrip<Vector<IZELServerProperty>>(s, &S::createPropertyVector, &S::destroyPropertyVector);
    roundTrip<IZELServerLogFileInfo>(s, &S::createLogFileInfo, &S::destroyLogFileInfo);
    roundTrip<IZELServerTemplate>(s, &S::createTemplate, &S::destroyTemplate);
    roundTrip<IZELServerMountPoint>(s, &S::createMountPoint, &S::destroyMountPoint);
    roundTrip<Vector<IZELServerMountPoint>>(s, &S::createMountPointVector, &S::destroyMountPointVector);
    roundTrip<IZELServerFileInfo>(s, &S::createFileInfo, &S::destroyFileInfo);
    IZELServerSession* none = nullptr;
    ZEL_destroyServerSession(&none);
    session->destroyString(nullptr);
}

}  // namespace
}  // namespace zeltest
