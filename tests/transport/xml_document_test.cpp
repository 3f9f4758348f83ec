// Building and writing XML documents: what the server receives, and what is refused on the way.

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

const std::string kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";

class XmlDocumentTest : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(StatusPtr(doc.startXml()), nullptr); }

    std::string written()
    {
        std::string out;
        EXPECT_EQ(StatusPtr(doc.serialize(out)), nullptr);
        return out;
    }

    XmlDocument doc;
};

// Values the server sends back to us must come back unchanged through our own reader.
TEST_F(XmlDocumentTest, SpecialCharactersInAttributesRoundTrip)
{
    const std::string values[] = {"a<b>c",     "x & y",       R"(say "hi")", "&amp; literal",
                                  "tab\there", "line\nbreak", "cr\rhere",    ""};
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);
    for (std::size_t i = 0; i < std::size(values); ++i) {
        EXPECT_TRUE(root->setAttribute("v" + std::string(1, static_cast<char>('0' + i)), values[i]));
    }
    const std::string text = written();
    XmlReader reader;
    ASSERT_EQ(StatusPtr(reader.parse(text)), nullptr) << text;
    for (std::size_t i = 0; i < std::size(values); ++i) {
        std::string value;
        EXPECT_TRUE(getAttribute(reader.rootOf(), "v" + std::string(1, static_cast<char>('0' + i)), value));
        EXPECT_EQ(value, values[i]) << text;
    }
}

TEST_F(XmlDocumentTest, RefusedNamesTextAndChildrenLeaveTheTreeUnchanged)
{
    EXPECT_EQ(doc.createDocument("", "1ROOT"), nullptr);
    EXPECT_EQ(doc.createDocument("", ""), nullptr);
    XmlElement* root = doc.createDocument("", "R");
    XmlElement* child = doc.createElement("C");
    ASSERT_TRUE(root && child && root->appendChild(child));
    EXPECT_EQ(doc.documentElement(), root);
    EXPECT_EQ(doc.createElement("A B"), nullptr);
    EXPECT_FALSE(root->setAttribute("no spaces", "x"));
    EXPECT_FALSE(root->setAttribute("name", "caf\xE9"));
    EXPECT_FALSE(root->setAttribute("bad\xFF", "x"));
    EXPECT_FALSE(root->setAttribute("nul", std::string("x\0y", 3)));
    EXPECT_FALSE(root->appendText("\xC3"));
    EXPECT_FALSE(root->appendText(std::string("x\0y", 3)));
    EXPECT_FALSE(child->appendChild(root));  // an ancestor

    XmlDocument other;
    ASSERT_EQ(StatusPtr(other.startXml()), nullptr);
    XmlElement* stranger = other.createDocument("", "S");
    ASSERT_NE(stranger, nullptr);
    EXPECT_FALSE(root->appendChild(stranger));  // another document's element
    EXPECT_EQ(written(), kDeclaration + "<R><C/></R>");
}

// A document that was released writes nothing and takes no new element until a new one is made.
TEST_F(XmlDocumentTest, ReleasedDocumentWritesNothing)
{
    ASSERT_NE(doc.createDocument("", "R"), nullptr);
    doc.releaseDocument();
    EXPECT_EQ(doc.documentElement(), nullptr);
    EXPECT_EQ(doc.createElement("C"), nullptr);
    std::string out = "untouched";
    const StatusPtr failure(doc.serialize(out));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(failure->getMessageNumber(), msg::kSerializeFailed);
    EXPECT_EQ(out, "untouched");
    ASSERT_NE(doc.createDocument("", "NEXT"), nullptr);
    EXPECT_EQ(written(), kDeclaration + "<NEXT/>");
}

}  // namespace
}  // namespace zel
