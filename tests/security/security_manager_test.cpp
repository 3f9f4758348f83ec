// The security manager against the fake server: every "SEC_" command byte for byte, what each reads
// back, and what the caller's values look like after a failure; its "USERTOKEN" reader; and the
// signed-in identity, read from the server's element and written back into every request.

#include "security/ZELServerSecurityManager.h"

#include <functional>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "security/ZELServerIdentity.h"
#include "security/ZELServerUserToken.h"
#include "security/security_factories.h"
#include "support/wire_table.h"
#include "transport/xml_document.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using zeltest::Bytes;
using zeltest::reply;
using zeltest::StatusPtr;
using Manager = IZELServerSecurityManager;
using TokenPtr = std::unique_ptr<IZELServerUserToken>;
using Str = ZELServerString;

const Str kAccount("ann");

// Token, client address and timeout of a token, as one text.
std::string fieldsOf(const IZELServerUserToken& token)
{
    Str text("stale");
    Str address("stale");
    token.getToken(text);
    token.getClientAddress(address);
    return text.str() + "|" + address.str() + "|" + std::to_string(token.getExpirationTimeout());
}

// The XML library writes attributes sorted by name, whatever order they were set in. `dates` are
// the first, last and expiration dates.
std::string tokenElement(const std::string& token, const std::string& address, const std::string& timeout,
                         const std::string (&dates)[3] = {"", "", ""})
{
    return R"(<USERTOKEN clientaddress=")" + address + R"(" expirationdate=")" + dates[2] + R"(" expirationtimeout=")" +
           timeout + R"(" firsttokendate=")" + dates[0] + R"(" lasttokendate=")" + dates[1] + R"(" token=")" + token +
           R"("/>)";
}

using Call = std::function<IZELServerStatus*(Manager&, bool&, IZELServerUserToken&)>;

Call addCall(const char* token, const char* address, long long timeout)
{
    return [=](Manager& m, bool&, IZELServerUserToken&) {
        const TokenPtr made(m.createUserToken(Str(token), Str(address), timeout));
        return m.addUserToken(kAccount, *made);
    };
}

class SecurityManagerTest : public zeltest::SignedInChannelTest {
protected:
    static Bytes account(const std::string& keyword) { return command(keyword, {{"userAccountName", "ann"}}); }
    static Bytes withToken(const std::string& keyword, const std::string& element)
    {
        return command(keyword, {{"userAccountName", "ann"}, {"userTokenObject", xmlDocument(keyword, element)}});
    }
};

TEST_F(SecurityManagerTest, EveryCommandSendsItsBytesAndReadsItsAnswer)
{
    const Call get = [](Manager& m, bool& found, IZELServerUserToken& t) { return m.getUserToken(kAccount, t, found); };
    const Call update = [](Manager& m, bool&, IZELServerUserToken& t) { return m.updateUserToken(kAccount, t); };
    const Call expired = [](Manager& m, bool& flag, IZELServerUserToken&) {
        return m.userTokenExpired(kAccount, flag);
    };
    const std::string dated[3] = {"2024-01-01", "2024-01-02", "2024-02-01"};
    const struct {
        const char* name;
        Bytes sent;
        Bytes answer;
        bool before;  // the caller's flag
        Call call;
        unsigned number;
        unsigned code;
        std::string after;  // flag and the caller's token
    } rows[] = {
        // A body that is no exact truth value keeps the caller's value and is no failure.
        {"expired, no truth value", account("SEC_USERTOKEN_EXPIRED"), reply("SUCCESS", "True"), true, expired, 0, 0,
         "1 mine|::1|60"},
        {"expired, refused", account("SEC_USERTOKEN_EXPIRED"), reply("ERROR", "Authorization Error: not yours"), false,
         expired, msg::kServerError, 2, "0 mine|::1|60"},
        {"get, no token element", account("SEC_GET_USERTOKEN"), reply("SUCCESS", "<SEC_GET_USERTOKEN/>"), true, get, 0,
         0, "0 mine|::1|60"},
        {"get, refused", account("SEC_GET_USERTOKEN"), reply("ERROR", "unknown user account 'ann'"), true, get,
         msg::kServerError, 0, "1 mine|::1|60"},
        {"get", account("SEC_GET_USERTOKEN"),
         reply("SUCCESS",
               "<SEC_GET_USERTOKEN>" + tokenElement("tok-9", "10.0.0.5", " 7200.00", dated) + "</SEC_GET_USERTOKEN>"),
         false, get, 0, 0, "1 tok-9|10.0.0.5|7200"},
        // The update sends back the dates the token was read with, and the timeout as a whole number.
        {"update", withToken("SEC_UPDATE_USERTOKEN", tokenElement("tok-9", "10.0.0.5", "7200", dated)),
         reply("SUCCESS", "true"), true, update, 0, 0, "1 tok-9|10.0.0.5|7200"},
        {"add", withToken("SEC_ADD_USERTOKEN", tokenElement("t&amp;1", "10.0.0.9", "-30")), reply("SUCCESS", "true"),
         true, addCall("t&1", "10.0.0.9", -30), 0, 0, "1 tok-9|10.0.0.5|7200"},
        {"add, refused", withToken("SEC_ADD_USERTOKEN", tokenElement("", "", "0")),
         reply("ERROR", "Authentication Error: signed out"), true, addCall("", "", 0), msg::kServerError, 1,
         "1 tok-9|10.0.0.5|7200"},
    };
    for (const auto& row : rows) {
        server.exchange(row.sent, row.answer);
    }
    signIn();
    const std::unique_ptr<Manager> manager(makeSecurityManager(channel.get()));
    const TokenPtr token(manager->createUserToken(Str("mine"), Str("::1"), 60));
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        bool flag = row.before;
        const StatusPtr status(row.call(*manager, flag, *token));
        EXPECT_EQ(status ? status->getMessageNumber() : 0u, row.number) << zeltest::describe(status.get());
        EXPECT_EQ(status ? status->getCode() : 0u, row.code);
        EXPECT_EQ((flag ? "1 " : "0 ") + fieldsOf(*token), row.after);
    }
    EXPECT_TRUE(server.verify());
}

