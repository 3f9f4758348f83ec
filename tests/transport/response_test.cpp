// The response: body, booleans, the sign-in reply, and the object-reader machinery every object
// kind plugs into.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <zelserverapi/IZELServerIdentity.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "security/ZELServerIdentity.h"
#include "transport/ZELServerResponse.h"
#include "transport/object_reader.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

using namespace std::string_literals;

constexpr int kNotXml = static_cast<int>(msg::kXmlFailure);
constexpr int kNotReadable = static_cast<int>(msg::kUnreadableReply);

std::unique_ptr<ZELServerResponse> responseWith(const std::string& body)
{
    auto response = std::make_unique<ZELServerResponse>(nullptr);
    response->setBody(body);
    return response;
}

TEST(Response, BodyIsKeptVerbatim)
{
    ZELServerResponse response(nullptr);
    std::string body = "stale";
    EXPECT_EQ(response.getBody(body), 0);
    EXPECT_EQ(body, "");
    EXPECT_EQ(response.setBody("a\0b\0"s), 0);
    EXPECT_EQ(response.getBody(body), 0);
    EXPECT_EQ(body, "a\0b\0"s);
}

struct BooleanCase {
    std::string body;
    int result;
    unsigned flag;
};

class ReadBoolean : public ::testing::TestWithParam<BooleanCase> {};

TEST_P(ReadBoolean, AcceptsExactlyTrueAndFalse)
{
    const BooleanCase& c = GetParam();
    unsigned flag = 7;
    EXPECT_EQ(responseWith(c.body)->readBoolean(flag), c.result);
    EXPECT_EQ(flag, c.flag);
}

INSTANTIATE_TEST_SUITE_P(Response, ReadBoolean,
                         ::testing::Values(BooleanCase{"true", 0, 1}, BooleanCase{"false", 0, 0},
                                           BooleanCase{"True", 393604, 7}, BooleanCase{"true ", 393604, 7},
                                           BooleanCase{"", 393604, 7}, BooleanCase{"true\0"s, 393604, 7}));

// ---- Sign-in reply ----------------------------------------------------------------------------------

class SessionInit : public ::testing::Test {
protected:
    void TearDown() override { delete identity; }

    int read(const std::string& body) { return responseWith(body)->readSessionInit(identity, settings); }

    std::string id() const
    {
        ZELServerString out;
        identity->getId(out);
        return out.str();
    }

    IZELServerIdentity* identity = new ZELServerIdentity();
    ZELServerStringDict settings;
};

TEST_F(SessionInit, IdentityFillsTheExistingObjectAndSecuritySettingsAreStored)
{
    IZELServerIdentity* const before = identity;
    ASSERT_EQ(read(R"(<SERVER_SESSION_INIT security_enabled="true" security_pubparm="p1">)"
                   R"(<IDENTITY id="ann" is_authenticated="true"><ROLES><ROLE name="admin"/></ROLES></IDENTITY>)"
                   R"(</SERVER_SESSION_INIT>)"),
              0);
    EXPECT_EQ(identity, before);
    EXPECT_EQ(id(), "ann");
    EXPECT_TRUE(identity->isAuthenticated());
    ZELServerStringArray roles;
    identity->getRoles(roles);
    EXPECT_EQ(roles.items(), std::vector<std::string>{"admin"});
    EXPECT_EQ(settings.entries(), 2u);
    EXPECT_STREQ(settings.lookup("SECURITY_ENABLED"), "true");
    EXPECT_STREQ(settings.lookup("SECURITY_PUBPARM"), "p1");
}

TEST_F(SessionInit, IdentityElementIsFoundIgnoringCaseAndPreferredToSingleSignOn)
{
    IZELServerIdentity* const before = identity;
    ASSERT_EQ(read(R"(<R><SSO_IDENTITY id="sso"/><identity id="plain"/></R>)"), 0);
    EXPECT_EQ(identity, before);
    EXPECT_EQ(id(), "plain");
    EXPECT_TRUE(settings.empty());
}

TEST_F(SessionInit, SingleSignOnIdentityReplacesTheExistingObject)
{
    ASSERT_EQ(read(R"(<R security_enabled=""><SSO_IDENTITY id="bob" is_authenticated="true" state="SUCCEEDED")"
                   R"( auth_data="d1"/></R>)"),
              0);
    auto* sso = dynamic_cast<IZELServerSingleSignOnIdentity*>(identity);
    ASSERT_NE(sso, nullptr);
    EXPECT_EQ(id(), "bob");
    EXPECT_TRUE(identity->isAuthenticated());
    EXPECT_EQ(sso->getState(), kSingleSignOnSucceeded);
    ZELServerString data;
    sso->takeAuthData(data);
    EXPECT_EQ(data.str(), "d1");
    EXPECT_EQ(settings.entries(), 1u);
    EXPECT_STREQ(settings.lookup("SECURITY_ENABLED"), "");
}

TEST_F(SessionInit, ReplyWithoutIdentityDestroysIt)
{
    settings.insert("SECURITY_PUBPARM", "earlier");
    EXPECT_EQ(read(R"(<R security_pubparm="p2"><GROUP><IDENTITY id="too-deep"/></GROUP></R>)"), 0);
    EXPECT_EQ(identity, nullptr);
    EXPECT_STREQ(settings.lookup("SECURITY_PUBPARM"), "p2");

    EXPECT_EQ(read("<R/>"), 0);
    EXPECT_EQ(identity, nullptr);
}

TEST_F(SessionInit, IdentityIsMadeWhenTheChannelHasNone)
{
    delete identity;
    identity = nullptr;
    ASSERT_EQ(read(R"(<R><IDENTITY id="ann"/></R>)"), 0);
    ASSERT_NE(identity, nullptr);
    EXPECT_EQ(id(), "ann");
}

