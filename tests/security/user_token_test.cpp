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

std::string tokenOf(const IZELServerUserToken& token)
{
    ZELServerString text("stale");
    token.getToken(text);
    return text.str();
}

std::string addressOf(const IZELServerUserToken& token)
{
    ZELServerString text("stale");
    token.getClientAddress(text);
    return text.str();
}

std::string tokenReply(const std::string& attributes)
{
    return "<SEC_GET_USERTOKEN><USERTOKEN " + attributes + "/></SEC_GET_USERTOKEN>";
}

TEST(UserTokenReader, ReadsAllSixAttributesWithTheDatesAsText)
{
    ZELServerUserToken token;
    ASSERT_EQ(readUserTokenReply(tokenReply(R"(token="abc" clientaddress="10.1.2.3" expirationtimeout="3600" )"
                                            R"(firsttokendate="2024-05-01 10:00" lasttokendate="yesterday" )"
                                            R"(expirationdate="never, really")"),
                                 token),
              0);
    EXPECT_EQ(tokenOf(token), "abc");
    EXPECT_EQ(addressOf(token), "10.1.2.3");
    EXPECT_EQ(token.getExpirationTimeout(), 3600);
    EXPECT_EQ(token.firstTokenDate(), "2024-05-01 10:00");
    EXPECT_EQ(token.lastTokenDate(), "yesterday");
    EXPECT_EQ(token.expirationDate(), "never, really");
}

TEST(UserTokenReader, AbsentAttributesReplaceEarlierValuesWithEmptyText)
{
    ZELServerUserToken token;
    ASSERT_EQ(readUserTokenReply(tokenReply(R"(token="a" clientaddress="h" expirationtimeout="5" firsttokendate="d")"),
                                 token),
              0);
    ASSERT_EQ(readUserTokenReply(tokenReply(R"(token="b")"), token), 0);
    EXPECT_EQ(tokenOf(token), "b");
    EXPECT_EQ(addressOf(token), "");
    EXPECT_EQ(token.getExpirationTimeout(), 0);
    EXPECT_EQ(token.firstTokenDate(), "");
}

struct TimeoutCase {
    const char* text;
    long long expected;
};

void PrintTo(const TimeoutCase& c, std::ostream* out) { *out << '"' << c.text << '"'; }

class ExpirationTimeout : public ::testing::TestWithParam<TimeoutCase> {};

TEST_P(ExpirationTimeout, ConvertsOrFallsBackToZero)
{
    ZELServerUserToken token("old", "", 77);
    const std::string attribute = std::string(R"(token="t" expirationtimeout=")") + GetParam().text + "\"";
    ASSERT_EQ(readUserTokenReply(tokenReply(attribute), token), 0) << "a bad timeout never fails the reading";
    EXPECT_EQ(token.getExpirationTimeout(), GetParam().expected) << "text: \"" << GetParam().text << "\"";
    EXPECT_EQ(tokenOf(token), "t");
}

INSTANTIATE_TEST_SUITE_P(Texts, ExpirationTimeout,
                         ::testing::Values(TimeoutCase{"3600", 3600}, TimeoutCase{"   3600", 3600},
                                           TimeoutCase{"3600.000", 3600}, TimeoutCase{"3600.", 3600},
                                           TimeoutCase{"3600  ", 3600}, TimeoutCase{"3600.5", 0},
                                           TimeoutCase{"0x10", 16}, TimeoutCase{"0X1f", 31},
                                           TimeoutCase{"010", 10}, TimeoutCase{"-15", -15},
                                           TimeoutCase{"abc", 0}, TimeoutCase{"12abc", 0}, TimeoutCase{"", 0},
                                           TimeoutCase{"   ", 0}, TimeoutCase{"9223372036854775807", 9223372036854775807LL},
                                           TimeoutCase{"9223372036854775808", 0},
                                           TimeoutCase{"99999999999999999999999", 0}));

TEST(UserTokenReader, WithoutTheElementFailsAndLeavesTheTokenAlone)
{
    ZELServerUserToken token("keep", "10.0.0.1", 9);
    EXPECT_EQ(readUserTokenReply("<SEC_GET_USERTOKEN/>", token), static_cast<int>(msg::kUnreadableReply));
    EXPECT_EQ(readUserTokenReply("<SEC_GET_USERTOKEN><usertoken token=\"x\"/></SEC_GET_USERTOKEN>", token),
              static_cast<int>(msg::kUnreadableReply))
        << "the element name is matched exactly";
    EXPECT_EQ(tokenOf(token), "keep");
    EXPECT_EQ(addressOf(token), "10.0.0.1");
    EXPECT_EQ(token.getExpirationTimeout(), 9);
}

TEST(UserTokenReader, ABodyThatIsNoXmlGivesTheParserCode)
{
    ZELServerUserToken token("keep", "", 1);
    EXPECT_EQ(readUserTokenReply("", token), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(readUserTokenReply("true", token), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(readUserTokenReply("<SEC_GET_USERTOKEN><USERTOKEN token=\"x\"", token),
              static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(tokenOf(token), "keep");
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