// ---- The user token reader, without a connection

// Every field of a token, as one text.
std::string allFieldsOf(const ZELServerUserToken& token)
{
    return fieldsOf(token) + "|" + token.firstTokenDate() + "|" + token.lastTokenDate() + "|" + token.expirationDate();
}

// A caller's own implementation of the interface cannot take the server's dates, so it is refused
// like a reply without a token.
class ForeignToken final : public IZELServerUserToken {
public:
    void getToken(IZELServerString& out) const override { out.assign("foreign"); }
    void getClientAddress(IZELServerString& out) const override { out.assign(""); }
    long long getExpirationTimeout() const override { return 0; }
};

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
        {R"(<R><USERTOKEN token="t" expirationtimeout="0x10"/></R>)", 0, "t||16|||"},
        {R"(<R><USERTOKEN token="t" expirationtimeout="9223372036854775808"/></R>)", 0, "t||0|||"},
        {R"(<USERTOKEN token="t"/>)", unreadable, "old|10.0.0.1|77|||"},
        {R"(<R><X><USERTOKEN token="t"/></X></R>)", unreadable, "old|10.0.0.1|77|||"},
        {"", xml, "old|10.0.0.1|77|||"},
        {R"(<R><USERTOKEN token="x")", xml, "old|10.0.0.1|77|||"},
    };
    for (const auto& c : cases) {
        ZELServerUserToken token("old", "10.0.0.1", 77);
        EXPECT_EQ(readUserTokenReply(c.body, token), c.result) << c.body;
        EXPECT_EQ(allFieldsOf(token), c.fields) << c.body;
    }
    ForeignToken foreign;
    EXPECT_EQ(readUserTokenReply(R"(<R><USERTOKEN token="x"/></R>)", foreign), unreadable);
}

// ---- The identity, without a connection

// Parses `xml` and hands its document element to the identity.
void readInto(IZELServerIdentity& identity, const std::string& xml)
{
    XmlReader reader;
    StatusPtr failure(reader.parse(xml));
    ASSERT_EQ(failure, nullptr) << failure->getMessage();
    identity.readFromXml(*reader.rootOf()->node());
}

// The identity element a request carries, or the failure's number.
std::string written(const IZELServerIdentity& identity)
{
    XmlDocument doc;
    StatusPtr(doc.startXml());
    doc.createDocument("", "R");
    if (const unsigned failure = IdentityXml(identity).writeXml(doc)) {
        return std::to_string(failure);
    }
    std::string out;
    StatusPtr(doc.serialize(out));
    return out.substr(out.find("<R>") + 3, out.size() - out.find("<R>") - 7);
}