TEST_F(SessionInit, BodyThatIsNotXmlGivesTheParserCodeAndKeepsTheIdentity)
{
    IZELServerIdentity* const before = identity;
    for (const std::string& body : {""s, "not xml"s, R"(<?xml version="1.0"?>)"s, "<R>"s, "\0<R/>"s}) {
        EXPECT_EQ(read(body), kNotXml) << body;
        EXPECT_EQ(identity, before);
    }
    EXPECT_TRUE(settings.empty());
}

// ---- Object-reader machinery ------------------------------------------------------------------------

// A small object kind: "THING" elements with a "name"; a "bad" attribute makes its reader refuse.
class IThing {
public:
    virtual ~IThing() = default;
    virtual std::string name() const = 0;
};

class Thing final : public IThing, public HeapObject {
public:
    explicit Thing(int* alive = nullptr) : alive_(alive)
    {
        if (alive_ != nullptr) {
            ++*alive_;
        }
    }
    ~Thing() override
    {
        if (alive_ != nullptr) {
            --*alive_;
        }
    }
    std::string name() const override { return name_; }
    bool readFromXml(const XmlElement& element)
    {
        std::string ignored;
        getAttribute(&element, "name", name_);
        return !getAttribute(&element, "bad", ignored);
    }

private:
    int* alive_;
    std::string name_;
};

class OtherThing final : public IThing {
public:
    std::string name() const override { return "other"; }
};

bool fillThing(Thing& thing, const XmlElement& element) { return thing.readFromXml(element); }

using ThingVector = ZELServerVector<IThing, Thing>;

std::vector<std::string> namesOf(ThingVector& things)
{
    std::vector<std::string> names;
    for (unsigned i = 0; i < things.entries(); ++i) {
        names.push_back(things.at(i)->name());
    }
    return names;
}

int readThings(const std::string& body, ThingVector& things, int* alive = nullptr)
{
    return readObjectList(
        body, "THING", things, [alive] { return new Thing(alive); }, fillThing);
}

TEST(ObjectReader, DocumentElementIsHandedToTheReader)
{
    std::string seen;
    EXPECT_EQ(readReplyDocument("<ROOT a='1'><C/></ROOT>",
                                [&](const XmlElement& root) {
                                    seen = root.name();
                                    return true;
                                }),
              0);
    EXPECT_EQ(seen, "ROOT");
    EXPECT_EQ(readReplyDocument("<ROOT/>", [](const XmlElement&) { return false; }), kNotReadable);
    EXPECT_EQ(readReplyDocument("", [](const XmlElement&) { return true; }), kNotXml);
}

TEST(ObjectReader, ListHoldsEveryElementAtAnyDepthInDocumentOrder)
{
    int alive = 0;
    ThingVector things;
    things.append(new Thing(&alive));
    EXPECT_EQ(readThings(R"(<THING name="root"><A><THING name="a"><THING name="a1"/></THING></A>)"
                         R"(<thing name="not-this-case"/><THING name="b"/></THING>)",
                         things, &alive),
              0);
    EXPECT_EQ(namesOf(things), (std::vector<std::string>{"root", "a", "a1", "b"}));
    EXPECT_EQ(alive, 4);  // the earlier element was destroyed, not just forgotten
}

TEST(ObjectReader, ListStopsAtAnElementItsReaderRefusesAndKeepsWhatCameBefore)
{
    int alive = 0;
    ThingVector things;
    EXPECT_EQ(readThings(R"(<R><THING name="a"/><THING name="b" bad=""/><THING name="c"/></R>)", things, &alive),
              kNotReadable);
    EXPECT_EQ(namesOf(things), std::vector<std::string>{"a"});
    EXPECT_EQ(alive, 1);
}

TEST(ObjectReader, ListBodyThatDoesNotParseLeavesTheVectorAlone)
{
    ThingVector things;
    things.append(new Thing());
    EXPECT_EQ(readThings("", things), kNotXml);
    EXPECT_EQ(readThings("<R><THING></R>", things), kNotXml);
    EXPECT_EQ(things.entries(), 1u);
}

TEST(ObjectReader, ListObjectThatCannotBeMadeFails)
{
    ThingVector things;
    EXPECT_EQ(readObjectList(
                  "<R><THING/></R>", "THING", things, []() -> Thing* { return nullptr; }, fillThing),
              kNotReadable);
    EXPECT_EQ(things.entries(), 0u);
}

TEST(ObjectReader, SingleTakesTheFirstElementAnywhere)
{
    Thing thing;
    IThing& object = thing;
    EXPECT_EQ(readFirstObject<Thing>(R"(<R><A><THING name="first"/></A><THING name="second"/></R>)", "THING", object,
                                     fillThing),
              0);
    EXPECT_EQ(thing.name(), "first");
}

TEST(ObjectReader, SingleFailures)
{
    Thing thing;
    EXPECT_EQ(readFirstObject<Thing>("<R><OTHER/></R>", "THING", thing, fillThing), kNotReadable);
    EXPECT_EQ(readFirstObject<Thing>(R"(<THING name="x" bad="1"/>)", "THING", thing, fillThing), kNotReadable);
    EXPECT_EQ(readFirstObject<Thing>("", "THING", thing, fillThing), kNotXml);

    OtherThing other;
    IThing& foreign = other;
    EXPECT_EQ(readFirstObject<Thing>(R"(<THING name="x"/>)", "THING", foreign, fillThing), kNotReadable);
}

}  // namespace
}  // namespace zel
