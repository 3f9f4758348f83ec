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

struct FlagCase {
    const char* attribute;  // null: attribute absent
    bool authenticated;
};

class AuthenticatedFlag : public ::testing::TestWithParam<FlagCase> {};

TEST_P(AuthenticatedFlag, IsReadByFirstLetterOrAsANumber)
{
    const FlagCase& c = GetParam();
    ZELServerIdentity identity;
    const std::string attribute = c.attribute ? std::string(" is_authenticated=\"") + c.attribute + "\"" : "";
    readInto(identity, "<IDENTITY id=\"ann\"" + attribute + "/>");
    EXPECT_EQ(identity.isAuthenticated(), c.authenticated);
}

INSTANTIATE_TEST_SUITE_P(Identity, AuthenticatedFlag,
                         ::testing::Values(FlagCase{"yes", true}, FlagCase{"No", false}, FlagCase{"0", false},
                                           FlagCase{"2.5", true}, FlagCase{"maybe", false}, FlagCase{"true", true},
                                           FlagCase{"False", false}, FlagCase{"Yesterday", true},
                                           FlagCase{"-1", true}, FlagCase{"0.0", false}, FlagCase{"", false},
                                           FlagCase{nullptr, false}));

TEST(Identity, RolesComeFromEveryRolesChildInDocumentOrderMatchedIgnoringCase)
{
    ZELServerIdentity identity;
    readInto(identity, R"(<IDENTITY id="ann" is_authenticated="true">)"
                       R"(<ROLES><ROLE name="a"/><ROLE name="b"/></ROLES>)"
                       R"(<OTHER><ROLE name="not-a-role"/></OTHER>)"
                       R"(<roles><Role name="c"/><ROLE/><ROLE nom="x"/><ROLE name="a"/></roles>)"
                       R"(<ROLES><GROUP><ROLE name="too-deep"/></GROUP></ROLES>)"
                       R"(</IDENTITY>)");
    EXPECT_EQ(idOf(identity), "ann");
    EXPECT_TRUE(identity.isAuthenticated());
    EXPECT_EQ(rolesOf(identity), (std::vector<std::string>{"a", "b", "c", "a"}));
}

TEST(Identity, AttributeNamesAreExact)
{
    ZELServerIdentity identity;
    readInto(identity, R"(<IDENTITY ID="ann" Is_Authenticated="true"><ROLES><ROLE NAME="r"/></ROLES></IDENTITY>)");
    EXPECT_EQ(idOf(identity), "");
    EXPECT_FALSE(identity.isAuthenticated());
    EXPECT_TRUE(rolesOf(identity).empty());
}

TEST(Identity, ReadingAgainReplacesIdAndFlagButAppendsRoles)
{
    ZELServerIdentity identity;
    readInto(identity, R"(<IDENTITY id="ann" is_authenticated="y"><ROLES><ROLE name="r"/></ROLES></IDENTITY>)");
    readInto(identity, R"(<IDENTITY><ROLES><ROLE name="r"/></ROLES></IDENTITY>)");
    EXPECT_EQ(idOf(identity), "");
    EXPECT_FALSE(identity.isAuthenticated());
    EXPECT_EQ(rolesOf(identity), (std::vector<std::string>{"r", "r"}));

    ZELServerStringArray out(std::vector<std::string>{"kept"});
    identity.getRoles(out);
    EXPECT_EQ(out.items(), (std::vector<std::string>{"kept", "r", "r"}));
}

struct StateCase {
    const char* attribute;  // null: attribute absent
    unsigned state;
};

class SingleSignOnState : public ::testing::TestWithParam<StateCase> {};

TEST_P(SingleSignOnState, IsExactlyOneOfTheTwoKnownWordsOrOther)
{
    const StateCase& c = GetParam();
    ZELServerSingleSignOnIdentity identity;
    const std::string attribute = c.attribute ? std::string(" state=\"") + c.attribute + "\"" : "";
    readInto(identity, "<SSO_IDENTITY" + attribute + "/>");
    EXPECT_EQ(identity.getState(), c.state);
}

INSTANTIATE_TEST_SUITE_P(Identity, SingleSignOnState,
                         ::testing::Values(StateCase{"SUCCEEDED", kSingleSignOnSucceeded},
                                           StateCase{"IN_PROGRESS", kSingleSignOnInProgress},
                                           StateCase{"succeeded", kSingleSignOnOther},
                                           StateCase{"SUCCEEDED ", kSingleSignOnOther},
                                           StateCase{"", kSingleSignOnOther}, StateCase{nullptr, kSingleSignOnOther}));

