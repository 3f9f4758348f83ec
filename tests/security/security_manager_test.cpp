// The security manager against the fake server: every "SEC_" command byte for byte, what each reads
// back, and what the caller's values look like after a failure.

#include "security/ZELServerSecurityManager.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "security/ZELServerUserToken.h"
#include "security/security_factories.h"
#include "support/signed_in_channel.h"

namespace zel {
namespace {

using zeltest::Bytes;
using zeltest::describe;
using zeltest::StatusPtr;
using TokenPtr = std::unique_ptr<IZELServerUserToken>;

const ZELServerString kAccount("ann");

std::string tokenOf(const IZELServerUserToken& token)
{
    ZELServerString text;
    token.getToken(text);
    return text.str();
}

std::string addressOf(const IZELServerUserToken& token)
{
    ZELServerString text;
    token.getClientAddress(text);
    return text.str();
}

// The XML library writes attributes sorted by name, whatever order they were set in.
std::string userTokenElement(const std::string& token, const std::string& address, const std::string& timeout,
                             const std::string& first = "", const std::string& last = "",
                             const std::string& expiration = "")
{
    return R"(<USERTOKEN clientaddress=")" + address + R"(" expirationdate=")" + expiration +
           R"(" expirationtimeout=")" + timeout + R"(" firsttokendate=")" + first + R"(" lasttokendate=")" + last +
           R"(" token=")" + token + R"("/>)";
}

class SecurityManagerTest : public zeltest::SignedInChannelTest {
protected:
    static Bytes accountCommand(const std::string& keyword)
    {
        return command(keyword, {{"userAccountName", "ann"}});
    }
    static Bytes tokenCommand(const std::string& keyword, const std::string& element)
    {
        return command(keyword, {{"userAccountName", "ann"}, {"userTokenObject", xmlDocument(keyword, element)}});
    }

    std::unique_ptr<IZELServerSecurityManager> manager{makeSecurityManager(channel.get())};
};

// ---- The three boolean commands ---------------------------------------------------------------------

using FlagOperation = IZELServerStatus* (IZELServerSecurityManager::*)(const IZELServerString&, bool&);

struct FlagCommand {
    const char* keyword;
    FlagOperation operation;
};

void PrintTo(const FlagCommand& command, std::ostream* out) { *out << command.keyword; }

class FlagCommandTest : public SecurityManagerTest, public ::testing::WithParamInterface<FlagCommand> {
protected:
    IZELServerStatus* run(bool& flag) { return ((*manager).*GetParam().operation)(kAccount, flag); }
};

TEST_P(FlagCommandTest, SendsTheAccountAndReadsTrue)
{
    server.exchange(accountCommand(GetParam().keyword), zeltest::reply("SUCCESS", "true"));
    signIn();
    bool flag = false;
    const StatusPtr status(run(flag));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(flag);
    EXPECT_TRUE(server.verify());
}

TEST_P(FlagCommandTest, ReadsFalse)
{
    server.exchange(accountCommand(GetParam().keyword), zeltest::reply("SUCCESS", "false"));
    signIn();
    bool flag = true;
    const StatusPtr status(run(flag));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_FALSE(flag);
    EXPECT_TRUE(server.verify());
}

TEST_P(FlagCommandTest, ABodyThatIsNoBooleanKeepsTheCallersValueAndIsNoFailure)
{
    server.exchange(accountCommand(GetParam().keyword), zeltest::reply("SUCCESS", "True"))
        .exchange(accountCommand(GetParam().keyword), zeltest::reply("SUCCESS", "false "));
    signIn();
    bool flag = true;
    StatusPtr status(run(flag));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(flag);
    flag = false;
    status.reset(run(flag));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_FALSE(flag);
    EXPECT_TRUE(server.verify());
}

TEST_P(FlagCommandTest, AServerErrorComesBackAndLeavesTheFlagAlone)
{
    server.exchange(accountCommand(GetParam().keyword), zeltest::reply("ERROR", "Authorization Error: not yours"))
        .exchange(accountCommand(GetParam().keyword), zeltest::reply("ERROR", "no such account"));
    signIn();
    bool flag = true;
    StatusPtr status(run(flag));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 2u);
    EXPECT_TRUE(flag);
    flag = false;
    status.reset(run(flag));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 0u);
    EXPECT_FALSE(flag);
    EXPECT_TRUE(server.verify());
}

