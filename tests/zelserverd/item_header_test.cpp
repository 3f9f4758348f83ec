// The header format of items: what a workspace declares, and the errors a bad header gets.
#include <gtest/gtest.h>

#include "item_header.h"

namespace zelserverd {
namespace {

TEST(ItemHeader, ReadsEveryKey) {
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

TEST(ItemHeader, StrictErrorsNameTheLine) {
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

TEST(ItemHeader, KindFollowsTheNameEnding) {
  EXPECT_EQ(itemKindOf("a.zlw"), ItemKind::Workspace);
  EXPECT_EQ(itemKindOf("a.ZLW"), ItemKind::Other);
  EXPECT_EQ(itemKindOf("a.zds"), ItemKind::CustomFormat);
  EXPECT_EQ(itemKindOf("a.zlx"), ItemKind::CustomTransformer);
  EXPECT_EQ(itemKindOf("a.zlwt"), ItemKind::Template);
  EXPECT_EQ(itemKindOf("zlw"), ItemKind::Other);
}

}  // namespace
}  // namespace zelserverd
