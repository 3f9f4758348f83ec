// Reply splitting, as the transport cuts a reply: the status word, then the body verbatim.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/text_split.h"

namespace zel {
namespace {

using namespace std::string_literals;
using Parts = std::vector<std::string>;

TEST(SplitOnce, StatusWordThenTheBodyVerbatim)
{
    const std::pair<std::string, Parts> cases[] = {
        {"SUCCESS\0<R/>"s, {"SUCCESS", "<R/>"}},
        {"\0\0SUCCESS\0a\0b"s, {"SUCCESS", "a\0b"s}},  // leading NULs skipped, the body keeps its NULs
        {"SUCCESS\0\0body\0"s, {"SUCCESS", "\0body\0"s}},
        {"SUCCESS\0"s, {"SUCCESS"}},
        {"\0\0"s, {}},
    };
    for (const auto& [text, expected] : cases) {
        Parts out{"kept"};
        EXPECT_EQ(splitOnce(text, "\0"s, 2, out), expected.size()) << text;
        out.erase(out.begin());
        EXPECT_EQ(out, expected) << text;
    }
}

}  // namespace
}  // namespace zel
