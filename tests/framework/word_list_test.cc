// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "framework/command_shell.h"

namespace {

using Words = std::list<std::string>;
using Groups = std::vector<Words>;

Words argsToList(std::vector<std::string> args) {
  std::vector<char*> argv;
  for (auto& a : args) argv.push_back(a.data());
  return CommandShell::convertCmdArgsToList(static_cast<int>(argv.size()), argv.data());
}

TEST(WordList, ArgumentsAreStoredLastFirst) {
  EXPECT_EQ(argsToList({}), Words{});
  EXPECT_EQ(argsToList({"vorntool"}), Words{"vorntool"});
  EXPECT_EQ(argsToList({"vorntool", "logdump", "tel"}), (Words{"tel", "logdump", "vorntool"}));
  EXPECT_EQ(argsToList({"vorntool", "a b", ""}), (Words{"", "a b", "vorntool"}));
}

TEST(WordList, TypedLinesSplitAtWhiteSpace) {
  EXPECT_EQ(CommandShell::convertLineToList(" \t \r\f\v "), Words{});
  EXPECT_EQ(CommandShell::convertLineToList("  a\t\tb   c \r"), (Words{"c", "b", "a"}));
}

TEST(WordList, SplitDropsSeparatorsAndEmptyGroups) {
  struct Case {
    Words typed;  // natural order
    Groups expected;  // groups in natural order, words last-first
  };
  const Case cases[] = {
      {{"a", "b", "--", "c"}, {{"b", "a"}, {"c"}}},
      {{"--", "a"}, {{"a"}}},
      {{"a", "--"}, {{"a"}}},
      {{"a", "--", "--", "b"}, {{"a"}, {"b"}}},
      {{"--"}, {}},
      {{"a--b", "---", "--x"}, {{"--x", "---", "a--b"}}},
      {{}, {}},
  };
  for (const auto& c : cases) {
    Words list(c.typed.rbegin(), c.typed.rend());
    EXPECT_EQ(CommandShell::splitCmdList(list), c.expected);
  }
}

}  // namespace
