// Building and writing XML documents: the exact bytes the server receives.

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

constexpr const char* kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";

class XmlDocumentTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        StatusPtr failure(doc.startXml());
        ASSERT_EQ(failure, nullptr) << failure->getMessage();
    }

    std::string written()
    {
        std::string out;
        StatusPtr failure(doc.serialize(out));
        EXPECT_EQ(failure, nullptr) << failure->getMessage();
        return out;
    }

    XmlDocument doc;
};

TEST_F(XmlDocumentTest, IdentityDocumentHasExactBytes)
{
    XmlElement* root = doc.createDocument("", "REP_GET_REPOSITORIES");
    ASSERT_NE(root, nullptr);
    XmlElement* identity = doc.createElement("IDENTITY");
    XmlElement* roles = doc.createElement("ROLES");
    XmlElement* role = doc.createElement("ROLE");
    ASSERT_TRUE(identity && roles && role);
    EXPECT_TRUE(identity->setAttribute("id", "ann"));
    EXPECT_TRUE(identity->setAttribute("is_authenticated", "true"));
    EXPECT_TRUE(role->setAttribute("name", "admin"));
    EXPECT_TRUE(roles->appendChild(role));
    EXPECT_TRUE(identity->appendChild(roles));
    EXPECT_TRUE(root->appendChild(identity));
    EXPECT_EQ(written(), std::string(kDeclaration) +
                             R"(<REP_GET_REPOSITORIES><IDENTITY id="ann" is_authenticated="true">)"
                             R"(<ROLES><ROLE name="admin"/></ROLES></IDENTITY></REP_GET_REPOSITORIES>)");
}

// "v0", "v1", ... Built by appending: g++ 12 at -O2 warns falsely (-Wrestrict) about "v" + to_string(i).
std::string attributeName(std::size_t i)
{
    std::string name = "v";
    name += std::to_string(i);
    return name;
}

// Values the server sends back to us must come back unchanged through our own reader.
TEST_F(XmlDocumentTest, SpecialCharactersInAttributesRoundTrip)
{
    const std::string values[] = {
        R"(a<b>c)", R"(x & y)", R"(say "hi")", R"(&amp; literal)", "tab\there", "line\nbreak", "cr\rhere", "",
    };
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);
    for (std::size_t i = 0; i < std::size(values); ++i) {
        EXPECT_TRUE(root->setAttribute(attributeName(i), values[i]));
    }
    const std::string text = written();

    XmlReader reader;
    StatusPtr failure(reader.parse(text));
    ASSERT_EQ(failure, nullptr) << failure->getMessage() << "\n" << text;
    for (std::size_t i = 0; i < std::size(values); ++i) {
        std::string value;
        EXPECT_TRUE(getAttribute(reader.rootOf(), attributeName(i), value));
        EXPECT_EQ(value, values[i]) << "attribute v" << i << " in " << text;
    }
}

TEST_F(XmlDocumentTest, InvalidUtf8AndNulAreRefusedAndLeaveTheElementUnchanged)
{
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);
    EXPECT_FALSE(root->setAttribute("name", "caf\xE9"));
    EXPECT_FALSE(root->setAttribute("bad\xFF", "x"));
    EXPECT_FALSE(root->appendText("\xC3"));
    EXPECT_FALSE(root->setAttribute("nul", std::string("x\0y", 3)));
    EXPECT_FALSE(root->appendText(std::string("x\0y", 3)));
    EXPECT_EQ(written(), std::string(kDeclaration) + "<R/>");
}

TEST_F(XmlDocumentTest, RefusedChildrenLeaveTheTreeUnchanged)
{
    XmlElement* root = doc.createDocument("", "R");
    XmlElement* child = doc.createElement("C");
    ASSERT_TRUE(root && child);
    ASSERT_TRUE(root->appendChild(child));
    EXPECT_FALSE(child->appendChild(root));  // an ancestor

    XmlDocument other;
    StatusPtr failure(other.startXml());
    ASSERT_EQ(failure, nullptr);
    XmlElement* stranger = other.createDocument("", "S");
    ASSERT_NE(stranger, nullptr);
    EXPECT_FALSE(root->appendChild(stranger));  // another document's element
    EXPECT_EQ(written(), std::string(kDeclaration) + "<R><C/></R>");
}

TEST_F(XmlDocumentTest, IllegalNamesGiveNoElement)
{
    EXPECT_EQ(doc.createDocument("", "1ROOT"), nullptr);
    EXPECT_EQ(doc.createDocument("", ""), nullptr);
    ASSERT_NE(doc.createDocument("", "R"), nullptr);
    EXPECT_EQ(doc.createElement("A B"), nullptr);
    EXPECT_EQ(doc.createElement("<A>"), nullptr);
    EXPECT_FALSE(doc.documentElement()->setAttribute("no spaces", "x"));
    EXPECT_EQ(written(), std::string(kDeclaration) + "<R/>");
}

TEST_F(XmlDocumentTest, DocumentElementIsCachedAndDiesWithTheDocument)
{
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);
    EXPECT_EQ(doc.documentElement(), root);
    EXPECT_EQ(root->name(), "R");
    doc.releaseDocument();
    EXPECT_EQ(doc.documentElement(), nullptr);
    EXPECT_EQ(doc.createElement("C"), nullptr);

    std::string out = "untouched";
    StatusPtr failure(doc.serialize(out));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(failure->getMessageNumber(), msg::kSerializeFailed);
    EXPECT_EQ(out, "untouched");

    ASSERT_NE(doc.createDocument("", "NEXT"), nullptr);
    EXPECT_EQ(doc.documentElement()->name(), "NEXT");
    EXPECT_EQ(written(), std::string(kDeclaration) + "<NEXT/>");
}

TEST_F(XmlDocumentTest, IllegalCharacterFailsSerialisationWithLibraryMessage)
{
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);
    ASSERT_TRUE(root->setAttribute("a", "bell\x07"));
    std::string out = "untouched";
    StatusPtr failure(doc.serialize(out));
    ASSERT_NE(failure, nullptr);
    EXPECT_EQ(failure->getMessageNumber(), msg::kSerializeFailed);
    EXPECT_NE(std::string(failure->getMessage()).find("illegal XML character"), std::string::npos)
        << failure->getMessage();
    EXPECT_EQ(out, "untouched");
}

TEST(XmlNodeList, WrapsEachNodeOnceAndClearsLastFirst)
{
    XmlDocument doc;
    StatusPtr failure(doc.startXml());
    ASSERT_EQ(failure, nullptr);
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);

    ZELServerDOMNodeList list;
    EXPECT_EQ(list.wrap(nullptr), nullptr);
    XmlElement* wrapped = list.wrap(root->node());
    ASSERT_NE(wrapped, nullptr);
    EXPECT_NE(wrapped, root);  // a different owner, a different handle
    EXPECT_EQ(&wrapped->owner(), &list);
    EXPECT_EQ(list.wrap(root->node()), wrapped);
    EXPECT_EQ(list.size(), 1u);
    list.clear();
    EXPECT_EQ(list.size(), 0u);
    EXPECT_NE(list.wrap(root->node()), nullptr);
    EXPECT_EQ(list.size(), 1u);
}

}  // namespace
}  // namespace zel
