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

ZELServerStringArray listOf(std::vector<std::string> entries) { return ZELServerStringArray(std::move(entries)); }

std::string hostOf(const IZELServerConnectionInfo& info)
{
    ZELServerString out("stale");
    info.getHost(out);
    return out.str();
}

struct AddressCase {
    const char* address;
    const char* host;
    unsigned short port;
};

class AddressParsing : public ::testing::TestWithParam<AddressCase> {};

TEST_P(AddressParsing, BothAddressFormsGiveTheSameHostAndPort)
{
    const AddressCase& c = GetParam();
    const ZELServerString address(c.address);
    const ZELServerConnectionInfo withCredentials(address, ZELServerString("u"), ZELServerString("p"));
    const ZELServerConnectionInfo withProperties(address, listOf({}));
    for (const ZELServerConnectionInfo* info : {&withCredentials, &withProperties}) {
        EXPECT_EQ(hostOf(*info), c.host);
        EXPECT_EQ(info->getPort(), c.port);
        EXPECT_EQ(info->getConnectionKind(), kWebAddressConnection);
        ZELServerString given;
        info->getAddress(given);
        EXPECT_EQ(given.str(), c.address);
    }
}

INSTANTIATE_TEST_SUITE_P(
    ConnectionInfo, AddressParsing,
    ::testing::Values(AddressCase{"https://srv/x", "srv", 443}, AddressCase{"https://srv", "srv", 443},
                      AddressCase{"http://srv/x/y", "srv", 80}, AddressCase{"https://srv:8443/x", "srv", 8443},
                      AddressCase{"http://srv:8080", "srv", 8080},
                      // a bad explicit port never falls back to 443
                      AddressCase{"https://srv:abc", "srv", 80}, AddressCase{"https://srv:/x", "srv", 80},
                      AddressCase{"https://srv:-1", "srv", 80}, AddressCase{"https://srv:81x", "srv", 80},
                      AddressCase{"https://srv:4294967296", "srv", 80},
                      // only the low 16 bits of a port are kept
                      AddressCase{"http://srv:70000/x", "srv", 4464},
                      // the colon is searched before the slash, so a colon in the path ends the host
                      AddressCase{"http://h/p:1", "h/p", 1},
                      // no scheme, an upper-case one, or anything before it: the whole text is the host
                      AddressCase{"srv:81", "srv:81", 80}, AddressCase{"HTTP://srv", "HTTP://srv", 80},
                      AddressCase{" http://srv", " http://srv", 80}, AddressCase{"http:/srv", "http:/srv", 80},
                      AddressCase{"", "", 80}, AddressCase{"http://", "", 80}, AddressCase{"https://:9", "", 9}));

TEST(ConnectionInfo, HostFormsKeepHostAndPortAsGivenAndHaveNoAddress)
{
    const ZELServerConnectionInfo withCredentials(ZELServerString("http://srv:1"), 7001, ZELServerString("ann"),
                                                  ZELServerString("pw1"));
    EXPECT_EQ(hostOf(withCredentials), "http://srv:1");
    EXPECT_EQ(withCredentials.getPort(), 7001);
    EXPECT_EQ(withCredentials.getConnectionKind(), kHostAndPortConnection);
    EXPECT_EQ(withCredentials.getAuthenticationKind(), kPasswordAuthentication);
    ZELServerString text("stale");
    withCredentials.getUserName(text);
    EXPECT_EQ(text.str(), "ann");
    withCredentials.getPassword(text);
    EXPECT_EQ(text.str(), "pw1");
    withCredentials.getAddress(text);
    EXPECT_EQ(text.str(), "");
    withCredentials.getAuxiliaryText(text);
    EXPECT_EQ(text.str(), "");

    const ZELServerConnectionInfo withProperties(ZELServerString("srv"), 0, listOf({"CLIENT_ID", "c1"}));
    EXPECT_EQ(withProperties.getPort(), 0);
    EXPECT_EQ(withProperties.getConnectionKind(), kHostAndPortConnection);
    EXPECT_EQ(withProperties.getAuthenticationKind(), kPropertyAuthentication);
    text.assign("stale");
    withProperties.getUserName(text);
    EXPECT_EQ(text.str(), "");
}

