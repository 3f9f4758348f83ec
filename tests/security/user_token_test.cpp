// The user token record and its "USERTOKEN" reader, without a connection.

#include "security/ZELServerUserToken.h"

#include <memory>
#include <ostream>
#include <string>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"

namespace zel {
namespace {

// Every field of a token, as one text.
std::string fieldsOf(const ZELServerUserToken& token)
{
    ZELServerString text("stale");
    ZELServerString address("stale");
    token.getToken(text);
    token.getClientAddress(address);
    return text.str() + "|" + address.str() + "|" + std::to_string(token.getExpirationTimeout()) + "|" +
           token.firstTokenDate() + "|" + token.lastTokenDate() + "|" + token.expirationDate();
}

std::string tokenReply(const std::string& attributes)
{
    return "<SEC_GET_USERTOKEN><USERTOKEN " + attributes + "/></SEC_GET_USERTOKEN>";
}

TEST(UserTokenReader, ReadsAllSixAttributesWithTheDatesAsTextAndEmptiesAbsentOnes)
{
    ZELServerUserToken token;
    ASSERT_EQ(readUserTokenReply(tokenReply(R"(token="abc" clientaddress="10.1.2.3" expirationtimeout="3600" )"
                                            R"(firsttokendate="2024-05-01 10:00" lasttokendate="yesterday" )"
                                            R"(expirationdate="never, really")"),
                                 token),
              0);
    EXPECT_EQ(fieldsOf(token), "abc|10.1.2.3|3600|2024-05-01 10:00|yesterday|never, really");
    ASSERT_EQ(readUserTokenReply(tokenReply(R"(token="b")"), token), 0);
    EXPECT_EQ(fieldsOf(token), "b||0|||");
}

TEST(UserTokenReader, ExpirationTimeoutConvertsOrFallsBackToZeroWithoutFailingTheReading)
{
    const std::pair<const char*, long long> cases[] = {
        {"3600", 3600},
        {"3600.5", 0},
        {"0x10", 16},
        {"-15", -15},
        {"abc", 0},
        {"", 0},
        {"9223372036854775807", 9223372036854775807LL},
        {"9223372036854775808", 0},
    };
    for (const auto& [text, expected] : cases) {
        ZELServerUserToken token("old", "", 77);
        ASSERT_EQ(readUserTokenReply(tokenReply(std::string(R"(token="t" expirationtimeout=")") + text + "\""), token),
                  0)
            << text;
        EXPECT_EQ(fieldsOf(token), "t||" + std::to_string(expected) + "|||") << "timeout \"" << text << "\"";
    }
}

TEST(UserTokenReader, WithoutTheElementOrADocumentFailsAndLeavesTheTokenAlone)
{
    ZELServerUserToken token("keep", "10.0.0.1", 9);
    const std::pair<const char*, unsigned> failures[] = {
        {"<SEC_GET_USERTOKEN/>", msg::kUnreadableReply},
        {"<SEC_GET_USERTOKEN><usertoken token=\"x\"/></SEC_GET_USERTOKEN>", msg::kUnreadableReply},  // exact name
        {"", msg::kXmlFailure},
        {"<SEC_GET_USERTOKEN><USERTOKEN token=\"x\"", msg::kXmlFailure},
    };
    for (const auto& [body, number] : failures) {
        EXPECT_EQ(readUserTokenReply(body, token), static_cast<int>(number)) << body;
    }
    EXPECT_EQ(fieldsOf(token), "keep|10.0.0.1|9|||");
}

// A caller's own implementation of the interface cannot take the server's dates, so it is refused
// like a reply without a token.
class ForeignToken final : public IZELServerUserToken {
public:
    void getToken(IZELServerString& out) const override { out.assign("foreign"); }
    void getClientAddress(IZELServerString& out) const override { out.assign(""); }
    long long getExpirationTimeout() const override { return 0; }
};

TEST(UserTokenReader, RefusesATokenThatIsNotTheLibrarysOwn)
{
    ForeignToken token;
    EXPECT_EQ(readUserTokenReply(tokenReply(R"(token="x")"), token), static_cast<int>(msg::kUnreadableReply));
}

}  // namespace
}  // namespace zel
