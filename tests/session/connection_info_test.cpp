// Connection information: web-address parsing, the authentication kind and the connection properties.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "session/ZELServerConnectionInfo.h"

namespace zel {
namespace {

using namespace std::string_literals;
using Info = ZELServerConnectionInfo;
using Str = ZELServerString;
using List = std::vector<std::string>;

TEST(ConnectionInfo, WebAddressesGiveHostAndPort)
{
    const struct {
        const char* address;
        const char* host;
        unsigned short port;
    } cases[] = {
        {"https://srv/x", "srv", 443},       {"https://srv:8443/x", "srv", 8443},
        {"https://srv:81x", "srv", 80},       // a bad explicit port never falls back to 443
        {"http://srv:70000/x", "srv", 4464},  // only the low 16 bits of a port are kept
        {"http://h/p:1", "h/p", 1},           // the colon is searched before the slash
        {"HTTP://srv", "HTTP://srv", 80},     // no scheme: the whole text is the host
    };
    for (const auto& c : cases) {
        const Info info(Str(c.address), ZELServerStringArray(List{}));
        Str host("stale");
        info.getHost(host);
        EXPECT_EQ(host.str(), c.host) << c.address;
        EXPECT_EQ(info.getPort(), c.port) << c.address;
    }
}

TEST(ConnectionInfo, AuthenticationKindFollowsThePropertyKeysAndTheFirstValueWins)
{
    const struct {
        List properties;
        unsigned kind;
    } cases[] = {
        {{"SSO_AUTH_DATA", ""}, kSingleSignOnAuthentication},
        {{"USER_TOKEN", "t1"}, kTokenAuthentication},
        {{"USER_TOKEN", "t1", "SSO_AUTH_DATA", "d"}, kSingleSignOnAuthentication},
        {{"CLIENT_ID", "c1", "USER_TOKEN"}, kPropertyAuthentication},           // a key without value is no key
        {{"user_token", "t1", "sso_auth_data", "d"}, kPropertyAuthentication},  // keys are exact bytes
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Info(Str("srv"), 7071, ZELServerStringArray(c.properties)).getAuthenticationKind(), c.kind);
        EXPECT_EQ(Info(Str("http://srv"), ZELServerStringArray(c.properties)).getAuthenticationKind(), c.kind);
    }
    const Info info(Str("srv"), 1, ZELServerStringArray(List{"CLIENT_ID", "c1", "V", "a\0b"s, "CLIENT_ID", "c2"}));
    Str value("untouched");
    EXPECT_FALSE(info.getProperty(Str("client_id"), value));
    EXPECT_EQ(value.str(), "untouched");
    EXPECT_TRUE(info.getProperty(Str("CLIENT_ID\0junk"s), value));
    EXPECT_EQ(value.str(), "c1");
    EXPECT_TRUE(info.getProperty(Str("V"), value));
    EXPECT_EQ(value.str(), "a\0b"s);

    // The credential forms hold no properties, whatever the user name says.
    const Info named(Str("http://srv"), Str("SSO_AUTH_DATA"), Str("x"));
    EXPECT_FALSE(named.getProperty(Str("SSO_AUTH_DATA"), value));
    EXPECT_EQ(named.getAuthenticationKind(), kPasswordAuthentication);
}

}  // namespace
}  // namespace zel
