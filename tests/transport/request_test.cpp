// The request text, byte for byte: keyword, identity document, client identifier, the caller's
// values and the payload documents.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <zelserverapi/IZELServerPath.h>
#include <zelserverapi/IZELServerPropertyAccessor.h>
#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerUserToken.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "api/message_numbers.h"
#include "security/ZELServerIdentity.h"
#include "transport/ZELServerTCPIPRequest.h"
#include "transport/payload_fields.h"
#include "transport/xml_document.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using namespace std::string_literals;
using StatusPtr = std::unique_ptr<IZELServerStatus>;

const std::string kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";

std::string textOf(const IZELServerRequest& request)
{
    std::string text;
    EXPECT_EQ(request.getText(text), 0);
    return text;
}

ZELServerStringArray listOf(std::vector<std::string> entries) { return ZELServerStringArray(std::move(entries)); }

// Fills `identity` as a sign-in reply would.
void signIn(ZELServerIdentity& identity)
{
    XmlReader reader;
    StatusPtr failure(reader.parse(R"(<R><IDENTITY id="ann" is_authenticated="true">)"
                                   R"(<ROLES><ROLE name="admin"/><ROLE name="dev"/></ROLES></IDENTITY></R>)"));
    EXPECT_EQ(failure, nullptr);
    identity.readFromXml(*reader.rootOf()->node()->getFirstElementChild());
}

// ---- Start of every request -------------------------------------------------------------------------

TEST(Request, WithoutIdentityStartsWithKeywordAndClientIdEvenWhenEmpty)
{
    ZELServerTCPIPRequest request("REP_GET_REPOSITORIES", nullptr, "");
    EXPECT_EQ(textOf(request), "REP_GET_REPOSITORIES\0clientID="s);
    request.addValue("enableFilter", "All");
    EXPECT_EQ(textOf(request), "REP_GET_REPOSITORIES\0clientID=\0enableFilter=All"s);
}

TEST(Request, WithIdentityCarriesTheIdentityDocumentBeforeTheClientId)
{
    ZELServerIdentity identity;
    signIn(identity);
    const ZELServerTCPIPRequest request("REP_GET_REPOSITORIES", &identity, "tool-7");
    EXPECT_EQ(textOf(request), "REP_GET_REPOSITORIES\0identityObject="s + kDeclaration +
                                   R"(<REP_GET_REPOSITORIES><IDENTITY id="ann" is_authenticated="true">)"
                                   R"(<ROLES><ROLE name="admin"/><ROLE name="dev"/></ROLES></IDENTITY>)"
                                   "</REP_GET_REPOSITORIES>\0clientID=tool-7"s);
}

TEST(Request, UnauthenticatedIdentityWithoutRolesIsStillAttached)
{
    const ZELServerIdentity identity;
    const ZELServerTCPIPRequest request("SERVER_SESSION_INIT", &identity, "");
    EXPECT_EQ(textOf(request), "SERVER_SESSION_INIT\0identityObject="s + kDeclaration +
                                   R"(<SERVER_SESSION_INIT><IDENTITY id="" is_authenticated="false"><ROLES/>)"
                                   "</IDENTITY></SERVER_SESSION_INIT>\0clientID="s);
}

TEST(Request, KeywordThatIsNoElementNameLeavesTheIdentityOut)
{
    ZELServerIdentity identity;
    signIn(identity);
    const ZELServerTCPIPRequest request("NOT AN ELEMENT", &identity, "c");
    EXPECT_EQ(textOf(request), "NOT AN ELEMENT\0clientID=c"s);
}

class RequestWithoutXml : public ::testing::Test {
protected:
    void TearDown() override { heap::failNextAllocations(0); }
};

TEST_F(RequestWithoutXml, RefusesEveryDocumentAndKeepsPlainValues)
{
    ZELServerTCPIPRequest request("REP_ADD_REPOSITORY", nullptr, "c");
    // The XML support is made by the first payload, as the request's first allocation from the
    // library heap; once it failed, later payloads do not try again.
    heap::failNextAllocations(1);
    EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("r"), ZELServerString("d")),
              static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("r"), ZELServerString("d")),
              static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(textOf(request), "REP_ADD_REPOSITORY\0clientID=c"s);
    request.addValue("plain", "still works");
    EXPECT_EQ(textOf(request), "REP_ADD_REPOSITORY\0clientID=c\0plain=still works"s);
}

// ---- Named values -----------------------------------------------------------------------------------

