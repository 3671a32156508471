// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "test_tree.h"

namespace {

TEST(HelpDisplay, ListsHandlersThenSubCommandUsageThenNavigationByteForByte) {
  const TestCommand::Layout grandchild{"deep", {{"x", "hidden"}}};
  const struct {
    TestCommand::Layout node;
    std::string body;  // between the header and the navigation lines
  } cases[] = {
      {{"lonely"}, ""},
      {{"vorntool", {}, {{"logdump", {{"tel", "t"}, {"bb", ""}, {"oslog", "o"}, {"core", "c"}}}}},
       "\t         logdump  -  [bb|core|oslog|tel]\n\n"},
      // Byte order; no help text shows "..."; a long name is not cut.
      {{"logdump",
        {{"tel", "collect telephony logs"}, {"bb", ""}, {"Zed", "upper case sorts first"},
         {"averyveryverylongname", "long"}, {"te", "prefix sorts before longer name"}}},
       "\t             Zed  -  upper case sorts first\n\n"
       "\taveryveryverylongname  -  long\n\n"
       "\t              bb  -  ...\n\n"
       "\t              te  -  prefix sorts before longer name\n\n"
       "\t             tel  -  collect telephony logs\n\n"},
      // Grandchildren are indented; a node without handlers has no line.
      {{"vorntool", {}, {{"logdump", {{"tel", ""}}, {grandchild}}, {"group", {}, {grandchild}}}},
       "\t                     <deep>  -  [x]\n"
       "\n"
       "\t         logdump  -  [tel]\n"
       "\t                     <deep>  -  [x]\n"
       "\n"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(helpOf(*TestCommand::create(c.node)),
              "\nOptions for command '\x1b[32m" + c.node.name + "\x1b[39m':\n\n" + c.body +
                  "\t              cd  -  <sub-command>\n\t            help\n\t            back\n\t            quit\n\n");
  }
}

}  // namespace