// A caller's own identity, whose text the library cannot write unless it is UTF-8.
class ForeignIdentity final : public IZELServerIdentity {
public:
    ForeignIdentity(std::string id, std::string role) : id_(std::move(id)), role_(std::move(role)) {}
    void getId(IZELServerString& out) const override { out.assign(id_.c_str()); }
    void getRoles(IZELServerStringArray& out) const override { out.append(role_.c_str()); }
    bool isAuthenticated() const override { return true; }
    void readFromXml(const xercesc_3_2::DOMElement&) override {}

private:
    std::string id_;
    std::string role_;
};

TEST(Identity, ReadsIdFlagAndRolesAndWritesThemBackUnlessTheyAreNotUtf8)
{
    const std::pair<const char*, const char*> cases[] = {
        {R"(<IDENTITY id="ann &amp; co"/>)",
         R"(<IDENTITY id="ann &amp; co" is_authenticated="false"><ROLES/></IDENTITY>)"},
        {R"(<IDENTITY is_authenticated="Yesterday"/>)",
         R"(<IDENTITY id="" is_authenticated="true"><ROLES/></IDENTITY>)"},
        {R"(<IDENTITY is_authenticated="2.5"/>)", R"(<IDENTITY id="" is_authenticated="true"><ROLES/></IDENTITY>)"},
        {R"(<IDENTITY is_authenticated="maybe"/>)", R"(<IDENTITY id="" is_authenticated="false"><ROLES/></IDENTITY>)"},
        // Every ROLES child in document order, matched ignoring case, and nothing deeper.
        {R"(<IDENTITY id="a" is_authenticated="true"><ROLES><ROLE name="x"/><ROLE name="y"/></ROLES>)"
         R"(<OTHER><ROLE name="not-a-role"/></OTHER><roles><Role name="z"/><ROLE/><ROLE nom="x"/></roles>)"
         R"(<ROLES><GROUP><ROLE name="too-deep"/></GROUP></ROLES></IDENTITY>)",
         R"(<IDENTITY id="a" is_authenticated="true"><ROLES><ROLE name="x"/><ROLE name="y"/><ROLE name="z"/>)"
         R"(</ROLES></IDENTITY>)"},
        // A single sign-on identity is written as a plain one.
        {R"(<SSO_IDENTITY id="bob" is_authenticated="1" state="IN_PROGRESS"><ROLES><ROLE name="u"/></ROLES>)"
         R"(</SSO_IDENTITY>)",
         R"(<IDENTITY id="bob" is_authenticated="true"><ROLES><ROLE name="u"/></ROLES></IDENTITY>)"},
    };
    for (const auto& [xml, element] : cases) {
        ZELServerIdentity plain;
        ZELServerSingleSignOnIdentity singleSignOn;
        IZELServerIdentity& identity = std::string(xml).starts_with("<SSO") ? singleSignOn : plain;
        readInto(identity, xml);
        EXPECT_EQ(written(identity), element) << xml;
    }
    // Reading again replaces id and flag but appends the roles; attribute names are exact.
    ZELServerIdentity identity;
    readInto(identity, R"(<IDENTITY id="ann" is_authenticated="y"><ROLES><ROLE name="r"/></ROLES></IDENTITY>)");
    readInto(identity, R"(<IDENTITY ID="ann" Is_Authenticated="true"><ROLES><ROLE name="r"/></ROLES></IDENTITY>)");
    EXPECT_EQ(written(identity),
              R"(<IDENTITY id="" is_authenticated="false"><ROLES><ROLE name="r"/><ROLE name="r"/></ROLES></IDENTITY>)");
    EXPECT_EQ(written(ForeignIdentity("caf\xE9", "r")), std::to_string(msg::kXmlFailure));
    EXPECT_EQ(written(ForeignIdentity("ann", "\xFF")), std::to_string(msg::kXmlFailure));
}

TEST(SingleSignOnIdentity, StateIsExactlyAKnownWordAndTheDataIsHandedOutOnce)
{
    ZELServerSingleSignOnIdentity identity;
    readInto(identity, R"(<SSO_IDENTITY state="succeeded" auth_data="tok=1&amp;x"/>)");
    EXPECT_EQ(identity.getState(), kSingleSignOnOther);
    ZELServerString data("stale");
    identity.takeAuthData(data);
    EXPECT_EQ(data.str(), "tok=1&x");
    identity.takeAuthData(data);
    EXPECT_EQ(data.str(), "");
}

}  // namespace
}  // namespace zel