TEST(Request, ValuesAreAppendedAsGivenInEveryForm)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    request.addValue("a", ZELServerString("1=2"));
    request.addValue("b", std::string("x"));
    request.addValue(ZELServerString("c"), ZELServerString(""));
    request.addValue("a", "again");
    EXPECT_EQ(textOf(request), "K\0clientID=\0a=1=2\0b=x\0c=\0a=again"s);
}

TEST(Request, BooleanIsTrueOnlyForExactlyOne)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    request.addBooleanValue("one", 1);
    request.addBooleanValue("zero", 0);
    request.addBooleanValue("two", 2);
    request.addBooleanValue("max", 0xFFFFFFFFu);
    EXPECT_EQ(textOf(request), "K\0clientID=\0one=true\0zero=false\0two=false\0max=false"s);
}

struct ListCase {
    std::vector<std::string> entries;
    std::string added;
};

class ValueList : public ::testing::TestWithParam<ListCase> {};

TEST_P(ValueList, AddsEachCompletePairWithoutTheListName)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    request.addValueList("directives", listOf(GetParam().entries));
    EXPECT_EQ(textOf(request), "K\0clientID="s + GetParam().added);

    ZELServerTCPIPRequest other("K", nullptr, "");
    other.addValueList(ZELServerString("directives"), listOf(GetParam().entries));
    EXPECT_EQ(textOf(other), textOf(request));
}

INSTANTIATE_TEST_SUITE_P(Request, ValueList,
                         ::testing::Values(ListCase{{}, ""}, ListCase{{"enableFilter"}, ""},
                                           ListCase{{"enableFilter", "All"}, "\0enableFilter=All"s},
                                           ListCase{{"enableFilter", "All", "odd"}, "\0enableFilter=All"s},
                                           ListCase{{"a", "1", "b", ""}, "\0a=1\0b="s}));

TEST(Request, DirectivesAndNotificationsAreKeptApartAndNotWritten)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.appendDirectives(listOf({"requesterResultPort", "0"})), 2u);
    EXPECT_EQ(request.appendDirectives(listOf({"odd"})), 1u);
    EXPECT_EQ(request.appendNotifications(listOf({"success_topic", "t1"})), 2u);
    EXPECT_EQ(textOf(request), "K\0clientID="s);

    ZELServerStringArray directives = listOf({"kept"});
    EXPECT_EQ(request.getDirectives(directives), 3u);
    EXPECT_EQ(directives.items(), (std::vector<std::string>{"kept", "requesterResultPort", "0", "odd"}));
    ZELServerStringArray notifications;
    EXPECT_EQ(request.getNotifications(notifications), 2u);
    EXPECT_EQ(notifications.items(), (std::vector<std::string>{"success_topic", "t1"}));
}

// ---- XML values -------------------------------------------------------------------------------------

// Writes one "ITEM" element, or fails with a chosen code.
class ItemXml final : public XmlWritable {
public:
    explicit ItemXml(std::string value, unsigned failure = 0) : value_(std::move(value)), failure_(failure) {}
    unsigned writeXml(XmlDocument& document) const override
    {
        XmlElement* item = document.createElement("ITEM");
        if (item == nullptr || !item->setAttribute("value", value_) || !document.documentElement()->appendChild(item)) {
            return msg::kXmlFailure;
        }
        return failure_;
    }

private:
    std::string value_;
    unsigned failure_;
};

TEST(RequestXmlValue, AddsTheSerialisedDocumentUnderTheName)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.addXmlValue("itemObject", ItemXml("a<b"), "ROOT"), 0);
    EXPECT_EQ(textOf(request), "K\0clientID=\0itemObject="s + kDeclaration + R"(<ROOT><ITEM value="a&lt;b"/></ROOT>)");
}

TEST(RequestXmlValue, FailuresAddNothingAndLeaveTheRequestUsable)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.addXmlValue("bad", ItemXml("x"), "1ROOT"), static_cast<int>(msg::kXmlFailure));
    EXPECT_EQ(request.addXmlValue("bad", ItemXml("x", 393699), "ROOT"), 393699);
    EXPECT_EQ(request.addXmlValue("bad", ItemXml("bell\x07"), "ROOT"), static_cast<int>(msg::kSerializeFailed));
    EXPECT_EQ(textOf(request), "K\0clientID="s);

    // nothing of the failed documents is left behind in the next one
    EXPECT_EQ(request.addXmlValue("good", ItemXml("y"), "ROOT"), 0);
    EXPECT_EQ(textOf(request), "K\0clientID=\0good="s + kDeclaration + R"(<ROOT><ITEM value="y"/></ROOT>)");
}

