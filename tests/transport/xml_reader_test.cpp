// Parsing reply bodies and walking them the way the object readers do.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"
#include "transport/xml_platform.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

std::vector<std::string> namesOf(const std::vector<XmlElement*>& elements)
{
    std::vector<std::string> names;
    for (const XmlElement* element : elements) {
        names.push_back(element->name());
    }
    return names;
}

std::vector<std::string> attributesOf(const std::vector<XmlElement*>& elements, const std::string& name)
{
    std::vector<std::string> values;
    for (const XmlElement* element : elements) {
        std::string value;
        getAttribute(element, name, value);
        values.push_back(value);
    }
    return values;
}

class XmlReaderTest : public ::testing::Test {
protected:
    XmlElement* parsed(const std::string& text)
    {
        StatusPtr failure(reader.parse(text));
        EXPECT_EQ(failure, nullptr) << failure->getMessage();
        return reader.rootOf();
    }

    XmlReader reader;
};

TEST_F(XmlReaderTest, FindsChildIgnoringCaseButAttributesExactly)
{
    XmlElement* root = parsed(R"(<SERVER_SESSION_INIT security_enabled="true">)"
                              R"(<IDENTITY id="ann" is_authenticated="true"/></SERVER_SESSION_INIT>)");
    ASSERT_NE(root, nullptr);
    EXPECT_EQ(root->name(), "SERVER_SESSION_INIT");
    XmlElement* identity = findChild(root, "identity");
    ASSERT_NE(identity, nullptr);
    EXPECT_EQ(identity->name(), "IDENTITY");
    EXPECT_EQ(findChild(root, "Identity"), identity);

    std::string value = "stale";
    EXPECT_FALSE(getAttribute(identity, "ID", value));
    EXPECT_EQ(value, "");
    EXPECT_TRUE(getAttribute(identity, "id", value));
    EXPECT_EQ(value, "ann");
    EXPECT_FALSE(getAttribute(root, "SECURITY_ENABLED", value));
    EXPECT_TRUE(getAttribute(root, "security_enabled", value));
    EXPECT_EQ(value, "true");
}

TEST_F(XmlReaderTest, FindChildTakesTheFirstDirectChildElementOnly)
{
    XmlElement* root = parsed("<R>text<!--IDENTITY--><?IDENTITY x?><OTHER><IDENTITY n='deep'/></OTHER>"
                              "<identity n='first'/><IDENTITY n='second'/></R>");
    XmlElement* found = findChild(root, "IDENTITY");
    std::string n;
    EXPECT_TRUE(getAttribute(found, "n", n));
    EXPECT_EQ(n, "first");
    EXPECT_EQ(findChild(root, "MISSING"), nullptr);
    EXPECT_EQ(findChild(findChild(root, "OTHER"), "OTHER"), nullptr);
}

TEST_F(XmlReaderTest, ChildElementsInDocumentOrderWithCaseInsensitiveFilter)
{
    XmlElement* identity = parsed("<IDENTITY id='x'>"
                                  "<ROLES><ROLE name='a'/><Role/><role name='b'/></ROLES>"
                                  "<OTHER><ROLE name='no'/></OTHER>"
                                  "<roles><ROLE name='c'/><ROLES><ROLE name='nested'/></ROLES></roles>"
                                  "</IDENTITY>");
    EXPECT_EQ(namesOf(childElements(identity)), (std::vector<std::string>{"ROLES", "OTHER", "roles"}));
    std::vector<std::string> roles;
    for (XmlElement* group : childElements(identity, "ROLES")) {
        for (XmlElement* role : childElements(group, "ROLE")) {
            std::string name;
            if (getAttribute(role, "name", name)) {
                roles.push_back(name);
            }
        }
    }
    EXPECT_EQ(roles, (std::vector<std::string>{"a", "b", "c"}));
}

TEST_F(XmlReaderTest, ElementsNamedFindsEveryMatchAnywhereInDocumentOrder)
{
    XmlElement* root = parsed("<REPOSITORY name='root'>"
                              "<LIST><REPOSITORY name='one'><REPOSITORY name='two'/></REPOSITORY></LIST>"
                              "<repository name='case differs'/>"
                              "<REPOSITORY name='three'/>"
                              "</REPOSITORY>");
    const std::vector<XmlElement*> found = elementsNamed(root, "REPOSITORY");
    EXPECT_EQ(attributesOf(found, "name"), (std::vector<std::string>{"root", "one", "two", "three"}));
    EXPECT_EQ(firstElementNamed(root, "REPOSITORY"), root);
    EXPECT_EQ(attributesOf(elementsNamed(findChild(root, "LIST"), "REPOSITORY"), "name"),
              (std::vector<std::string>{"one", "two"}));
    EXPECT_TRUE(elementsNamed(root, "SERVICE").empty());
    EXPECT_EQ(firstElementNamed(root, "SERVICE"), nullptr);
    std::string name;
    EXPECT_TRUE(getAttribute(firstElementNamed(findChild(root, "LIST"), "REPOSITORY"), "name", name));
    EXPECT_EQ(name, "one");
}

