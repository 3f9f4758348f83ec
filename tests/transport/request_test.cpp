// The request text, byte for byte: keyword, identity document, client identifier, the caller's
// values and the payload documents.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "api/message_numbers.h"
#include "security/ZELServerIdentity.h"
#include "transport/ZELServerTCPIPRequest.h"
#include "transport/xml_document.h"

namespace zel {
namespace {

using namespace std::string_literals;
using Strings = std::vector<std::string>;

const std::string kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";
constexpr int kXmlFailure = static_cast<int>(msg::kXmlFailure);
constexpr int kSerializeFailed = static_cast<int>(msg::kSerializeFailed);

std::string textOf(const IZELServerRequest& request)
{
    std::string text;
    EXPECT_EQ(request.getText(text), 0);
    return text;
}

TEST(Request, StartsWithKeywordThenTheIdentityDocumentWhenThereIsOneThenTheClientId)
{
    const ZELServerIdentity fresh;
    EXPECT_EQ(textOf(ZELServerTCPIPRequest("INIT", &fresh, "tool-7")),
              "INIT\0identityObject="s + kDeclaration +
                  R"(<INIT><IDENTITY id="" is_authenticated="false"><ROLES/></IDENTITY></INIT>)" +
                  "\0clientID=tool-7"s);
    // A keyword that is no element name leaves the identity out.
    EXPECT_EQ(textOf(ZELServerTCPIPRequest("NOT AN ELEMENT", &fresh, "c")), "NOT AN ELEMENT\0clientID=c"s);
}

TEST(Request, NamedValuesBooleansAndListsOfPairs)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    request.addBooleanValue("one", 1);
    request.addBooleanValue("zero", 0);
    request.addBooleanValue("two", 2);
    request.addValue(ZELServerString("s"), ZELServerString("v"));
    // Each complete pair, without the list's name; an odd entry at the end is left out.
    request.addValueList("directives", ZELServerStringArray(Strings{"a", "1", "odd"}));
    request.addValueList(ZELServerString("directives"), ZELServerStringArray(Strings{"b", ""}));
    EXPECT_EQ(textOf(request), "K\0clientID=\0one=true\0zero=false\0two=false\0s=v\0a=1\0b="s);
}

TEST(Request, DirectivesAndNotificationsAreKeptApartAndNotWritten)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.appendDirectives(ZELServerStringArray(Strings{"requesterResultPort", "0"})), 2u);
    EXPECT_EQ(request.appendDirectives(ZELServerStringArray(Strings{"odd"})), 1u);
    EXPECT_EQ(request.appendNotifications(ZELServerStringArray(Strings{"success_topic", "t1"})), 2u);
    EXPECT_EQ(textOf(request), "K\0clientID="s);
    ZELServerStringArray directives(Strings{"kept"});
    EXPECT_EQ(request.getDirectives(directives), 3u);
    EXPECT_EQ(directives.items(), (Strings{"kept", "requesterResultPort", "0", "odd"}));
    ZELServerStringArray notifications;
    EXPECT_EQ(request.getNotifications(notifications), 2u);
    EXPECT_EQ(notifications.items(), (Strings{"success_topic", "t1"}));
}

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

TEST(RequestXmlValue, FailedDocumentsAddNothingAndLeaveTheRequestUsable)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.addXmlValue("bad", ItemXml("x"), "1ROOT"), kXmlFailure);
    EXPECT_EQ(request.addXmlValue("bad", ItemXml("x", 393699), "ROOT"), 393699);
    EXPECT_EQ(request.addXmlValue("bad", ItemXml("bell\x07"), "ROOT"), kSerializeFailed);
    EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("r"), ZELServerString("\x01")),
              kSerializeFailed);
    EXPECT_EQ(textOf(request), "K\0clientID="s);
    // Nothing of the failed documents is left behind in the next ones; local text is converted, and
    // markup and the white space a reader would normalise are escaped.
    EXPECT_EQ(request.addXmlValue("good", ItemXml("a<b>c & \"q\" &amp; \t\n\r"), "ROOT"), 0);
    EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("Caf\xE9"), ZELServerString("")), 0);
    EXPECT_EQ(textOf(request),
              "K\0clientID=\0good="s + kDeclaration +
                  R"(<ROOT><ITEM value="a&lt;b>c &amp; &quot;q&quot; &amp;amp; &#x9;&#xA;&#xD;"/></ROOT>)" +
                  "\0repositoryObject="s + kDeclaration +
                  "<REP_ADD_REPOSITORY><REPOSITORY description=\"\" name=\"Caf\xC3\xA9\"/></REP_ADD_REPOSITORY>");
}

TEST(RequestXmlValue, WithoutTheXmlLibraryEveryDocumentIsRefusedAndPlainValuesStillWork)
{
    ZELServerTCPIPRequest request("REP_ADD_REPOSITORY", nullptr, "c");
    // The XML support is made by the first payload, as the request's first allocation from the
    // library heap; once it failed, later payloads do not try again.
    heap::failNextAllocations(1);
    for (int attempt = 0; attempt < 2; ++attempt) {
        EXPECT_EQ(request.addRepositoryPayload("repositoryObject", ZELServerString("r"), ZELServerString("d")),
                  kXmlFailure);
    }
    heap::failNextAllocations(0);
    request.addValue("plain", "still works");
    EXPECT_EQ(textOf(request), "REP_ADD_REPOSITORY\0clientID=c\0plain=still works"s);
}

}  // namespace
}  // namespace zel
