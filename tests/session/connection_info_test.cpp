// Connection information: the four forms, web-address parsing and the connection properties.

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

ZELServerStringArray listOf(std::vector<std::string> entries) { return ZELServerStringArray(std::move(entries)); }

std::string textOf(const Info& info, void (Info::*get)(IZELServerString&) const)
{
    Str out("stale");
    (info.*get)(out);
    return out.str();
}

TEST(ConnectionInfo, BothWebAddressFormsGiveTheSameHostAndPort)
{
    const struct {
        const char* address;
        const char* host;
        unsigned short port;
    } cases[] = {
        {"https://srv/x", "srv", 443},
        {"http://srv/x/y", "srv", 80},
        {"https://srv:8443/x", "srv", 8443},
        // a bad explicit port never falls back to 443
        {"https://srv:abc", "srv", 80},
        {"https://srv:81x", "srv", 80},
        // only the low 16 bits of a port are kept
        {"http://srv:70000/x", "srv", 4464},
        // the colon is searched before the slash, so a colon in the path ends the host
        {"http://h/p:1", "h/p", 1},
        // no scheme, an upper-case one, or anything before it: the whole text is the host
        {"srv:81", "srv:81", 80},
        {"HTTP://srv", "HTTP://srv", 80},
        {"http://", "", 80},
        {"https://:9", "", 9},
    };
    for (const auto& c : cases) {
        const Info withCredentials(Str(c.address), Str("u"), Str("p"));
        const Info withProperties(Str(c.address), listOf({}));
        for (const Info* info : {&withCredentials, &withProperties}) {
            EXPECT_EQ(textOf(*info, &Info::getHost), c.host) << c.address;
            EXPECT_EQ(info->getPort(), c.port) << c.address;
            EXPECT_EQ(info->getConnectionKind(), kWebAddressConnection);
            EXPECT_EQ(textOf(*info, &Info::getAddress), c.address);
        }
    }
}

TEST(ConnectionInfo, HostFormsKeepHostAndPortAsGivenAndHaveNoAddress)
{
    const Info withCredentials(Str("http://srv:1"), 7001, Str("ann"), Str("pw1"));
    EXPECT_EQ(textOf(withCredentials, &Info::getHost), "http://srv:1");
    EXPECT_EQ(withCredentials.getPort(), 7001);
    EXPECT_EQ(withCredentials.getConnectionKind(), kHostAndPortConnection);
    EXPECT_EQ(withCredentials.getAuthenticationKind(), kPasswordAuthentication);
    EXPECT_EQ(textOf(withCredentials, &Info::getUserName), "ann");
    EXPECT_EQ(textOf(withCredentials, &Info::getPassword), "pw1");
    EXPECT_EQ(textOf(withCredentials, &Info::getAddress), "");
    EXPECT_EQ(textOf(withCredentials, &Info::getAuxiliaryText), "");

    const Info withProperties(Str("srv"), 0, listOf({"CLIENT_ID", "c1"}));
    EXPECT_EQ(withProperties.getPort(), 0);
    EXPECT_EQ(withProperties.getConnectionKind(), kHostAndPortConnection);
    EXPECT_EQ(withProperties.getAuthenticationKind(), kPropertyAuthentication);
    EXPECT_EQ(textOf(withProperties, &Info::getUserName), "");

    // The credential forms hold no properties, whatever the user name says.
    const Info named(Str("http://srv"), Str("SSO_AUTH_DATA"), Str("x"));
    Str value("untouched");
    EXPECT_FALSE(named.getProperty(Str("SSO_AUTH_DATA"), value));
    EXPECT_EQ(named.getAuthenticationKind(), kPasswordAuthentication);
}

TEST(ConnectionInfo, AuthenticationKindFollowsTheKeysOfThePropertiesInBothPropertyForms)
{
    const struct {
        std::vector<std::string> properties;
        unsigned kind;
    } cases[] = {
        {{"SSO_AUTH_DATA", ""}, kSingleSignOnAuthentication},
        {{"USER_TOKEN", "t1"}, kTokenAuthentication},
        {{"USER_TOKEN", "t1", "SSO_AUTH_DATA", "d"}, kSingleSignOnAuthentication},
        {{"CLIENT_ID", "c1"}, kPropertyAuthentication},
        {{"CLIENT_ID", "c1", "USER_TOKEN"}, kPropertyAuthentication},           // a key without value is no key
        {{"user_token", "t1", "sso_auth_data", "d"}, kPropertyAuthentication},  // keys are exact bytes
        {{"CLIENT_ID", "SSO_AUTH_DATA"}, kPropertyAuthentication},              // a value that reads like a key
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message() << "case " << (&c - cases));
        EXPECT_EQ(Info(Str("srv"), 7071, listOf(c.properties)).getAuthenticationKind(), c.kind);
        EXPECT_EQ(Info(Str("http://srv"), listOf(c.properties)).getAuthenticationKind(), c.kind);
    }
}

TEST(ConnectionInfo, GetPropertyComparesKeysExactlyUpToTheirFirstNulAndTheFirstValueWins)
{
    const Info info(Str("srv"), 1,
                    listOf({"CLIENT_ID", "c1", "SSO_AUTH_DATA", "", "V", "a\0b"s, "CLIENT_ID", "c2", "odd"}));
    Str value("untouched");
    EXPECT_FALSE(info.getProperty(Str("client_id"), value));
    EXPECT_FALSE(info.getProperty(Str("CLIENT_ID "), value));
    EXPECT_FALSE(info.getProperty(Str("odd"), value));
    EXPECT_EQ(value.str(), "untouched");

    EXPECT_TRUE(info.getProperty(Str("SSO_AUTH_DATA"), value));
    EXPECT_EQ(value.str(), "");
    EXPECT_TRUE(info.getProperty(Str("CLIENT_ID\0junk"s), value));
    EXPECT_EQ(value.str(), "c1");
    EXPECT_TRUE(info.getProperty(Str("V"), value));
    EXPECT_EQ(value.str(), "a\0b"s);
}

}  // namespace
}  // namespace zel