INSTANTIATE_TEST_SUITE_P(Commands, FlagCommandTest,
                         ::testing::Values(FlagCommand{"SEC_USERTOKEN_EXISTS", &IZELServerSecurityManager::userTokenExists},
                                           FlagCommand{"SEC_REMOVE_USERTOKEN", &IZELServerSecurityManager::removeUserToken},
                                           FlagCommand{"SEC_USERTOKEN_EXPIRED", &IZELServerSecurityManager::userTokenExpired}),
                         [](const auto& info) { return std::string(info.param.keyword); });

TEST_F(SecurityManagerTest, ALostConnectionIsTheChannelsStatusAndLeavesTheFlagAlone)
{
    server.expectFrame(accountCommand("SEC_USERTOKEN_EXISTS")).closeConnection();
    signIn();
    bool exists = true;
    const StatusPtr status(manager->userTokenExists(kAccount, exists));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kReceiveFailed);
    EXPECT_TRUE(exists);
    EXPECT_TRUE(server.verify());
}

// ---- Fetching a token -------------------------------------------------------------------------------

TEST_F(SecurityManagerTest, GetUserTokenFillsTheTokenFromTheReply)
{
    server.exchange(accountCommand("SEC_GET_USERTOKEN"),
                    zeltest::reply("SUCCESS", "<SEC_GET_USERTOKEN>" +
                                                  userTokenElement("tok-9", "10.0.0.5", " 7200.00", "2024-01-01",
                                                                   "2024-01-02", "2024-02-01") +
                                                  "</SEC_GET_USERTOKEN>"));
    signIn();
    const TokenPtr token(manager->createUserToken());
    bool found = false;
    const StatusPtr status(manager->getUserToken(kAccount, *token, found));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(found);
    EXPECT_EQ(tokenOf(*token), "tok-9");
    EXPECT_EQ(addressOf(*token), "10.0.0.5");
    EXPECT_EQ(token->getExpirationTimeout(), 7200);
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, GetUserTokenWithoutATokenInTheReplyIsNotFoundAndNoFailure)
{
    server.exchange(accountCommand("SEC_GET_USERTOKEN"), zeltest::reply("SUCCESS", "<SEC_GET_USERTOKEN/>"));
    signIn();
    const TokenPtr token(manager->createUserToken(ZELServerString("mine"), ZELServerString("::1"), 60));
    bool found = true;
    const StatusPtr status(manager->getUserToken(kAccount, *token, found));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_FALSE(found);
    EXPECT_EQ(tokenOf(*token), "mine");
    EXPECT_EQ(addressOf(*token), "::1");
    EXPECT_EQ(token->getExpirationTimeout(), 60);
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, GetUserTokenWithABodyThatIsNoXmlIsAlsoNotFound)
{
    server.exchange(accountCommand("SEC_GET_USERTOKEN"), zeltest::reply("SUCCESS", "true"));
    signIn();
    const TokenPtr token(manager->createUserToken());
    bool found = true;
    const StatusPtr status(manager->getUserToken(kAccount, *token, found));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_FALSE(found);
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, GetUserTokenFailureLeavesFoundAndTheTokenAlone)
{
    server.exchange(accountCommand("SEC_GET_USERTOKEN"), zeltest::reply("ERROR", "unknown user account 'ann'"));
    signIn();
    const TokenPtr token(manager->createUserToken(ZELServerString("mine"), ZELServerString(""), 1));
    bool found = true;
    const StatusPtr status(manager->getUserToken(kAccount, *token, found));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_TRUE(found);
    EXPECT_EQ(tokenOf(*token), "mine");
    EXPECT_TRUE(server.verify());
}

// ---- Sending a token --------------------------------------------------------------------------------

