// Reply splitting.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/text_split.h"

namespace zel {
namespace {

using namespace std::string_literals;
using Parts = std::vector<std::string>;

struct SplitCase {
    const char* name;
    std::string text;
    std::string delimiters;
    std::size_t maxParts;
    Parts expected;
};

TEST(SplitOnce, Table)
{
    const std::string nul("\0", 1);
    const SplitCase cases[] = {
        // How the transport cuts a reply: status word, then the body verbatim.
        {"status and body", "SUCCESS\0<R/>"s, nul, 2, {"SUCCESS", "<R/>"}},
        {"leading NULs skipped, body keeps NULs", "\0\0SUCCESS\0a\0b"s, nul, 2, {"SUCCESS", "a\0b"s}},
        {"body that starts with a NUL keeps it", "SUCCESS\0\0body"s, nul, 2, {"SUCCESS", "\0body"s}},
        {"no body after the NUL", "SUCCESS\0"s, nul, 2, {"SUCCESS"}},
        {"only delimiters", "\0\0"s, nul, 2, {}},
        // The general splitter.
        {"unlimited", " a  bb c "s, " ", 0, {"a", "bb", "c"}},
        {"third part takes the rest", "a b c d"s, " ", 3, {"a", "b", "c d"}},
        {"rest starts one set-length past the previous part", "a  b c"s, " ", 2, {"a", " b c"}},
        {"set length counts, not the delimiter seen", "a,b c"s, ", ", 2, {"a", " c"}},
        {"rest beyond the text is empty", "a,b"s, ",;", 2, {"a", ""}},
        {"first part at the limit skips one set-length", "SUCCESS\0body"s, nul, 1, {"UCCESS\0body"s}},
    };
    for (const SplitCase& c : cases) {
        Parts out{"kept"};
        EXPECT_EQ(splitOnce(c.text, c.delimiters, c.maxParts, out), c.expected.size()) << c.name;
        out.erase(out.begin());
        EXPECT_EQ(out, c.expected) << c.name;
    }
}

}  // namespace
}  // namespace zel
