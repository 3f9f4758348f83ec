// The session through the exported entry points, against the scriptable fake server: sign-in, the
// manager getters in each state, disconnect, reconnect at init, session properties, the factories.

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/fake_server.h"

using namespace std::string_literals;
using zeltest::FakeServer;

namespace {

const std::string kSignedIn =
    "<SERVER_SESSION_INIT security_enabled=\"true\"><IDENTITY id=\"ann\" is_authenticated=\"true\">"
    "<ROLES><ROLE name=\"admin\"/></ROLES></IDENTITY></SERVER_SESSION_INIT>";

std::string identityDocument(const std::string& keyword)
{
    return "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?><" + keyword +
           "><IDENTITY id=\"ann\" is_authenticated=\"true\"><ROLES><ROLE name=\"admin\"/></ROLES></IDENTITY></" +
           keyword + ">";
}

zeltest::Bytes firstHandshake()
{
    return zeltest::request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}});
}

// Owns what the test makes through the session, so a failing assertion leaks nothing.
class SessionTest : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_NE(ZEL_createServerSession(&session), nullptr); }
    void TearDown() override
    {
        session->destroyConnectionInfo(&info);
        strings.clear();
        ZEL_destroyServerSession(&session);
        EXPECT_EQ(session, nullptr);
    }

    IZELServerString* text(const char* value)
    {
        strings.emplace_back(session->createString(), Releaser{session});
        strings.back()->assign(value);
        return strings.back().get();
    }

    void useCredentials(const char* host, unsigned short port)
    {
        info = session->createConnectionInfo(*text(host), port, *text("ann"), *text("pw1"));
    }

    // Status number of a call, 0 for success; the status is released.
    unsigned numberOf(IZELServerStatus* status)
    {
        const unsigned number = status ? status->getMessageNumber() : 0;
        session->destroyStatus(&status);
        return number;
    }

    struct Releaser {
        IZELServerSession* owner;
        void operator()(IZELServerString* s) const { owner->destroyString(&s); }
    };

    IZELServerSession* session = nullptr;
    IZELServerConnectionInfo* info = nullptr;
    std::vector<std::unique_ptr<IZELServerString, Releaser>> strings;
};

void expectNoManagers(IZELServerSession& session)
{
    EXPECT_EQ(session.getTransformationManager(), nullptr);
    EXPECT_EQ(session.getRepositoryManager(), nullptr);
    EXPECT_EQ(session.getSecurityManager(), nullptr);
    EXPECT_EQ(session.getMountPointManager(), nullptr);
}

TEST_F(SessionTest, FailedInitsLeaveTheSessionEmpty)
{
    EXPECT_EQ(numberOf(session->disconnect()), 0u) << "disconnect before init is harmless";
    expectNoManagers(*session);

    info = session->createConnectionInfo(*text("http://h:1"), *text("ann"), *text("pw1"));
    ASSERT_NE(info, nullptr);
    EXPECT_EQ(numberOf(session->init(*info, nullptr)), 393639u);
    expectNoManagers(*session);
    EXPECT_EQ(session->getIdentity(), nullptr);
    EXPECT_EQ(numberOf(session->disconnect()), 0u);

    session->destroyConnectionInfo(&info);
    useCredentials("127.0.0.1", 1);
    EXPECT_EQ(numberOf(session->init(*info, nullptr)), 393601u);
    expectNoManagers(*session);
}

TEST_F(SessionTest, SignInMakesTheManagersAndDisconnectTwiceReportsTheSecond)
{
    FakeServer server;
    server.expectFrame(firstHandshake()).sendFrame(zeltest::reply("SUCCESS", kSignedIn)).expectPeerClose();
    server.start();
    useCredentials("127.0.0.1", server.port());

    ASSERT_EQ(numberOf(session->init(*info, nullptr)), 0u);
    EXPECT_NE(session->getTransformationManager(), nullptr);
    EXPECT_NE(session->getRepositoryManager(), nullptr);
    EXPECT_NE(session->getSecurityManager(), nullptr);
    EXPECT_NE(session->getMountPointManager(), nullptr);

    IZELServerIdentity* identity = session->getIdentity();
    ASSERT_NE(identity, nullptr);
    IZELServerString* id = text("");
    identity->getId(*id);
    EXPECT_STREQ(id->c_str(), "ann");
    EXPECT_TRUE(identity->isAuthenticated());

    EXPECT_EQ(numberOf(session->disconnect()), 0u);
    EXPECT_EQ(numberOf(session->disconnect()), 393622u);
    EXPECT_NE(session->getRepositoryManager(), nullptr) << "disconnect keeps the objects";
    EXPECT_TRUE(server.verify());
}

