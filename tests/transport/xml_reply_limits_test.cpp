// Hostile reply documents: what the protocol never sends (document types, entities, external
// references) is refused before the parser works on it, nothing is fetched, and the limits hold
// exactly at their values.

#include <chrono>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "support/sockets.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

std::string repeat(const std::string& piece, std::size_t times)
{
    std::string out;
    for (std::size_t i = 0; i < times; ++i) {
        out += piece;
    }
    return out;
}

std::string withAttributes(std::size_t count)
{
    std::string element = "<r";
    for (std::size_t i = 0; i < count; ++i) {
        element += " a" + std::to_string(i) + "='v'";
    }
    return element + "/>";
}

std::string nested(std::size_t depth) { return repeat("<e>", depth) + repeat("</e>", depth); }

TEST(XmlReplyLimits, RefusesWhatNoRealReplyHoldsAndFetchesNothing)
{
    constexpr std::size_t kAttributes = 64;
    constexpr std::size_t kDepth = 64;
    // A connection to it would wait unanswered in its backlog, where the check below sees it.
    const zeltest::Socket tripwire = zeltest::listenOnLoopback(8);
    const std::string url = "http://127.0.0.1:" + std::to_string(zeltest::localPort(tripwire).value_or(1)) + "/x";
    const struct {
        const char* name;
        std::string body;
        bool parses;
    } cases[] = {
        {"external subset", "<?xml version=\"1.0\"?><!DOCTYPE r SYSTEM \"" + url + "\"><r/>", false},
        {"parameter entity", "<!DOCTYPE r [<!ENTITY % p SYSTEM \"" + url + "\"> %p;]><r/>", false},
        {"bare declaration", "<!DOCTYPE r><r/>", false},
        {"schema hint",
         "<r xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" xsi:noNamespaceSchemaLocation=\"" + url + "\"/>",
         true},
        {"attributes over the limit", withAttributes(kAttributes + 1), false},
        {"attributes at the limit", withAttributes(kAttributes), true},
        {"nesting over the limit", nested(kDepth + 1), false},
        {"nesting at the limit", nested(kDepth), true},
        {"siblings do not nest", "<r>" + repeat("<e></e><f/>", kDepth) + "</r>", true},
        // Markup characters inside values, comments, sections and instructions are no markup.
        {"quoted and hidden markup",
         "<r a='" + repeat("=", kAttributes) + "' b=\"'>=\"><!-- <!DOCTYPE x> " + repeat("=", kAttributes) +
             " --><![CDATA[<!DOCTYPE y>" + repeat("<e>", kDepth) + "]]><?pi " + repeat("a=1 ", kAttributes) + "?></r>",
         true},
        {"ordinary references", "<r a=\"&lt;&amp;&gt;&quot;&apos;\">" + repeat("&amp;&#65;&#x42;", 1000) + "</r>",
         true},
        // Read as UTF-8 whatever it says, so that no other encoding can hide markup from the count.
        {"UTF-16 text", std::string("\xFF\xFE<\0r\0/\0>\0", 10), false},
    };
    for (const auto& c : cases) {
        XmlReader reader;
        const std::unique_ptr<IZELServerStatus> failure(reader.parse(c.body));
        EXPECT_EQ(failure == nullptr, c.parses) << c.name << ": " << (failure ? failure->getMessage() : "parsed");
        if (failure != nullptr) {
            EXPECT_EQ(failure->getMessageNumber(), msg::kXmlFailure) << c.name;
            EXPECT_EQ(reader.rootOf(), nullptr) << c.name;
        }
        EXPECT_FALSE(zeltest::waitReadable(tripwire, std::chrono::milliseconds(0))) << c.name;
    }
}

}  // namespace
}  // namespace zel
