// Number parsing of values that arrive from the network.
#include <gtest/gtest.h>

#include "util.h"

namespace zelserverd {
namespace {

TEST(ParseDecimal, BoundsHold) {
  struct Case {
    const char* text;
    std::uint64_t max;
    std::optional<std::uint64_t> expected;
  };
  for (const Case& c : {Case{"4", 4, 4}, Case{"9", 4, std::nullopt}, Case{"5", 4, std::nullopt},
                        Case{"65535", 65535, 65535}, Case{"65536", 65535, std::nullopt},
                        Case{"0", 0, 0}, Case{"1", 0, std::nullopt}, Case{"", 9, std::nullopt},
                        Case{"+1", 9, std::nullopt}, Case{"18446744073709551615", UINT64_MAX,
                                                          UINT64_MAX},
                        Case{"18446744073709551616", UINT64_MAX, std::nullopt}})
    EXPECT_EQ(parseDecimal(c.text, c.max), c.expected) << c.text << " max " << c.max;
}

}  // namespace
}  // namespace zelserverd
