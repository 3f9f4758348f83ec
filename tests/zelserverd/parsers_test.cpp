// The server's parsers and formatters, without a network: configuration, frames and requests, item
// headers, path documents, job request and result texts, and numbers from the wire.
#include <gtest/gtest.h>

#include <string>

#include "auth.h"
#include "config.h"
#include "framing.h"
#include "item_header.h"
#include "jobs.h"
#include "shared_resources.h"
#include "support/server_fixture.h"
#include "util.h"

namespace zelserverd {
namespace {

using namespace std::string_literals;

TEST(Config, ReadsEverySectionKind)
{
    Config config;
    ASSERT_EQ(parseConfig("# comment\n; also a comment\n[server]\nlisten = 0.0.0.0:9000\nmax_file_bytes = 1000\n"
                          "job_timeout_seconds = 60\n[role ops]\nrights = jobs, sharedresources.read\n"
                          "[user ann]\npassword = pw = with equals\nroles = user, ops\n"
                          "[sharedresource DATA]\npath = data/files\n[sharedresource ABS]\npath = /srv/abs/../abs2\n",
                          "/etc/zel", config),
              "");
    EXPECT_EQ(config.listenHost, "0.0.0.0");
    EXPECT_EQ(config.listenPort, 9000);
    EXPECT_EQ(config.maxFileBytes, 1000u);
    EXPECT_EQ(config.jobTimeoutSeconds, 60u);
    ASSERT_NE(config.findUser("ann"), nullptr);
    EXPECT_EQ(config.findUser("ann")->password, "pw = with equals");
    EXPECT_EQ(config.findSharedResource("DATA")->path, "/etc/zel/data/files");
    EXPECT_EQ(config.findSharedResource("ABS")->path, "/srv/abs2");
    EXPECT_EQ(config.findSharedResource("ABS")->displayName, "ABS");
    EXPECT_EQ(rightsOfRoles(config, {"ops"}), kRightJobs | kRightSharedRead);
}

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

// Without a config the server listens on loopback with one job service, no users, and roles
// whose rights nest.
TEST(Config, DefaultsAndBuiltInRoles)
{
    Config config;
    ASSERT_EQ(parseConfig("", "/", config), "");
    EXPECT_EQ(config.listenHost, "127.0.0.1");
    EXPECT_EQ(config.listenPort, 7071);
    EXPECT_EQ(config.maxRequestBytes, kDefaultMaxRequestBytes);
    ASSERT_EQ(config.jobServices.size(), 1u);
    EXPECT_TRUE(config.users.empty());
    auto rights = [&](const char* role) { return rightsOfRoles(config, {role}); };
    EXPECT_EQ(rights("admin"), kRightAll);
    EXPECT_EQ(rights("viewer") & kRightSharedWrite, 0u);
    EXPECT_NE(rights("user") & kRightSharedWrite, 0u);
    EXPECT_EQ(rights("user") & kRightRepositoryWrite, 0u);
    EXPECT_NE(rights("author") & kRightRepositoryWrite, 0u);
    EXPECT_EQ(rights("author") & kRightRepositoryAdmin, 0u);
    EXPECT_EQ(rights("nobody"), 0u);
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

TEST(ItemHeader, ReadsEveryKey)
{
    ItemHeader h;
    ASSERT_EQ(parseItemHeader("#!/bin/sh\r\n"
                              "# plain comment\n"
                              "# @TITLE  Roads  \n"
                              "# @description one\n"
                              "#@description two\n"
                              "# @enabled false\n"
                              "# @category Tools\n"
                              "# @parameter P\n"
                              "# @parameter Q | INT | 3 | q | MULTICHOICE_CONFIG | 1%2%3\n"
                              "# @destination GPKG\n"
                              "# @featuretype f | desc\n"
                              "# @attribute a | zel_char | 20\n"
                              "echo body\n"
                              "# @title not header any more\n",
                              true, h),
              "");
    EXPECT_EQ(h.title, "Roads");
    EXPECT_EQ(h.description, "one\ntwo");
    EXPECT_FALSE(h.enabled);
    EXPECT_EQ(h.category, "Tools");
    ASSERT_EQ(h.parameters.size(), 2u);
    EXPECT_EQ(h.parameters[0].type, "TEXT");
    EXPECT_EQ(h.parameters[1].defaultValue, "3");
    EXPECT_EQ(h.parameters[1].options, "1%2%3");
    ASSERT_EQ(h.datasets.size(), 1u);
    EXPECT_FALSE(h.datasets[0].source);
    ASSERT_EQ(h.datasets[0].featureTypes.size(), 1u);
    EXPECT_EQ(h.datasets[0].featureTypes[0].attributes[0].width, 20u);
    EXPECT_EQ(h.datasets[0].featureTypes[0].attributes[0].decimals, 0u);
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

// The kinds by name ending are used throughout the server suite; these are the edges.
TEST(ItemHeader, KindFollowsTheExactNameEnding)
{
    for (const char* other : {"a.ZLW", "zlw", "a.zlw.txt", ".zlwx"})
        EXPECT_EQ(itemKindOf(other), ItemKind::Other) << other;
}

TEST(PathDocument, ReadsAbspathOrJoinsItsParts)
{
    struct Case {
        const char* doc;
        const char* path;
        const char* error;
    };
    const Case cases[] = {
        {"<R><PATH name=\"n\" dirpath=\"d\" abspath=\"x/y\"/></R>", "x/y", ""},
        {"<R><PATH name=\"n\" dirpath=\"d\" abspath=\"\"/></R>", "d/n", ""},
        {"<R><PATH name=\"n\"/></R>", "n", ""},
        {"<PATH abspath=\"top\"/>", "top", ""},
        {"<R><X><PATH abspath=\"deep\"/></X></R>", "deep", ""},
        {"<R/>", "", "path value holds no PATH element"},
        {"", "", "path value is not a PATH document: malformed XML: No document element found"},
    };
    for (const Case& c : cases) {
        std::string path;
        EXPECT_EQ(pathFromDocument(c.doc, path), c.error) << c.doc;
        EXPECT_EQ(path, c.path) << c.doc;
    }
}

TEST(JobRequestText, ParsesPathParametersAndDirectives)
{
    JobRequestText out;
    ASSERT_EQ(parseJobRequestText("R/w/w.zlw -XML_PARAMETER <?xml version=\"1.0\"?><TRANSFORMATION_REQUEST>"
                                  "<PUBLISHED_PARAMETER name=\"A\">1 &amp; 2</PUBLISHED_PARAMETER>"
                                  "<PUBLISHED_PARAMETER name=\"B\"></PUBLISHED_PARAMETER>"
                                  "<ZEL_DIRECTIVE name=\"D\">x</ZEL_DIRECTIVE></TRANSFORMATION_REQUEST>",
                                  out),
              "");
    EXPECT_EQ(out.repository, "R");
    EXPECT_EQ(out.itemName, "w.zlw");
    using Pairs = std::vector<std::pair<std::string, std::string>>;
    EXPECT_EQ(out.parameters, (Pairs{{"A", "1 & 2"}, {"B", ""}}));
    EXPECT_EQ(out.directives, (Pairs{{"D", "x"}}));
    EXPECT_EQ(parseJobRequestText("R/w/w.zlw", out), "");
    for (const char* bad : {"", "R/x/w.zlw", "/w/w.zlw", "R/w/w.zlw/x", "R//.zlw"})
        EXPECT_NE(parseJobRequestText(bad, out), "") << bad;
    EXPECT_EQ(parseJobRequestText("R/w/w.zlw -XML_PARAMETER <OTHER/>", out),
              "request parameters: expected a TRANSFORMATION_REQUEST document, not 'OTHER'");
}

TEST(ParseDecimal, BoundsHold)
{
    struct Case {
        const char* text;
        std::uint64_t max;
        std::optional<std::uint64_t> expected;
    };
    for (const Case& c :
         {Case{"4", 4, 4}, Case{"9", 4, std::nullopt}, Case{"5", 4, std::nullopt}, Case{"65535", 65535, 65535},
          Case{"65536", 65535, std::nullopt}, Case{"0", 0, 0}, Case{"1", 0, std::nullopt}, Case{"", 9, std::nullopt},
          Case{"+1", 9, std::nullopt}, Case{"18446744073709551615", UINT64_MAX, UINT64_MAX},
          Case{"18446744073709551616", UINT64_MAX, std::nullopt}})
        EXPECT_EQ(parseDecimal(c.text, c.max), c.expected) << c.text << " max " << c.max;
}

}  // namespace
}  // namespace zelserverd
