// The signed-in identity: read from the server's element, and written back into every request.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "security/ZELServerIdentity.h"
#include "transport/xml_document.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

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