TEST_F(SessionTest, SessionPropertyIsOneExchangeCarryingTheIdentity)
{
    FakeServer server;
    server
        .exchange(zeltest::request("SERVER_SESSION_INIT",
                                   {{"clientID", "tool-7"}, {"userID", "ann"}, {"userPassword", "pw1"}}),
                  zeltest::reply("SUCCESS", kSignedIn))
        .exchange(zeltest::request("SERVER_SESSION_GET_PROP",
                                   {{"identityObject", identityDocument("SERVER_SESSION_GET_PROP")},
                                    {"clientID", "tool-7"},
                                    {"sessionPropName", "BUILD"}}),
                  zeltest::reply("SUCCESS", "24\0x"s));
    server.start();
    useCredentials("127.0.0.1", server.port());
    IZELServerStringArray* options = session->createStringArray();
    options->append("CLIENT_ID");
    options->append("tool-7");

    EXPECT_EQ(numberOf(session->init(*info, options)), 0u);
    IZELServerString* value = text("old");
    EXPECT_EQ(numberOf(session->getSessionProperty(*text("BUILD"), *value)), 0u);
    EXPECT_EQ(std::string(value->data(), value->length()), "24\0x"s) << "the body is copied whole";
    session->destroyStringArray(&options);
    EXPECT_TRUE(server.verify());
}

TEST_F(SessionTest, ServerErrorOnASessionPropertyKeepsTheOutputAndCarriesTheText)
{
    FakeServer server;
    server.exchange(firstHandshake(), zeltest::reply("SUCCESS", kSignedIn))
        .expectAnyFrame()
        .sendFrame(zeltest::reply("ERROR", "Authorization Error: no rights"));
    server.start();
    useCredentials("127.0.0.1", server.port());
    ASSERT_EQ(numberOf(session->init(*info, nullptr)), 0u);

    IZELServerString* value = text("old");
    IZELServerStatus* status = session->getSessionProperty(*text("BUILD"), *value);
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), 393625u);
    EXPECT_EQ(status->getCode(), 2u);
    EXPECT_NE(std::string(status->getMessage()).find("no rights"), std::string::npos) << status->getMessage();
    session->destroyStatus(&status);
    EXPECT_STREQ(value->c_str(), "old");
    EXPECT_TRUE(server.verify());
}

TEST_F(SessionTest, RefusedSignInKeepsOnlyTheConnection)
{
    FakeServer server;
    server.exchange(firstHandshake(), zeltest::reply("ERROR", "Authentication Error: bad password")).expectPeerClose();
    server.start();
    useCredentials("127.0.0.1", server.port());

    IZELServerStatus* status = session->init(*info, nullptr);
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), 393625u);
    EXPECT_EQ(status->getCode(), 1u);
    session->destroyStatus(&status);
    expectNoManagers(*session);
    EXPECT_EQ(numberOf(session->disconnect()), 0u) << "the connection stays until disconnect";
    EXPECT_TRUE(server.verify());
}