TEST(RequestPayload, RepositoryDocument)
{
    ZELServerTCPIPRequest request("REP_ADD_REPOSITORY", nullptr, "");
    EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("Samples"),
                                           ZELServerString("Tom's \"demo\" & more")),
              0);
    EXPECT_EQ(textOf(request), "REP_ADD_REPOSITORY\0clientID=\0repositoryObject="s + kDeclaration +
                                   R"(<REP_ADD_REPOSITORY><REPOSITORY description="Tom's &quot;demo&quot; &amp; more" )"
                                   R"(name="Samples"/></REP_ADD_REPOSITORY>)");
}

TEST(RequestPayload, LocalTextIsConvertedAndIllegalCharactersFailTheSerialiser)
{
    ZELServerTCPIPRequest request("REP_ADD_REPOSITORY", nullptr, "");
    EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("Caf\xE9"), ZELServerString("")), 0);
    EXPECT_EQ(textOf(request), "REP_ADD_REPOSITORY\0clientID=\0repositoryObject="s + kDeclaration +
                                   "<REP_ADD_REPOSITORY><REPOSITORY description=\"\" name=\"Caf\xC3\xA9\"/>"
                                   "</REP_ADD_REPOSITORY>");

    ZELServerTCPIPRequest failing("REP_ADD_REPOSITORY", nullptr, "");
    EXPECT_EQ(failing.addRepositoryPayload("repositoryObject", ZELServerString("r"), ZELServerString("\x01")),
              static_cast<int>(msg::kSerializeFailed));
    EXPECT_EQ(textOf(failing), "REP_ADD_REPOSITORY\0clientID="s);
}

class FixedToken : public IZELServerUserToken {
public:
    void getToken(IZELServerString& out) const override { out.assign("tk-1"); }
    void getClientAddress(IZELServerString& out) const override { out.assign("10.0.0.1"); }
    long long getExpirationTimeout() const override { return -3600; }
};

class ServerToken final : public FixedToken, public UserTokenPayloadFields {
public:
    std::string firstTokenDate() const override { return "2024-01-01"; }
    std::string lastTokenDate() const override { return "2024-02-01"; }
    std::string expirationDate() const override { return "2025-01-01"; }
};

TEST(RequestPayload, UserTokenDocumentUnderTheKeyword)
{
    ZELServerTCPIPRequest request("SEC_ADD_USERTOKEN", nullptr, "");
    EXPECT_EQ(request.addUserTokenPayload("userTokenObject", ServerToken()), 0);
    EXPECT_EQ(request.addUserTokenPayload("userTokenObject", FixedToken()), 0);
    EXPECT_EQ(textOf(request),
              "SEC_ADD_USERTOKEN\0clientID=\0userTokenObject="s + kDeclaration +
                  R"(<SEC_ADD_USERTOKEN><USERTOKEN clientaddress="10.0.0.1" expirationdate="2025-01-01" )"
                  R"(expirationtimeout="-3600" firsttokendate="2024-01-01" lasttokendate="2024-02-01" token="tk-1"/>)"
                  "</SEC_ADD_USERTOKEN>\0userTokenObject="s +
                  kDeclaration +
                  R"(<SEC_ADD_USERTOKEN><USERTOKEN clientaddress="10.0.0.1" expirationdate="" )"
                  R"(expirationtimeout="-3600" firsttokendate="" lasttokendate="" token="tk-1"/></SEC_ADD_USERTOKEN>)");
}

class FixedPath final : public IZELServerPath {
public:
    void getName(IZELServerString& out) const override { out.assign("a.txt"); }
    void getDirectoryPath(IZELServerString& out) const override { out.assign("/data/in"); }
    void getAbsolutePath(IZELServerString& out) const override { out.assign("/data/in/a.txt"); }
};

TEST(RequestPayload, PathDocumentUnderTheKeyword)
{
    ZELServerTCPIPRequest request("SR_EXISTS", nullptr, "");
    EXPECT_EQ(request.addPathPayload("srPath", FixedPath()), 0);
    EXPECT_EQ(textOf(request), "SR_EXISTS\0clientID=\0srPath="s + kDeclaration +
                                   R"(<SR_EXISTS><PATH abspath="/data/in/a.txt" dirpath="/data/in" name="a.txt"/>)"
                                   "</SR_EXISTS>");
}

