// Writing XML documents: attribute values the server sends back to us must come back unchanged
// through our own reader.

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "transport/xml_document.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

TEST(XmlDocument, SpecialCharactersInAttributesRoundTrip)
{
    const std::string values[] = {"a<b>c",     "x & y",       R"(say "hi")", "&amp; literal",
                                  "tab\there", "line\nbreak", "cr\rhere",    ""};
    XmlDocument doc;
    ASSERT_EQ(StatusPtr(doc.startXml()), nullptr);
    XmlElement* root = doc.createDocument("", "R");
    ASSERT_NE(root, nullptr);
    for (std::size_t i = 0; i < std::size(values); ++i) {
        EXPECT_TRUE(root->setAttribute("v" + std::to_string(i), values[i]));
    }
    std::string text;
    ASSERT_EQ(StatusPtr(doc.serialize(text)), nullptr);
    XmlReader reader;
    ASSERT_EQ(StatusPtr(reader.parse(text)), nullptr) << text;
    for (std::size_t i = 0; i < std::size(values); ++i) {
        std::string value;
        EXPECT_TRUE(getAttribute(reader.rootOf(), "v" + std::to_string(i), value));
        EXPECT_EQ(value, values[i]) << text;
    }
}

}  // namespace
}  // namespace zel
