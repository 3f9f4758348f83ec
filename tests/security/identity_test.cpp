// The signed-in identity: reading it from the server's element and writing it for requests.

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

constexpr const char* kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";

// Parses `xml` and hands its document element to the identity.
void readInto(IZELServerIdentity& identity, const std::string& xml)
{
    XmlReader reader;
    StatusPtr failure(reader.parse(xml));
    ASSERT_EQ(failure, nullptr) << failure->getMessage();
    identity.readFromXml(*reader.rootOf()->node());
}

std::vector<std::string> rolesOf(const IZELServerIdentity& identity)
{
    ZELServerStringArray roles;
    identity.getRoles(roles);
    return roles.items();
}

std::string idOf(const IZELServerIdentity& identity)
{
    ZELServerString id("stale");
    identity.getId(id);
    return id.str();
}

TEST(Identity, ReadsIdFlagAndRolesAndReadingAgainReplacesIdAndFlagButAppendsRoles)
{
    const struct {
        const char* xml;
        const char* id;
        bool authenticated;
        std::vector<std::string> roles;
    } cases[] = {
        {R"(<IDENTITY id="ann"/>)", "ann", false, {}},
        {R"(<IDENTITY is_authenticated="Yesterday"/>)", "", true, {}},
        {R"(<IDENTITY is_authenticated="0.0"/>)", "", false, {}},
        {R"(<IDENTITY is_authenticated="2.5"/>)", "", true, {}},
        {R"(<IDENTITY is_authenticated="maybe"/>)", "", false, {}},
        // Every ROLES child in document order, matched ignoring case, and nothing deeper.
        {R"(<IDENTITY id="ann" is_authenticated="true"><ROLES><ROLE name="a"/><ROLE name="b"/></ROLES>)"
         R"(<OTHER><ROLE name="not-a-role"/></OTHER><roles><Role name="c"/><ROLE/><ROLE nom="x"/></roles>)"
         R"(<ROLES><GROUP><ROLE name="too-deep"/></GROUP></ROLES></IDENTITY>)",
         "ann",
         true,
         {"a", "b", "c"}},
    };
    for (const auto& c : cases) {
        ZELServerIdentity identity;
        readInto(identity, c.xml);
        EXPECT_EQ(idOf(identity), c.id) << c.xml;
        EXPECT_EQ(identity.isAuthenticated(), c.authenticated) << c.xml;
        EXPECT_EQ(rolesOf(identity), c.roles) << c.xml;
    }
    ZELServerIdentity identity;
    readInto(identity, R"(<IDENTITY id="ann" is_authenticated="y"><ROLES><ROLE name="r"/></ROLES></IDENTITY>)");
    readInto(identity, R"(<IDENTITY ID="ann" Is_Authenticated="true"><ROLES><ROLE name="r"/></ROLES></IDENTITY>)");
    EXPECT_EQ(idOf(identity), "");
    EXPECT_FALSE(identity.isAuthenticated());
    ZELServerStringArray out(std::vector<std::string>{"kept"});
    identity.getRoles(out);
    EXPECT_EQ(out.items(), (std::vector<std::string>{"kept", "r", "r"}));
}

TEST(SingleSignOnIdentity, StateIsExactlyOneOfTheTwoKnownWordsOrOther)
{
    const std::pair<const char*, unsigned> cases[] = {
        {R"(<SSO_IDENTITY state="SUCCEEDED"/>)", kSingleSignOnSucceeded},
        {R"(<SSO_IDENTITY state="IN_PROGRESS"/>)", kSingleSignOnInProgress},
        {R"(<SSO_IDENTITY state="succeeded"/>)", kSingleSignOnOther},
    };
    for (const auto& [xml, state] : cases) {
        ZELServerSingleSignOnIdentity identity;
        readInto(identity, xml);
        EXPECT_EQ(identity.getState(), state) << xml;
    }
}

// ---- Writing ----------------------------------------------------------------------------------------

// An identity whose fields are set directly, as the request sees any identity: through its getters.
class FixedIdentity final : public IZELServerIdentity {
public:
    FixedIdentity(std::string id, std::vector<std::string> roles, bool authenticated)
        : id_(std::move(id)), roles_(std::move(roles)), authenticated_(authenticated)
    {}
    void getId(IZELServerString& out) const override { out.set(id_.data(), static_cast<unsigned>(id_.size())); }
    void getRoles(IZELServerStringArray& out) const override
    {
        for (const std::string& role : roles_) {
            out.append(role.c_str());
        }
    }
    bool isAuthenticated() const override { return authenticated_; }
    void readFromXml(const xercesc_3_2::DOMElement&) override {}

private:
    std::string id_;
    std::vector<std::string> roles_;
    bool authenticated_;
};

TEST(IdentityXmlWriting, WritesIdFlagAndRolesInOrderOfAnyIdentityAndOnlyUtf8Text)
{
    // A single sign-on identity reads the identity's fields too, hands its data out once, and is
    // written as a plain identity.
    ZELServerSingleSignOnIdentity singleSignOn;
    EXPECT_EQ(singleSignOn.getState(), kSingleSignOnOther);
    readInto(singleSignOn, R"(<SSO_IDENTITY id="bob" is_authenticated="1" state="IN_PROGRESS" auth_data="tok=1&amp;x">)"
                           R"(<ROLES><ROLE name="user"/></ROLES></SSO_IDENTITY>)");
    ZELServerString data("stale");
    singleSignOn.takeAuthData(data);
    EXPECT_EQ(data.str(), "tok=1&x");
    singleSignOn.takeAuthData(data);
    EXPECT_EQ(data.str(), "");
    const FixedIdentity withRoles("ann & co", {"admin", "dev", "admin"}, true);
    const FixedIdentity bare("", {}, false);
    const std::pair<const IZELServerIdentity*, std::string> cases[] = {
        {&withRoles, R"(<IDENTITY id="ann &amp; co" is_authenticated="true"><ROLES><ROLE name="admin"/>)"
                     R"(<ROLE name="dev"/><ROLE name="admin"/></ROLES></IDENTITY>)"},
        {&bare, R"(<IDENTITY id="" is_authenticated="false"><ROLES/></IDENTITY>)"},
        {&singleSignOn, R"(<IDENTITY id="bob" is_authenticated="true"><ROLES><ROLE name="user"/></ROLES></IDENTITY>)"},
    };
    for (const auto& [identity, element] : cases) {
        XmlDocument doc;
        ASSERT_EQ(StatusPtr(doc.startXml()), nullptr);
        ASSERT_NE(doc.createDocument("", "REP_GET_REPOSITORIES"), nullptr);
        EXPECT_EQ(IdentityXml(*identity).writeXml(doc), 0u);
        std::string out;
        ASSERT_EQ(StatusPtr(doc.serialize(out)), nullptr);
        EXPECT_EQ(out, std::string(kDeclaration) + "<REP_GET_REPOSITORIES>" + element + "</REP_GET_REPOSITORIES>");
    }
    // Text that is not UTF-8 cannot be written.
    XmlDocument doc;
    ASSERT_EQ(StatusPtr(doc.startXml()), nullptr);
    ASSERT_NE(doc.createDocument("", "REP_GET_REPOSITORIES"), nullptr);
    EXPECT_EQ(IdentityXml(FixedIdentity("caf\xE9", {}, true)).writeXml(doc), msg::kXmlFailure);
    EXPECT_EQ(IdentityXml(FixedIdentity("ann", {"\xFF"}, true)).writeXml(doc), msg::kXmlFailure);
}

}  // namespace
}  // namespace zel