TEST_F(SecurityManagerTest, AddUserTokenSendsTheUserTokenDocument)
{
    server.exchange(tokenCommand("SEC_ADD_USERTOKEN", userTokenElement("t&amp;1", "10.0.0.9", "-30")),
                    zeltest::reply("SUCCESS", "true"));
    signIn();
    const TokenPtr token(manager->createUserToken(ZELServerString("t&1"), ZELServerString("10.0.0.9"), -30));
    ASSERT_NE(token, nullptr);
    const StatusPtr status(manager->addUserToken(kAccount, *token));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, AnEmptyTokenIsSentWithEmptyTextsAndTimeoutZero)
{
    server.exchange(tokenCommand("SEC_ADD_USERTOKEN", userTokenElement("", "", "0")),
                    zeltest::reply("SUCCESS", "true"));
    signIn();
    const TokenPtr token(manager->createUserToken());
    const StatusPtr status(manager->addUserToken(kAccount, *token));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, UpdateSendsBackTheDatesOfATokenReadFromTheServer)
{
    const std::string stored = userTokenElement("tok", "", "0x20", "d1", "d2", "d3");
    server.exchange(accountCommand("SEC_GET_USERTOKEN"),
                    zeltest::reply("SUCCESS", "<SEC_GET_USERTOKEN>" + stored + "</SEC_GET_USERTOKEN>"))
        .exchange(tokenCommand("SEC_UPDATE_USERTOKEN", userTokenElement("tok", "", "32", "d1", "d2", "d3")),
                  zeltest::reply("SUCCESS", "true"));
    signIn();
    const TokenPtr token(manager->createUserToken());
    bool found = false;
    StatusPtr status(manager->getUserToken(kAccount, *token, found));
    ASSERT_EQ(status, nullptr) << describe(status.get());
    ASSERT_TRUE(found);
    status.reset(manager->updateUserToken(kAccount, *token));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, AFailedAddComesBackUnchanged)
{
    server.exchange(tokenCommand("SEC_ADD_USERTOKEN", userTokenElement("t", "", "1")),
                    zeltest::reply("ERROR", "Authentication Error: signed out"));
    signIn();
    const TokenPtr token(manager->createUserToken(ZELServerString("t"), ZELServerString(""), 1));
    const StatusPtr status(manager->addUserToken(kAccount, *token));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 1u);
    EXPECT_EQ(std::string(status->getMessage()), "signed out");
    EXPECT_TRUE(server.verify());
}

// ---- Without a connection ---------------------------------------------------------------------------

TEST(SecurityManagerWithoutChannel, EveryCommandAnswersNotConnected)
{
    const std::unique_ptr<IZELServerSecurityManager> manager(makeSecurityManager(nullptr));
    ZELServerUserToken token("keep", "", 3);
    bool flag = true;
    const StatusPtr statuses[] = {
        StatusPtr(manager->userTokenExists(kAccount, flag)),
        StatusPtr(manager->getUserToken(kAccount, token, flag)),
        StatusPtr(manager->addUserToken(kAccount, token)),
        StatusPtr(manager->updateUserToken(kAccount, token)),
        StatusPtr(manager->removeUserToken(kAccount, flag)),
        StatusPtr(manager->userTokenExpired(kAccount, flag)),
    };
    for (const StatusPtr& status : statuses) {
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), msg::kNotConnected);
    }
    EXPECT_TRUE(flag);
    EXPECT_EQ(tokenOf(token), "keep");
}

// ---- Token objects ----------------------------------------------------------------------------------

TEST(SecurityManagerTokens, DestroyUserTokenAlwaysLeavesNull)
{
    const std::unique_ptr<IZELServerSecurityManager> manager(makeSecurityManager(nullptr));
    IZELServerUserToken* token = manager->createUserToken(ZELServerString("t"), ZELServerString("a"), 5);
    ASSERT_NE(token, nullptr);
    EXPECT_EQ(tokenOf(*token), "t");
    EXPECT_EQ(addressOf(*token), "a");
    EXPECT_EQ(token->getExpirationTimeout(), 5);
    manager->destroyUserToken(&token);
    EXPECT_EQ(token, nullptr);
    manager->destroyUserToken(&token);  // a pointer holding null stays null
    EXPECT_EQ(token, nullptr);
    manager->destroyUserToken(nullptr);
}

}  // namespace
}  // namespace zel