TEST(SingleSignOnIdentity, ReadsTheIdentityFieldsTooAndHandsItsDataOutOnce)
{
    ZELServerSingleSignOnIdentity identity;
    EXPECT_EQ(identity.getState(), kSingleSignOnOther);
    readInto(identity, R"(<SSO_IDENTITY id="bob" is_authenticated="true" state="IN_PROGRESS" auth_data="tok=1&amp;x">)"
                       R"(<ROLES><ROLE name="user"/></ROLES></SSO_IDENTITY>)");
    EXPECT_EQ(idOf(identity), "bob");
    EXPECT_TRUE(identity.isAuthenticated());
    EXPECT_EQ(rolesOf(identity), std::vector<std::string>{"user"});

    ZELServerString data("stale");
    identity.takeAuthData(data);
    EXPECT_EQ(data.str(), "tok=1&x");
    identity.takeAuthData(data);
    EXPECT_EQ(data.str(), "");
}

// ---- Writing ----------------------------------------------------------------------------------------

// An identity whose fields are set directly, as the request sees any identity: through its getters.
class FixedIdentity final : public IZELServerIdentity {
public:
    FixedIdentity(std::string id, std::vector<std::string> roles, bool authenticated)
        : id_(std::move(id)), roles_(std::move(roles)), authenticated_(authenticated) {}
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

class IdentityWriting : public ::testing::Test {
protected:
    void SetUp() override
    {
        StatusPtr failure(doc.startXml());
        ASSERT_EQ(failure, nullptr) << failure->getMessage();
        ASSERT_NE(doc.createDocument("", "REP_GET_REPOSITORIES"), nullptr);
    }

    std::string write(const IZELServerIdentity& identity)
    {
        EXPECT_EQ(IdentityXml(identity).writeXml(doc), 0u);
        std::string out;
        StatusPtr failure(doc.serialize(out));
        EXPECT_EQ(failure, nullptr) << failure->getMessage();
        return out;
    }

    XmlDocument doc;
};

TEST_F(IdentityWriting, WritesIdFlagAndOneRolePerRoleInOrder)
{
    EXPECT_EQ(write(FixedIdentity("ann & co", {"admin", "dev", "admin"}, true)),
              std::string(kDeclaration) +
                  R"(<REP_GET_REPOSITORIES><IDENTITY id="ann &amp; co" is_authenticated="true"><ROLES>)"
                  R"(<ROLE name="admin"/><ROLE name="dev"/><ROLE name="admin"/></ROLES></IDENTITY>)"
                  R"(</REP_GET_REPOSITORIES>)");
}

TEST_F(IdentityWriting, WithoutRolesStillWritesAnEmptyRolesElement)
{
    EXPECT_EQ(write(FixedIdentity("", {}, false)),
              std::string(kDeclaration) +
                  R"(<REP_GET_REPOSITORIES><IDENTITY id="" is_authenticated="false"><ROLES/></IDENTITY>)"
                  R"(</REP_GET_REPOSITORIES>)");
}

TEST_F(IdentityWriting, SingleSignOnIdentityIsWrittenAsAPlainIdentity)
{
    ZELServerSingleSignOnIdentity identity;
    readInto(identity, R"(<SSO_IDENTITY id="bob" is_authenticated="1" state="SUCCEEDED" auth_data="secret">)"
                       R"(<ROLES><ROLE name="user"/></ROLES></SSO_IDENTITY>)");
    EXPECT_EQ(write(identity), std::string(kDeclaration) +
                                   R"(<REP_GET_REPOSITORIES><IDENTITY id="bob" is_authenticated="true"><ROLES>)"
                                   R"(<ROLE name="user"/></ROLES></IDENTITY></REP_GET_REPOSITORIES>)");
}

TEST_F(IdentityWriting, TextThatIsNotUtf8CannotBeWritten)
{
    EXPECT_EQ(IdentityXml(FixedIdentity("caf\xE9", {}, true)).writeXml(doc), msg::kXmlFailure);
    EXPECT_EQ(IdentityXml(FixedIdentity("ann", {"\xFF"}, true)).writeXml(doc), msg::kXmlFailure);
}

}  // namespace
}  // namespace zel
