// Numbers read from attributes: a value fits its field exactly up to the field's limits, and one past
// them reads as 0 instead of being cut down.

#include "transport/attribute_binding.h"

#include <cstdint>
#include <string>

#include <gtest/gtest.h>

namespace zel {
namespace {

TEST(AttributeBinding, SignedNumbersFitUpToTheLimitsOfTheirField)
{
    const struct {
        std::string text;
        std::int32_t narrow;
        std::int64_t wide;
    } cases[] = {
        {"2147483647", 2147483647, 2147483647},          {"2147483648", 0, 2147483648},
        {"-2147483648", -2147483647 - 1, -2147483648LL}, {"-2147483649", 0, -2147483649LL},
        {"0x7FFFFFFF", 2147483647, 2147483647},          {"12abc", 0, 0},
    };
    for (const auto& c : cases) {
        std::int32_t narrow = 7;
        std::int64_t wide = 7;
        storeAttributeText(c.text, narrow);
        storeAttributeText(c.text, wide);
        EXPECT_EQ(narrow, c.narrow) << c.text;
        EXPECT_EQ(wide, c.wide) << c.text;
    }
}

}  // namespace
}  // namespace zel
