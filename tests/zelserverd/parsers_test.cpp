// The server's parsers without a network: where they refuse a configuration, a file header or an
// item header, and why.
#include <gtest/gtest.h>

#include <string>

#include "config.h"
#include "framing.h"
#include "item_header.h"

namespace zelserverd {
namespace {

using namespace std::string_literals;

TEST(Config, ReportsTheFaultyLine)
{
    struct Case {
        const char* text;
        const char* expected;
    };
    const Case cases[] = {
        {"[server]\nlisten = nowhere", "line 2: bad listen address"},
        {"[server]\nworkers = 0", "line 2: workers must be 1 to 64"},
        {"[server]\nmax_request_bytes = 10", "line 2: max_request_bytes must be at least 1024"},
        {"[server]\ncolour = red", "line 2: unknown server key 'colour'"},
        {"key = value", "line 1: 'key' outside of any section"},
        {"[user]", "line 1: section [user] needs a name"},
        {"[planet earth]", "line 1: unknown section kind 'planet'"},
        {"[server", "line 1: section header must end with ']'"},
        {"[user a]\npassword = x\n[user a]", "line 3: user 'a' defined twice"},
        {"[role r]\nrights = jobs, flying", "line 2: unknown right 'flying'"},
        {"[user a]\nroles = admin", "user 'a' has no password"},
        {"[user a]\npassword = x", "user 'a' has no roles"},
        {"[user a]\npassword = x\nroles = emperor", "user 'a' has unknown role 'emperor'"},
        {"[sharedresource S]\ndisplay_name = s", "shared resource 'S' has no path"},
        {"[server]\nno equals sign", "line 2: expected 'key = value'"},
    };
    for (const Case& c : cases) {
        Config config;
        EXPECT_EQ(parseConfig(c.text, "/", config), c.expected) << c.text;
    }
}

TEST(Framing, AcknowledgementsAndFileHeadersAreReadStrictly)
{
    EXPECT_TRUE(isAck("SUCCESS\0ready_to_transfer"s));
    EXPECT_FALSE(isAck("SUCCESS\0ready_to_transfer\0"s));
    EXPECT_FALSE(isAck("ERROR\0ready_to_transfer"s));
    EXPECT_EQ(fileHeaderPayload(0, 0), "fileLength=0\0fileCRC=0"s);
    auto header = parseFileHeader("fileLength=4294967295\0fileCRC=3421780262"s);
    ASSERT_TRUE(header);
    EXPECT_EQ(header->length, 4294967295u);
    EXPECT_EQ(header->crc, 3421780262u);

    const std::string refused[] = {
        "fileLength=10"s,                     // no CRC part
        "fileLength=4294967296\0fileCRC=1"s,  // beyond 32 bits
        "fileLength=\0fileCRC=1"s,            // empty number
        "fileLength=-1\0fileCRC=1"s,          // sign
        "fileLength= 1\0fileCRC=1"s,          // blank
        "fileLength=0x10\0fileCRC=1"s,        // not decimal
        "fileSize=1\0fileCRC=1"s,             // wrong name
        "fileLength=1\0fileCRC=4294967296"s,  // CRC beyond 32 bits
        "SUCCESS\0ready_to_transfer"s,
    };
    for (const std::string& payload : refused)
        EXPECT_FALSE(parseFileHeader(payload)) << "accepted: " << payload;
}

TEST(ItemHeader, StrictErrorsNameTheLine)
{
    struct Case {
        const char* text;
        const char* error;
    };
    for (const Case& c : {
             Case{"# @colour red\n", "line 1: unknown key '@colour'"},
             Case{"#!/bin/sh\n# @enabled yes\n", "line 2: @enabled takes 'true' or 'false'"},
             Case{"# @parameter 1x\n", "line 1: parameter name '1x' is not a shell identifier"},
             Case{"# @parameter PATH\n", "line 1: parameter name 'PATH' is reserved for the server"},
             Case{"# @parameter ZEL_X\n", "line 1: parameter name 'ZEL_X' is reserved for the server"},
             Case{"# @parameter A\n# @parameter A\n", "line 2: parameter 'A' declared twice"},
             Case{"# @parameter A|b|c|d|e|f|g\n", "line 1: @parameter takes at most 6 fields"},
             Case{"# @featuretype f\n", "line 1: @featuretype before any @source or @destination"},
             Case{"# @source CSV\n# @attribute a\n", "line 2: @attribute before any @featuretype"},
             Case{"# @source CSV\n# @featuretype f\n# @attribute a | t | wide\n",
                  "line 3: attribute width and decimals must be decimal numbers"},
             Case{"# @source\n", "line 1: a dataset needs a format"},
         }) {
        ItemHeader h;
        EXPECT_EQ(parseItemHeader(c.text, true, h), c.error) << c.text;
        // Other items are read leniently: the same text is no error there.
        EXPECT_EQ(parseItemHeader(c.text, false, h), "") << c.text;
    }
    std::string longLine = "# @description " + std::string(kMaxHeaderBytes, 'x');
    ItemHeader h;
    EXPECT_EQ(parseItemHeader(std::string_view(longLine).substr(0, kMaxHeaderBytes), true, h),
              "header longer than 65536 bytes");
}

}  // namespace
}  // namespace zelserverd