// A service as the request sees it: only its getters are used.
class NoProperties final : public IZELServerPropertyAccessor {
public:
    void getCategoryNames(IZELServerStringArray&) const override {}
    void getPropertyNames(const IZELServerString&, IZELServerStringArray&) const override {}
    bool getPropertyPairs(const IZELServerString&, IZELServerStringArray&) const override { return false; }
    bool getPropertyValue(const IZELServerString&, const IZELServerString&, IZELServerString&) const override
    {
        return false;
    }
    void setProperty(const IZELServerString&, const IZELServerString&, const IZELServerString&) override {}
    bool removeCategory(const IZELServerString&) override { return false; }
    bool removeProperty(const IZELServerString&, const IZELServerString&) override { return false; }
    void getProperties(const IZELServerString&, IZELServerVector<IZELServerProperty>&) const override {}
    const IZELServerProperty* getProperty(const IZELServerString&, const IZELServerString&) const override
    {
        return nullptr;
    }
};

class FixedService : public IZELServerService {
public:
    void getName(IZELServerString& out) const override { out.assign("svc"); }
    void setName(const IZELServerString&) override {}
    void getDisplayName(IZELServerString& out) const override { out.assign("Service <1>"); }
    void setDisplayName(const IZELServerString&) override {}
    void getDescription(IZELServerString& out) const override { out.assign(""); }
    void setDescription(const IZELServerString&) override {}
    void getUrlPattern(IZELServerString& out) const override { out.assign("/svc/*"); }
    void setUrlPattern(const IZELServerString&) override {}
    unsigned isEnabled() const override { return 1; }
    void setEnabled(unsigned) override {}
    IZELServerPropertyAccessor& getPropertyAccessor() override { return properties_; }
    IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor&) override { return nullptr; }
    unsigned isWorkspaceRegistrationAllowed() const override { return 0; }
    void setWorkspaceRegistrationAllowed(unsigned) override {}
    // custom formats and templates allowed, custom transformers not; 7 counts as set
    unsigned isRegistrationAllowed(unsigned itemType) const override
    {
        return itemType == 2 ? 7 : itemType == 4 ? 1 : 0;
    }
    void setRegistrationAllowed(unsigned, unsigned) override {}
    IZELServerStatus* itemRegistered(const IZELServerString&, const IZELServerString&, unsigned&) override
    {
        return nullptr;
    }
    IZELServerStatus* registerItem(const IZELServerString&, const IZELServerString&) override { return nullptr; }
    IZELServerStatus* deregisterItem(const IZELServerString&, const IZELServerString&, unsigned&) override
    {
        return nullptr;
    }
    IZELServerStatus* getRegisteredItems(const ZELServerStringDict*, IZELServerVector<IZELServerItem>&) override
    {
        return nullptr;
    }

private:
    NoProperties properties_;
};

class ServerService final : public FixedService, public ServicePayloadFields {
public:
    std::string serviceId() const override { return "42"; }
};

TEST(RequestPayload, ServiceDocumentKeepsTheAddRootAndWritesFlagsAsWords)
{
    ZELServerTCPIPRequest request("REP_UPDATE_SERVICE", nullptr, "");
    EXPECT_EQ(request.addServicePayload("serviceObject", ServerService()), 0);
    const auto document = [](const std::string& id) {
        return kDeclaration +
               R"(<REP_ADD_SERVICE><SERVICE description="" display_name="Service &lt;1>" )"
               R"(is_customformat_reg_allowed="true" is_customtransform_reg_allowed="false" )"
               R"(is_enabled="true" is_template_reg_allowed="true" is_workspace_reg_allowed="false" )"
               R"(name="svc" service_id=")" +
               id + R"(" url_pattern="/svc/*"/></REP_ADD_SERVICE>)";
    };
    EXPECT_EQ(textOf(request), "REP_UPDATE_SERVICE\0clientID=\0serviceObject="s + document("42"));

    // a service that never came from the server has the id of a fresh one
    ZELServerTCPIPRequest fresh("REP_ADD_SERVICE", nullptr, "");
    EXPECT_EQ(fresh.addServicePayload("serviceObject", FixedService()), 0);
    EXPECT_EQ(textOf(fresh), "REP_ADD_SERVICE\0clientID=\0serviceObject="s + document("-1"));
}

}  // namespace
}  // namespace zel
