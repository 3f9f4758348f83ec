// The user token record and its "USERTOKEN" reader, without a connection.

#include "security/ZELServerUserToken.h"

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

TEST(UserTokenReader, ReadsTheChildOfTheDocumentElementOrLeavesTheTokenAlone)
{
    const int unreadable = static_cast<int>(msg::kUnreadableReply);
    const int xml = static_cast<int>(msg::kXmlFailure);
    const struct {
        std::string body;
        int result;
        const char* fields;  // of a token that was ("old", "10.0.0.1", 77)
    } cases[] = {
        {R"(<R><USERTOKEN token="abc" clientaddress="10.1.2.3" expirationtimeout="3600" )"
         R"(firsttokendate="2024-05-01 10:00" lasttokendate="yesterday" expirationdate="never, really"/></R>)",
         0, "abc|10.1.2.3|3600|2024-05-01 10:00|yesterday|never, really"},
        // A timeout that does not convert is zero, without failing the reading.
        {R"(<R><USERTOKEN token="t" expirationtimeout="3600.5"/></R>)", 0, "t||0|||"},
        {R"(<R><USERTOKEN token="t" expirationtimeout="0x10"/></R>)", 0, "t||16|||"},
        {R"(<R><USERTOKEN token="t" expirationtimeout="-15"/></R>)", 0, "t||-15|||"},
        {R"(<R><USERTOKEN token="t" expirationtimeout="9223372036854775807"/></R>)", 0, "t||9223372036854775807|||"},
        {R"(<R><USERTOKEN token="t" expirationtimeout="9223372036854775808"/></R>)", 0, "t||0|||"},
        {R"(<USERTOKEN token="t"/>)", unreadable, "old|10.0.0.1|77|||"},
        {R"(<R><X><USERTOKEN token="t"/></X></R>)", unreadable, "old|10.0.0.1|77|||"},
        {R"(<R><usertoken token="x"/></R>)", unreadable, "old|10.0.0.1|77|||"},
        {"", xml, "old|10.0.0.1|77|||"},
        {R"(<R><USERTOKEN token="x")", xml, "old|10.0.0.1|77|||"},
    };
    for (const auto& c : cases) {
        ZELServerUserToken token("old", "10.0.0.1", 77);
        EXPECT_EQ(readUserTokenReply(c.body, token), c.result) << c.body;
        EXPECT_EQ(fieldsOf(token), c.fields) << c.body;
    }
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
    EXPECT_EQ(readUserTokenReply(R"(<R><USERTOKEN token="x"/></R>)", token), static_cast<int>(msg::kUnreadableReply));
}

}  // namespace
}  // namespace zel
