// The security manager against the fake server: every "SEC_" command byte for byte, what each reads
// back, and what the caller's values look like after a failure.

#include "security/ZELServerSecurityManager.h"

#include <iterator>
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

unsigned numberOf(const StatusPtr& status) { return status ? status->getMessageNumber() : 0; }

// Token, client address and timeout of a token, as one text.
std::string fieldsOf(const IZELServerUserToken& token)
{
    ZELServerString text;
    ZELServerString address;
    token.getToken(text);
    token.getClientAddress(address);
    return text.str() + "|" + address.str() + "|" + std::to_string(token.getExpirationTimeout());
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
    static Bytes accountCommand(const std::string& keyword) { return command(keyword, {{"userAccountName", "ann"}}); }
    static Bytes tokenCommand(const std::string& keyword, const std::string& element)
    {
        return command(keyword, {{"userAccountName", "ann"}, {"userTokenObject", xmlDocument(keyword, element)}});
    }

    std::unique_ptr<IZELServerSecurityManager> manager{makeSecurityManager(channel.get())};
};

// ---- The three boolean commands --------------------------------------------------------------------

using FlagOperation = IZELServerStatus* (IZELServerSecurityManager::*)(const IZELServerString&, bool&);

TEST_F(SecurityManagerTest, FlagCommandsSendTheAccountAndChangeTheFlagOnlyForAnExactTruthValue)
{
    struct Answer {
        Bytes reply;
        bool before;
        bool after;
        unsigned number;
        unsigned code;
    };
    const Answer answers[] = {
        {zeltest::reply("SUCCESS", "true"), false, true, 0, 0},
        {zeltest::reply("SUCCESS", "false"), true, false, 0, 0},
        // A body that is no truth value keeps the caller's value and is no failure.
        {zeltest::reply("SUCCESS", "True"), true, true, 0, 0},
        // A server error comes back with the code its text names and leaves the flag alone.
        {zeltest::reply("ERROR", "Authorization Error: not yours"), true, true, msg::kServerError, 2},
        {zeltest::reply("ERROR", "no such account"), false, false, msg::kServerError, 0},
    };
    const std::pair<const char*, FlagOperation> commands[] = {
        {"SEC_USERTOKEN_EXISTS", &IZELServerSecurityManager::userTokenExists},
        {"SEC_REMOVE_USERTOKEN", &IZELServerSecurityManager::removeUserToken},
        {"SEC_USERTOKEN_EXPIRED", &IZELServerSecurityManager::userTokenExpired},
    };
    for (const auto& [keyword, operation] : commands) {
        for (const Answer& answer : answers) {
            server.exchange(accountCommand(keyword), answer.reply);
        }
    }
    signIn();
    for (const auto& [keyword, operation] : commands) {
        for (std::size_t i = 0; i < std::size(answers); ++i) {
            bool flag = answers[i].before;
            const StatusPtr status(((*manager).*operation)(kAccount, flag));
            EXPECT_EQ(numberOf(status), answers[i].number) << keyword << " answer " << i;
            EXPECT_EQ(status ? status->getCode() : 0u, answers[i].code) << keyword << " answer " << i;
            EXPECT_EQ(flag, answers[i].after) << keyword << " answer " << i;
        }
    }
    EXPECT_TRUE(server.verify());
}

// ---- Fetching and sending a token ------------------------------------------------------------------

