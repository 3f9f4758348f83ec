// Parsing reply bodies and walking them the way the object readers do.

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;
using Strings = std::vector<std::string>;

// The value of `attribute` (or the name, for an empty one) of each element.
Strings describe(const std::vector<XmlElement*>& elements, const std::string& attribute = "")
{
    Strings values;
    for (const XmlElement* element : elements) {
        std::string value;
        attribute.empty() ? void(value = element->name()) : void(getAttribute(element, attribute, value));
        values.push_back(value);
    }
    return values;
}

class XmlReaderTest : public ::testing::Test {
protected:
    XmlElement* parsed(const std::string& text)
    {
        EXPECT_EQ(StatusPtr(reader.parse(text)), nullptr);
        return reader.rootOf();
    }

    XmlReader reader;
};

TEST_F(XmlReaderTest, ChildrenAreFoundIgnoringCaseButAttributesExactly)
{
    XmlElement* root =
        parsed(R"(<R a="&lt;1&#x9;&#10;&quot;">text<!--IDENTITY--><?IDENTITY x?><OTHER><IDENTITY n='deep'/></OTHER>)"
               R"(<identity n='first'/><IDENTITY n='second'/></R>)");
    ASSERT_NE(root, nullptr);
    std::string value = "stale";
    EXPECT_FALSE(getAttribute(root, "A", value));
    EXPECT_EQ(value, "");
    EXPECT_TRUE(getAttribute(root, "a", value));
    EXPECT_EQ(value, "<1\t\n\"");
    EXPECT_EQ(describe({findChild(root, "Identity")}, "n"), Strings{"first"});
    EXPECT_EQ(findChild(root, "MISSING"), nullptr);
    EXPECT_EQ(findChild(findChild(root, "OTHER"), "OTHER"), nullptr);
    EXPECT_EQ(describe(childElements(root)), (Strings{"OTHER", "identity", "IDENTITY"}));
    EXPECT_EQ(describe(childElements(root, "IDENTITY"), "n"), (Strings{"first", "second"}));
}

TEST_F(XmlReaderTest, ElementsNamedFindsEveryMatchAnywhereInDocumentOrder)
{
    XmlElement* root = parsed("<REPOSITORY name='root'>"
                              "<LIST><REPOSITORY name='one'><REPOSITORY name='two'/></REPOSITORY></LIST>"
                              "<repository name='case differs'/><REPOSITORY name='three'/></REPOSITORY>");
    EXPECT_EQ(describe(elementsNamed(root, "REPOSITORY"), "name"), (Strings{"root", "one", "two", "three"}));
    EXPECT_EQ(describe(elementsNamed(findChild(root, "LIST"), "REPOSITORY"), "name"), (Strings{"one", "two"}));
    EXPECT_EQ(firstElementNamed(root, "REPOSITORY"), root);
    EXPECT_EQ(describe({firstElementNamed(findChild(root, "LIST"), "REPOSITORY")}, "name"), Strings{"one"});
    EXPECT_TRUE(elementsNamed(root, "SERVICE").empty());
    EXPECT_EQ(firstElementNamed(root, "SERVICE"), nullptr);
}

TEST(XmlReaderFailures, MalformedBodiesFailAndLeaveNoDocument)
{
    const std::string cases[] = {
        "SUCCESS", "<R><A></R>", "<R>&nbsp;</R>", "<R>\xC3\x28</R>", {"<R>\0</R>", 8}, "<?xml version=\"1.0\"?>", ""};
    for (const std::string& text : cases) {
        XmlReader reader;
        StatusPtr failure(reader.parse(text));
        ASSERT_NE(failure, nullptr) << text;
        EXPECT_EQ(failure->getMessageNumber(), msg::kXmlFailure) << text;
        EXPECT_EQ(reader.rootOf(), nullptr) << text;
    }
    // The catalogue's text, then the parser's own words.
    XmlReader reader;
    const StatusPtr failure(reader.parse("<R><A></R>"));
    ASSERT_NE(failure, nullptr);
    EXPECT_NE(std::string(failure->getMessage()).find("XML processing failed: "), std::string::npos);
    EXPECT_NE(std::string(failure->getMessage()).find("expected end of tag 'A'"), std::string::npos);
}

}  // namespace
}  // namespace zel