// A token in the properties signs in with the token; the client id of the options wins over theirs.
TEST_F(SessionTest, TokenSignInTakesTheClientIdFromTheOptionsBeforeTheProperties)
{
    FakeServer server;
    server.exchange(zeltest::request("SERVER_SESSION_INIT", {{"clientID", "from-options"}, {"userToken", "t"}}),
                    zeltest::reply("SUCCESS", kSignedIn));
    server.start();
    IZELServerStringArray* properties = session->createStringArray();
    properties->appendTokens("USER_TOKEN;t;CLIENT_ID;from-properties", ";");
    info = session->createConnectionInfo(*text("127.0.0.1"), server.port(), *properties);
    IZELServerStringArray* options = session->createStringArray();
    options->appendTokens("CLIENT_ID;from-options", ";");

    EXPECT_EQ(numberOf(session->init(*info, options)), 0u);
    session->destroyStringArray(&properties);
    session->destroyStringArray(&options);
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

TEST_F(SessionTest, EveryFactoryMakesAnObjectItsDestroyTakesBackAndNullIsAccepted)
{
    IZELServerSession& s = *session;
    using S = IZELServerSession;
    roundTrip<IZELServerString>(s, &S::createString, &S::destroyString);
    roundTrip<IZELServerStringArray>(s, &S::createStringArray, &S::destroyStringArray);
    roundTrip<IZELServerTransformationResult>(s, &S::createTransformationResult, &S::destroyTransformationResult);
    roundTrip<IZELServerService>(s, &S::createService, &S::destroyService);
    roundTrip<IZELServerVector<IZELServerService>>(s, &S::createServiceVector, &S::destroyServiceVector);
    roundTrip<IZELServerWorkspace>(s, &S::createWorkspace, &S::destroyWorkspace);
    roundTrip<IZELServerVector<IZELServerWorkspace>>(s, &S::createWorkspaceVector, &S::destroyWorkspaceVector);
    roundTrip<IZELServerRepository>(s, &S::createRepository, &S::destroyRepository);
    roundTrip<IZELServerVector<IZELServerRepository>>(s, &S::createRepositoryVector, &S::destroyRepositoryVector);
    roundTrip<IZELServerWorkspaceSummary>(s, &S::createWorkspaceSummary, &S::destroyWorkspaceSummary);
    roundTrip<IZELServerVector<IZELServerWorkspaceSummary>>(s, &S::createWorkspaceSummaryVector,
                                                            &S::destroyWorkspaceSummaryVector);
    roundTrip<IZELServerWorkspaceService>(s, &S::createWorkspaceService, &S::destroyWorkspaceService);
    roundTrip<IZELServerVector<IZELServerWorkspaceService>>(s, &S::createWorkspaceServiceVector,
                                                            &S::destroyWorkspaceServiceVector);
    roundTrip<IZELServerCustomFormat>(s, &S::createCustomFormat, &S::destroyCustomFormat);
    roundTrip<IZELServerVector<IZELServerCustomFormat>>(s, &S::createCustomFormatVector, &S::destroyCustomFormatVector);
    roundTrip<IZELServerCustomTransformer>(s, &S::createCustomTransformer, &S::destroyCustomTransformer);
    roundTrip<IZELServerVector<IZELServerCustomTransformer>>(s, &S::createCustomTransformerVector,
                                                             &S::destroyCustomTransformerVector);
    roundTrip<IZELServerResource>(s, &S::createResource, &S::destroyResource);
    roundTrip<IZELServerVector<IZELServerResource>>(s, &S::createResourceVector, &S::destroyResourceVector);
    roundTrip<IZELServerPropertyAccessor>(s, &S::createPropertyAccessor, &S::destroyPropertyAccessor);
    roundTrip<IZELServerVector<IZELServerProperty>>(s, &S::createPropertyVector, &S::destroyPropertyVector);
    roundTrip<IZELServerLogFileInfo>(s, &S::createLogFileInfo, &S::destroyLogFileInfo);
    roundTrip<IZELServerTemplate>(s, &S::createTemplate, &S::destroyTemplate);
    roundTrip<IZELServerVector<IZELServerTemplate>>(s, &S::createTemplateVector, &S::destroyTemplateVector);
    roundTrip<IZELServerVector<IZELServerItem>>(s, &S::createItemVector, &S::destroyItemVector);
    roundTrip<IZELServerMountPoint>(s, &S::createMountPoint, &S::destroyMountPoint);
    roundTrip<IZELServerVector<IZELServerMountPoint>>(s, &S::createMountPointVector, &S::destroyMountPointVector);
    roundTrip<IZELServerFileInfo>(s, &S::createFileInfo, &S::destroyFileInfo);
    roundTrip<IZELServerVector<IZELServerFileInfo>>(s, &S::createFileInfoVector, &S::destroyFileInfoVector);

    // Objects made before any reply was read into them are empty and disabled.
    IZELServerWorkspace* workspace = s.createWorkspace();
    IZELServerWorkspaceSummary* summary = s.createWorkspaceSummary();
    EXPECT_FALSE(workspace->isEnabled());
    EXPECT_EQ(workspace->getFileSize(), 0);
    EXPECT_FALSE(summary->isEnabled());
    s.destroyWorkspace(&workspace);
    s.destroyWorkspaceSummary(&summary);

    // Destroying nothing is harmless and leaves null.
    IZELServerString* string = nullptr;
    session->destroyString(&string);
    EXPECT_EQ(string, nullptr);
    session->destroyString(nullptr);
    IZELServerSession* none = nullptr;
    ZEL_destroyServerSession(&none);
    EXPECT_EQ(none, nullptr);
}

TEST_F(SessionTest, ANewServiceIsEnabledAndTakesWorkspacesOnly)
{
    IZELServerService* service = session->createService(*text("s"), *text("S"), *text("d"), *text("u"));
    ASSERT_NE(service, nullptr);
    EXPECT_EQ(service->isEnabled(), 1u);
    const unsigned expected[] = {0, 1, 0, 0, 0, 0};  // item types 0 to 5: only workspaces (1)
    for (unsigned type = 0; type < 6; ++type)
        EXPECT_EQ(service->isRegistrationAllowed(type), expected[type]) << "item type " << type;
    IZELServerString* name = text("");
    service->getUrlPattern(*name);
    EXPECT_STREQ(name->c_str(), "u");
    session->destroyService(&service);
}

TEST_F(SessionTest, TransformationFactoriesComposeTheWorkspacePath)
{
    IZELServerTransformationRequest* request =
        session->createTransformationRequest(*text("jobs"), *text("R"), *text("w.zlw"));
    ASSERT_NE(request, nullptr);
    IZELServerString* requestText = text("");
    request->getRequestText(*requestText);
    EXPECT_EQ(std::string(requestText->c_str()).rfind("R/w/w.zlw -XML_PARAMETER ", 0), 0u) << requestText->c_str();
    session->destroyTransformationRequest(&request);
    EXPECT_EQ(request, nullptr);

    IZELServerTransformationResult* result = session->createTransformationResult(*text("jobStatus=SUCCESS\0id=7"));
    ASSERT_NE(result, nullptr);
    session->destroyTransformationResult(&result);
}

}  // namespace
