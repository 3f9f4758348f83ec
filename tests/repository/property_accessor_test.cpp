// The property accessor: its map operations, the copies it hands out, and the document the update
// commands send.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "transport/ZELServerTCPIPRequest.h"
#include "transport/xml_reader.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

using namespace std::string_literals;

ZELServerString S(const char* text) { return ZELServerString(text); }

std::string valueOf(const IZELServerPropertyAccessor& accessor, const char* category, const char* name)
{
    ZELServerString value("stale");
    accessor.getPropertyValue(S(category), S(name), value);
    return value.str();
}

// Reads properties from a document, as a service or workspace reads its own.
void readInto(ZELServerPropertyAccessor& accessor, const std::string& document)
{
    XmlReader reader;
    IZELServerStatus* failure = reader.parse(document);
    ASSERT_EQ(failure, nullptr);
    accessor.readPropertiesOf(*reader.rootOf());
}

TEST(PropertyAccessor, SetAddsOrChangesAndKeepsTheAttributesAndLookupsAreExact)
{
    ZELServerPropertyAccessor accessor;
    readInto(accessor,
             R"(<S><PROPERTY category="c" name="n" value="v1"><ATTRIBUTE name="a" value="1"/></PROPERTY></S>)");
    accessor.setProperty(S("c"), S("n"), S("v2"));
    accessor.setProperty(S("new"), S("m"), S("x"));
    EXPECT_EQ(valueOf(accessor, "c", "n"), "v2");
    EXPECT_EQ(valueOf(accessor, "new", "m"), "x");
    ZELServerString attribute;
    ASSERT_TRUE(accessor.getProperty(S("c"), S("n"))->getAttribute(S("a"), attribute));
    EXPECT_EQ(attribute.str(), "1");
    // A missing category or name empties the value.
    ZELServerString value("stale");
    EXPECT_FALSE(accessor.getPropertyValue(S("c"), S("other"), value));
    EXPECT_EQ(value.str(), "");
    value.assign("stale");
    EXPECT_FALSE(accessor.getPropertyValue(S("C"), S("n"), value));
    EXPECT_EQ(value.str(), "");
    EXPECT_EQ(accessor.getProperty(S("c"), S("N")), nullptr);
    // Missing attributes of a read property are empty texts.
    readInto(accessor, R"(<S><PROPERTY name="n"/></S>)");
    value.assign("stale");
    EXPECT_TRUE(accessor.getPropertyValue(S(""), S("n"), value));
    EXPECT_EQ(value.str(), "");
}

TEST(PropertyAccessor, NamesAndPairsComeInByteOrder)
{
    ZELServerPropertyAccessor accessor;
    accessor.setProperty(S("b"), S("z"), S("3"));
    accessor.setProperty(S("b"), S("Y"), S("2"));
    accessor.setProperty(S("a"), S("x"), S("1"));
    ZELServerStringArray categories;
    accessor.getCategoryNames(categories);
    EXPECT_EQ(categories.items(), (std::vector<std::string>{"a", "b"}));
    ZELServerStringArray names({"kept"});
    accessor.getPropertyNames(S("b"), names);
    EXPECT_EQ(names.items(), (std::vector<std::string>{"kept", "Y", "z"}));
    ZELServerStringArray pairs;
    EXPECT_TRUE(accessor.getPropertyPairs(S("b"), pairs));
    EXPECT_EQ(pairs.items(), (std::vector<std::string>{"Y", "2", "z", "3"}));
    ZELServerStringArray none;
    EXPECT_FALSE(accessor.getPropertyPairs(S("missing"), none));
    EXPECT_EQ(none.entries(), 0u);
}

