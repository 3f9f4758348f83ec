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
    IZELServerString* address = session->createString();
    address->assign("http://h:1");
    IZELServerConnectionInfo* web = session->createConnectionInfo(*address, *address, *address);
    EXPECT_EQ(outcome(session->init(*web, nullptr)).number, 393639u);
    session->destroyConnectionInfo(&web);
    session->destroyString(&address);
    EXPECT_EQ(init(1).number, 393601u);
    EXPECT_FALSE(hasManagers(*session));
    EXPECT_EQ(outcome(session->disconnect()).number, 0u) << "disconnect without a connection is harmless";

    FakeServer server;
    server.exchange(firstHandshake(), reply("ERROR", "Authentication Error: bad password")).expectPeerClose();
    server.start();
    const Outcome refused = init(server.port());
    EXPECT_EQ(refused.number, 393625u);
    EXPECT_EQ(refused.code, 1u);
    EXPECT_FALSE(hasManagers(*session));
    EXPECT_EQ(outcome(session->disconnect()).number, 0u) << "the connection stays until disconnect";
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
    EXPECT_TRUE(hasManagers(*session)) << "disconnect keeps the objects";
    EXPECT_TRUE(server.verify());
}

// A token in the properties signs in with the token; the client id of the options wins over theirs.
TEST_F(HostileSessionTest, TokenSignInTakesTheClientIdFromTheOptionsBeforeTheProperties)
{
    FakeServer server;
    server.exchange(request("SERVER_SESSION_INIT", {{"clientID", "from-options"}, {"userToken", "t"}}), signedIn());
    server.start();
    IZELServerString* host = session->createString();
    host->assign("127.0.0.1");
    IZELServerStringArray* properties = session->createStringArray();
    properties->appendTokens("USER_TOKEN;t;CLIENT_ID;from-properties", ";");
    IZELServerConnectionInfo* info = session->createConnectionInfo(*host, server.port(), *properties);
    properties->clear();
    properties->appendTokens("CLIENT_ID;from-options", ";");
    EXPECT_EQ(outcome(session->init(*info, properties)).number, 0u);
    session->destroyConnectionInfo(&info);
    session->destroyStringArray(&properties);
    session->destroyString(&host);
    EXPECT_TRUE(server.verify());
}

// Every factory hands out a live object that its destroy operation takes back, leaving null.
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
    roundTrip<IZELServerStringArray>(s, &S::createStringArray, &S::destroyStringArray);
    roundTrip<IZELServerTransformationResult>(s, &S::createTransformationResult, &S::destroyTransformationResult);
    roundTrip<IZELServerService>(s, &S::createService, &S::destroyService);
    roundTrip<Vector<IZELServerService>>(s, &S::createServiceVector, &S::destroyServiceVector);
    roundTrip<IZELServerWorkspace>(s, &S::createWorkspace, &S::destroyWorkspace);
    roundTrip<Vector<IZELServerWorkspace>>(s, &S::createWorkspaceVector, &S::destroyWorkspaceVector);
    roundTrip<Vector<IZELServerRepository>>(s, &S::createRepositoryVector, &S::destroyRepositoryVector);
    roundTrip<IZELServerWorkspaceSummary>(s, &S::createWorkspaceSummary, &S::destroyWorkspaceSummary);
    roundTrip<Vector<IZELServerWorkspaceSummary>>(s, &S::createWorkspaceSummaryVector,
                                                  &S::destroyWorkspaceSummaryVector);
    roundTrip<IZELServerWorkspaceService>(s, &S::createWorkspaceService, &S::destroyWorkspaceService);
    roundTrip<Vector<IZELServerWorkspaceService>>(s, &S::createWorkspaceServiceVector,
                                                  &S::destroyWorkspaceServiceVector);
    roundTrip<IZELServerCustomFormat>(s, &S::createCustomFormat, &S::destroyCustomFormat);
    roundTrip<Vector<IZELServerCustomFormat>>(s, &S::createCustomFormatVector, &S::destroyCustomFormatVector);
    roundTrip<IZELServerCustomTransformer>(s, &S::createCustomTransformer, &S::destroyCustomTransformer);
    roundTrip<Vector<IZELServerCustomTransformer>>(s, &S::createCustomTransformerVector,
                                                   &S::destroyCustomTransformerVector);
    roundTrip<IZELServerResource>(s, &S::createResource, &S::destroyResource);
    roundTrip<Vector<IZELServerResource>>(s, &S::createResourceVector, &S::destroyResourceVector);
    roundTrip<IZELServerPropertyAccessor>(s, &S::createPropertyAccessor, &S::destroyPropertyAccessor);
    roundTrip<Vector<IZELServerProperty>>(s, &S::createPropertyVector, &S::destroyPropertyVector);
    roundTrip<IZELServerLogFileInfo>(s, &S::createLogFileInfo, &S::destroyLogFileInfo);
    roundTrip<IZELServerTemplate>(s, &S::createTemplate, &S::destroyTemplate);
    roundTrip<Vector<IZELServerTemplate>>(s, &S::createTemplateVector, &S::destroyTemplateVector);
    roundTrip<Vector<IZELServerItem>>(s, &S::createItemVector, &S::destroyItemVector);
    roundTrip<IZELServerMountPoint>(s, &S::createMountPoint, &S::destroyMountPoint);
    roundTrip<Vector<IZELServerMountPoint>>(s, &S::createMountPointVector, &S::destroyMountPointVector);
    roundTrip<IZELServerFileInfo>(s, &S::createFileInfo, &S::destroyFileInfo);
    roundTrip<Vector<IZELServerFileInfo>>(s, &S::createFileInfoVector, &S::destroyFileInfoVector);
    IZELServerSession* none = nullptr;
    ZEL_destroyServerSession(&none);
    session->destroyString(nullptr);
}

TEST_F(HostileSessionTest, ANewServiceTakesWorkspacesOnlyAndARequestComposesTheWorkspacePath)
{
    IZELServerString* text = session->createString();
    text->assign("w.zlw");
    IZELServerService* service = session->createService(*text, *text, *text, *text);
    EXPECT_EQ(service->isEnabled(), 1u);
    for (unsigned type = 0; type < 6; ++type) {
        EXPECT_EQ(service->isRegistrationAllowed(type), type == 1 ? 1u : 0u) << "item type " << type;
    }
    session->destroyService(&service);
    IZELServerTransformationRequest* request = session->createTransformationRequest(*text, *text, *text);
    request->getRequestText(*text);
    EXPECT_EQ(std::string(text->c_str()).rfind("w.zlw/w/w.zlw -XML_PARAMETER ", 0), 0u) << text->c_str();
    session->destroyTransformationRequest(&request);
    session->destroyString(&text);
}

}  // namespace
}  // namespace zeltest
