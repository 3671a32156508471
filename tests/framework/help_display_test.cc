// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "stdio_capture.h"
#include "test_tree.h"

namespace {

const std::string kNavigation =
    "\t              cd  -  <sub-command>\n"
    "\t            help\n"
    "\t            back\n"
    "\t            quit\n"
    "\n";

std::string header(const std::string& name) {
  return "\nOptions for command '\x1b[32m" + name + "\x1b[39m':\n\n";
}

std::string helpOf(const TestCommand::Layout& layout) {
  auto node = TestCommand::create(layout, {}, nullptr);
  StdioCapture io;
  node->displayHelp();
  return io.out();
}

TEST(HelpDisplay, RootListsSubCommandUsageAndNavigation) {
  TestCommand::Layout layout{"vorntool", {}, {{"logdump", {{"tel", "t"}, {"bb", ""}, {"oslog", "o"}, {"core", "c"}}, {}, {}}}, {}};
  EXPECT_EQ(helpOf(layout), header("vorntool") +
                              "\t         logdump  -  [bb|core|oslog|tel]\n"
                              "\n" +
                              kNavigation);
}

TEST(HelpDisplay, HandlersWithAndWithoutHelpTextsInByteOrder) {
  TestCommand::Layout layout{"logdump",
                         {{"tel", "collect telephony logs"},
                          {"bb", ""},
                          {"Zed", "upper case sorts first"},
                          {"averyveryverylongname", "long"},
                          {"te", "prefix sorts before longer name"}},
                         {},
                         {}};
  EXPECT_EQ(helpOf(layout), header("logdump") +
                              "\t             Zed  -  upper case sorts first\n\n"
                              "\taveryveryverylongname  -  long\n\n"
                              "\t              bb  -  ...\n\n"
                              "\t              te  -  prefix sorts before longer name\n\n"
                              "\t             tel  -  collect telephony logs\n\n" +
                              kNavigation);
}

TEST(HelpDisplay, EmptyNodeShowsOnlyHeaderAndNavigation) {
  EXPECT_EQ(helpOf({"lonely", {}, {}, {}}), header("lonely") + kNavigation);
}

TEST(HelpDisplay, NestedUsageIndentsGrandchildrenAndSkipsHandlerlessNodes) {
  TestCommand::Layout grandchild{"deep", {{"x", "hidden"}}, {}, {}};
  TestCommand::Layout withHandlers{"logdump", {{"tel", ""}}, {grandchild}, {}};
  TestCommand::Layout withoutHandlers{"group", {}, {grandchild}, {}};
  TestCommand::Layout root{"vorntool", {}, {withHandlers, withoutHandlers}, {}};
  EXPECT_EQ(helpOf(root), header("vorntool") +
                              "\t                     <deep>  -  [x]\n"
                              "\n"
                              "\t         logdump  -  [tel]\n"
                              "\t                     <deep>  -  [x]\n"
                              "\n" +
                              kNavigation);
}

}  // namespace