TEST_F(SecurityManagerTest, GetUserTokenFillsTheTokenOnlyWhenTheReplyHoldsOneAndUpdateSendsItBack)
{
    const auto answer = [](const std::string& body) { return zeltest::reply("SUCCESS", body); };
    server.exchange(accountCommand("SEC_GET_USERTOKEN"), answer("<SEC_GET_USERTOKEN/>"))
        .exchange(accountCommand("SEC_GET_USERTOKEN"), answer("true"))
        .exchange(accountCommand("SEC_GET_USERTOKEN"), zeltest::reply("ERROR", "unknown user account 'ann'"))
        .exchange(accountCommand("SEC_GET_USERTOKEN"),
                  answer("<SEC_GET_USERTOKEN>" +
                         userTokenElement("tok-9", "10.0.0.5", " 7200.00", "2024-01-01", "2024-01-02", "2024-02-01") +
                         "</SEC_GET_USERTOKEN>"))
        .exchange(tokenCommand("SEC_UPDATE_USERTOKEN",
                               userTokenElement("tok-9", "10.0.0.5", "7200", "2024-01-01", "2024-01-02", "2024-02-01")),
                  zeltest::reply("SUCCESS", "true"));
    signIn();
    const TokenPtr token(manager->createUserToken(ZELServerString("mine"), ZELServerString("::1"), 60));
    // No token element, or a body that is no document, is "not found"; a failure leaves `found` alone.
    const std::pair<unsigned, bool> misses[] = {{0, false}, {0, false}, {msg::kServerError, true}};
    for (const auto& [number, found] : misses) {
        bool flag = true;
        const StatusPtr status(manager->getUserToken(kAccount, *token, flag));
        EXPECT_EQ(numberOf(status), number);
        EXPECT_EQ(flag, found) << number;
        EXPECT_EQ(fieldsOf(*token), "mine|::1|60");
    }
    bool found = false;
    const StatusPtr status(manager->getUserToken(kAccount, *token, found));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_TRUE(found);
    EXPECT_EQ(fieldsOf(*token), "tok-9|10.0.0.5|7200");
    // The update sends back the dates the token was read with, and the timeout as a whole number.
    const StatusPtr updated(manager->updateUserToken(kAccount, *token));
    EXPECT_EQ(updated, nullptr) << describe(updated.get());
    EXPECT_TRUE(server.verify());
}

TEST_F(SecurityManagerTest, AddUserTokenSendsTheUserTokenDocumentAndAFailureComesBackUnchanged)
{
    server
        .exchange(tokenCommand("SEC_ADD_USERTOKEN", userTokenElement("t&amp;1", "10.0.0.9", "-30")),
                  zeltest::reply("SUCCESS", "true"))
        // An empty token goes with empty texts and timeout zero.
        .exchange(tokenCommand("SEC_ADD_USERTOKEN", userTokenElement("", "", "0")), zeltest::reply("SUCCESS", "true"))
        .exchange(tokenCommand("SEC_ADD_USERTOKEN", userTokenElement("", "", "0")),
                  zeltest::reply("ERROR", "Authentication Error: signed out"));
    signIn();
    const TokenPtr token(manager->createUserToken(ZELServerString("t&1"), ZELServerString("10.0.0.9"), -30));
    ASSERT_NE(token, nullptr);
    StatusPtr status(manager->addUserToken(kAccount, *token));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    const TokenPtr empty(manager->createUserToken());
    status.reset(manager->addUserToken(kAccount, *empty));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    status.reset(manager->addUserToken(kAccount, *empty));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(status->getCode(), 1u);
    EXPECT_EQ(std::string(status->getMessage()), "signed out");
    EXPECT_TRUE(server.verify());
}

// ---- Without a connection ---------------------------------------------------------------------------

TEST(SecurityManagerWithoutChannel, EveryCommandAnswersNotConnectedButTokensCanBeMadeAndDestroyed)
{
    const std::unique_ptr<IZELServerSecurityManager> manager(makeSecurityManager(nullptr));
    ZELServerUserToken token("keep", "", 3);
    bool flag = true;
    const StatusPtr statuses[] = {
        StatusPtr(manager->userTokenExists(kAccount, flag)), StatusPtr(manager->getUserToken(kAccount, token, flag)),
        StatusPtr(manager->addUserToken(kAccount, token)),   StatusPtr(manager->updateUserToken(kAccount, token)),
        StatusPtr(manager->removeUserToken(kAccount, flag)), StatusPtr(manager->userTokenExpired(kAccount, flag)),
    };
    for (const StatusPtr& status : statuses) {
        EXPECT_EQ(numberOf(status), msg::kNotConnected);
    }
    EXPECT_TRUE(flag);
    EXPECT_EQ(fieldsOf(token), "keep||3");

    // Tokens are made and destroyed without a connection; destroying always leaves null.
    IZELServerUserToken* made = manager->createUserToken(ZELServerString("t"), ZELServerString("a"), 5);
    ASSERT_NE(made, nullptr);
    EXPECT_EQ(fieldsOf(*made), "t|a|5");
    manager->destroyUserToken(&made);
    EXPECT_EQ(made, nullptr);
    manager->destroyUserToken(&made);
    EXPECT_EQ(made, nullptr);
    manager->destroyUserToken(nullptr);
}

}  // namespace
}  // namespace zel