TEST(PropertyAccessor, GetPropertiesAppendsIndependentCopiesAndReadingMergesRepeats)
{
    ZELServerPropertyAccessor accessor;
    readInto(accessor, R"(<S><PROPERTY category="c" name="n" value="v"><ATTRIBUTE name="b" value="2"/>)"
                       R"(<ATTRIBUTE name="a" value="1"/></PROPERTY></S>)");
    ZELServerVector<IZELServerProperty, ZELServerProperty> copies;
    accessor.getProperties(S("c"), copies);
    accessor.setProperty(S("c"), S("n"), S("changed"));
    ASSERT_EQ(copies.entries(), 1u);
    ZELServerString value;
    copies.element(0)->getValue(value);
    EXPECT_EQ(value.str(), "v");
    ZELServerString category;
    copies.element(0)->getCategory(category);
    EXPECT_EQ(category.str(), "c");
    ZELServerStringArray attributes;
    copies.element(0)->getAttributes(attributes);
    EXPECT_EQ(attributes.items(), (std::vector<std::string>{"a", "1", "b", "2"}));
    ZELServerString missing("untouched");
    EXPECT_FALSE(copies.element(0)->getAttribute(S("c"), missing));
    EXPECT_EQ(missing.str(), "untouched");

    // Reading merges the attributes of a repeated property.
    readInto(accessor,
             R"(<S><PROPERTY category="c" name="n" value="first"><ATTRIBUTE name="a" value="1"/>)"
             R"(<ATTRIBUTE name="b" value="old"/></PROPERTY>)"
             R"(<PROPERTY category="c" name="n" value="second"><ATTRIBUTE name="b" value="new"/></PROPERTY></S>)");
    const IZELServerProperty* property = accessor.getProperty(S("c"), S("n"));
    ASSERT_NE(property, nullptr);
    ZELServerStringArray merged;
    property->getAttributes(merged);
    EXPECT_EQ(merged.items(), (std::vector<std::string>{"a", "1", "b", "new"}));
    EXPECT_EQ(valueOf(accessor, "c", "n"), "second");
}

// ---- The document the update commands send ----------------------------------------------------------

std::string writtenDocument(const IZELServerPropertyAccessor& accessor, const std::string& root)
{
    ZELServerTCPIPRequest request("K", nullptr, "");
    EXPECT_EQ(request.addXmlValue("propertyAccessorObject", PropertyAccessorXml(accessor), root), 0);
    std::string text;
    request.getText(text);
    const std::string prefix = "K\0clientID=\0propertyAccessorObject="s;
    EXPECT_EQ(text.compare(0, prefix.size(), prefix), 0) << text;
    return text.substr(prefix.size());
}

TEST(PropertyAccessorXml, WritesEveryPropertyInMapOrderWithItsAttributes)
{
    ZELServerPropertyAccessor accessor;
    readInto(accessor,
             R"(<S><PROPERTY category="run" name="priority" value="high"><ATTRIBUTE name="unit" value="level"/>)"
             R"(<ATTRIBUTE name="by" value="ann"/></PROPERTY><PROPERTY category="a" name="b" value="x &amp; y"/></S>)");
    EXPECT_EQ(writtenDocument(accessor, "REP_UPDATE_SERVICEPROPERTYACCESSOR"),
              R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><REP_UPDATE_SERVICEPROPERTYACCESSOR>)"
              R"(<PROPERTY category="a" name="b" value="x &amp; y"/>)"
              R"(<PROPERTY category="run" name="priority" value="high"><ATTRIBUTE name="by" value="ann"/>)"
              R"(<ATTRIBUTE name="unit" value="level"/></PROPERTY></REP_UPDATE_SERVICEPROPERTYACCESSOR>)");
}

TEST(PropertyAccessorXml, AnEmptyAccessorIsAnEmptyRootAndLocalTextIsWrittenAsUtf8)
{
    ZELServerPropertyAccessor accessor;
    EXPECT_EQ(writtenDocument(accessor, "REP_UPDATE_DATASETPROPERTYACCESSOR"),
              R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><REP_UPDATE_DATASETPROPERTYACCESSOR/>)");
    accessor.setProperty(S("c"), S("city"), S("K\xf6ln"));
    EXPECT_EQ(writtenDocument(accessor, "R"), "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?><R>"
                                              "<PROPERTY category=\"c\" name=\"city\" value=\"K\xc3\xb6ln\"/></R>");
}

}  // namespace
}  // namespace zel