TEST_F(XmlReaderTest, TextContentJoinsTextCdataAndEntitiesOfAllDescendants)
{
    XmlElement* root = parsed("<R>a &amp; b<!-- not this --><X>&lt;c&gt;<![CDATA[<raw>&amp;]]></X>&#x41;&#66;</R>");
    EXPECT_EQ(textContent(root), "a & b<c><raw>&amp;AB");
    EXPECT_EQ(textContent(findChild(root, "X")), "<c><raw>&amp;");
}

TEST_F(XmlReaderTest, NestingAsDeepAsAllowedIsWalked)
{
    constexpr int kDepth = static_cast<int>(XmlReader::kMaxDepth);
    std::string text;
    for (int i = 0; i < kDepth; ++i) {
        text += "<N>";
    }
    text += "deep";
    for (int i = 0; i < kDepth; ++i) {
        text += "</N>";
    }
    XmlElement* root = parsed(text);
    EXPECT_EQ(elementsNamed(root, "N").size(), static_cast<std::size_t>(kDepth));
    EXPECT_EQ(textContent(root), "deep");
}

TEST_F(XmlReaderTest, AReaderParsesOnceAndThenIsBusyEvenAfterAFailure)
{
    XmlReader failed;
    StatusPtr failure(failed.parse(""));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(failure->getMessageNumber(), msg::kXmlFailure);
    EXPECT_TRUE(failed.busy());
    EXPECT_EQ(StatusPtr(failed.parse("<R/>")), nullptr);
    EXPECT_EQ(failed.rootOf(), nullptr);

    EXPECT_FALSE(reader.busy());
    XmlElement* root = parsed("<FIRST/>");
    EXPECT_TRUE(reader.busy());
    StatusPtr again(reader.parse("<SECOND/>"));
    EXPECT_EQ(again, nullptr);
    EXPECT_EQ(reader.rootOf(), root);
    EXPECT_EQ(reader.rootOf()->name(), "FIRST");
}

TEST(XmlReaderFailures, MalformedBodiesFailWithTheParsersMessage)
{
    const struct {
        const char* name;
        std::string text;
    } cases[] = {
        {"plain text", "SUCCESS"},
        {"unclosed", "<R><A></R>"},
        {"undeclared entity", "<R>&nbsp;</R>"},
        {"invalid utf-8", "<R>\xC3\x28</R>"},
        {"embedded nul", std::string("<R>\0</R>", 8)},
        {"declaration only", "<?xml version=\"1.0\"?>"},
    };
    for (const auto& c : cases) {
        XmlReader reader;
        StatusPtr failure(reader.parse(c.text));
        ASSERT_NE(failure, nullptr) << c.name;
        EXPECT_EQ(failure->getMessageNumber(), msg::kXmlFailure) << c.name;
        EXPECT_EQ(reader.rootOf(), nullptr) << c.name;
    }
}

TEST(XmlReaderFailures, StatusCarriesTheParsersMessage)
{
    XmlReader reader;
    StatusPtr failure(reader.parse("<R><A></R>"));
    ASSERT_NE(failure, nullptr);
    const std::string message = failure->getMessage();
    // "XML processing failed: " from the catalogue, then the parser's own words.
    EXPECT_NE(message.find("XML processing failed: "), std::string::npos) << message;
    EXPECT_NE(message.find("expected end of tag 'A'"), std::string::npos) << message;
}

// The XML library stays up while any reader or document holds it and goes down with the last one.
TEST(XmlReaderPlatform, LastHolderStopsTheLibrary)
{
    ASSERT_EQ(XmlPlatform::referenceCount(), 0u);
    const unsigned long stops = XmlPlatform::stopCount();
    auto reader = std::make_unique<XmlReader>();
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);  // nothing is held before a parse
    ASSERT_EQ(StatusPtr(reader->parse("<B><C/></B>")), nullptr);
    auto document = std::make_unique<XmlDocument>();
    ASSERT_EQ(StatusPtr(document->startXml()), nullptr);
    EXPECT_EQ(XmlPlatform::referenceCount(), 2u);
    document.reset();
    EXPECT_EQ(findChild(reader->rootOf(), "c")->name(), "C");
    EXPECT_TRUE(XmlReader::readerInitialisedLibrary());
    reader.reset();
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);
    EXPECT_EQ(XmlPlatform::stopCount(), stops + 1);
    EXPECT_FALSE(XmlReader::readerInitialisedLibrary());
}

}  // namespace
}  // namespace zel