struct AuthenticationCase {
    std::vector<std::string> properties;
    unsigned kind;
};

class AuthenticationKind : public ::testing::TestWithParam<AuthenticationCase> {};

TEST_P(AuthenticationKind, FollowsTheKeysOfThePropertiesInBothPropertyForms)
{
    const AuthenticationCase& c = GetParam();
    const ZELServerConnectionInfo byHost(ZELServerString("srv"), 7071, listOf(c.properties));
    const ZELServerConnectionInfo byAddress(ZELServerString("http://srv"), listOf(c.properties));
    EXPECT_EQ(byHost.getAuthenticationKind(), c.kind);
    EXPECT_EQ(byAddress.getAuthenticationKind(), c.kind);
}

INSTANTIATE_TEST_SUITE_P(
    ConnectionInfo, AuthenticationKind,
    ::testing::Values(AuthenticationCase{{"SSO_AUTH_DATA", ""}, kSingleSignOnAuthentication},
                      AuthenticationCase{{"USER_TOKEN", "t1"}, kTokenAuthentication},
                      AuthenticationCase{{"USER_TOKEN", "t1", "SSO_AUTH_DATA", "d"}, kSingleSignOnAuthentication},
                      AuthenticationCase{{"SSO_AUTH_DATA", "d", "USER_TOKEN", "t1"}, kSingleSignOnAuthentication},
                      AuthenticationCase{{"CLIENT_ID", "c1"}, kPropertyAuthentication},
                      AuthenticationCase{{}, kPropertyAuthentication},
                      // a key without value is no key
                      AuthenticationCase{{"CLIENT_ID", "c1", "USER_TOKEN"}, kPropertyAuthentication},
                      // keys are exact bytes
                      AuthenticationCase{{"user_token", "t1", "sso_auth_data", "d"}, kPropertyAuthentication},
                      // a value that reads like a key is still a value
                      AuthenticationCase{{"CLIENT_ID", "SSO_AUTH_DATA"}, kPropertyAuthentication}));

TEST(ConnectionInfo, OddLastPropertyIsIgnoredAndRepeatedKeyKeepsTheFirstValue)
{
    const ZELServerConnectionInfo info(ZELServerString("srv"), 1, listOf({"k1", "v1", "k1", "v2", "k2"}));
    ZELServerString value("untouched");
    EXPECT_FALSE(info.getProperty(ZELServerString("k2"), value));
    EXPECT_EQ(value.str(), "untouched");
    EXPECT_TRUE(info.getProperty(ZELServerString("k1"), value));
    EXPECT_EQ(value.str(), "v1");
}

TEST(ConnectionInfo, GetPropertyComparesKeysExactlyAndStopsAtTheKeysFirstNul)
{
    const ZELServerConnectionInfo info(ZELServerString("srv"), 1,
                                       listOf({"CLIENT_ID", "c1", "SSO_AUTH_DATA", "", "V", "a\0b"s}));
    ZELServerString value("untouched");
    EXPECT_FALSE(info.getProperty(ZELServerString("client_id"), value));
    EXPECT_FALSE(info.getProperty(ZELServerString("CLIENT_ID "), value));
    EXPECT_EQ(value.str(), "untouched");

    EXPECT_TRUE(info.getProperty(ZELServerString("SSO_AUTH_DATA"), value));
    EXPECT_EQ(value.str(), "");
    EXPECT_TRUE(info.getProperty(ZELServerString("CLIENT_ID\0junk"s), value));
    EXPECT_EQ(value.str(), "c1");
    EXPECT_TRUE(info.getProperty(ZELServerString("V"), value));
    EXPECT_EQ(value.str(), "a\0b"s);
}

TEST(ConnectionInfo, CredentialFormsHoldNoProperties)
{
    const ZELServerConnectionInfo info(ZELServerString("http://srv"), ZELServerString("SSO_AUTH_DATA"),
                                       ZELServerString("x"));
    ZELServerString value("untouched");
    EXPECT_FALSE(info.getProperty(ZELServerString("SSO_AUTH_DATA"), value));
    EXPECT_EQ(info.getAuthenticationKind(), kPasswordAuthentication);
}

}  // namespace
}  // namespace zel
