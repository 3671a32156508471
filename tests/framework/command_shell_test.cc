// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <cctype>
#include <optional>
#include <string_view>

#include "stdio_capture.h"
#include "test_tree.h"

namespace {

const TestCommand::Layout kTree{
    "vorntool",
    {},
    {{"logdump",
      {{"tel", "collect"}, {"fail", ""}, {"locked", ""}},
      {{"deep", {{"x", ""}}, {}, {}}},
      {"locked"}}},
    {}};

/// The help of the node at `path` below the root, as displayHelp prints it.
std::string helpAt(std::vector<std::string> path) {
  std::shared_ptr<CommandBase> node = TestCommand::create(kTree, {}, nullptr);
  for (auto& step : path) node = node->getSubCommandObj(step);
  StdioCapture io;
  node->displayHelp();
  return io.out();
}

std::string invalid(const std::string& word) {
  return "\nInvalid command option '\x1b[31m" + word + "\x1b[39m'";
}

const std::string kRoot = "(/vorntool)>> ";
const std::string kLogdump = "(/vorntool/logdump)>> ";

struct Session {
  const char* what;
  std::vector<std::string> args;  // after the program name
  std::string input;
  std::string output;
  bool result;
  std::vector<std::string> calls;
};
void PrintTo(const Session& s, std::ostream* os) { *os << s.what; }

/// "cd and back" -> "CdAndBack": the case's test name.
std::string caseName(const testing::TestParamInfo<Session>& info) {
  std::string name;
  bool wordStart = true;
  for (char c : std::string_view(info.param.what)) {
    if (!std::isalnum(static_cast<unsigned char>(c))) {
      wordStart = true;
    } else {
      name.push_back(wordStart ? static_cast<char>(std::toupper(static_cast<unsigned char>(c))) : c);
      wordStart = false;
    }
  }
  return name;
}

class ShellSession : public testing::TestWithParam<Session> {};

TEST_P(ShellSession, PrintsAndReturnsExactly) {
  const Session& s = GetParam();
  std::vector<std::string> calls;
  TestShell shell(kTree, &calls);
  std::list<std::string> words{"vorntool"};
  for (auto& a : s.args) words.push_front(a);
  StdioCapture io(s.input);
  bool result = shell.run(words);
  EXPECT_EQ(io.out(), s.output) << s.what;
  EXPECT_EQ(io.err(), "") << s.what;
  EXPECT_EQ(result, s.result) << s.what;
  EXPECT_EQ(calls, s.calls) << s.what;
}

const auto rootHelp = helpAt({});
const auto logdumpHelp = helpAt({"logdump"});

INSTANTIATE_TEST_SUITE_P(
    OneShot, ShellSession,
    testing::Values(
        Session{"separator only", {"--"}, "", "", true, {}},
        Session{"help", {"help"}, "", rootHelp, true, {}},
        Session{"sub-command as last word", {"logdump"}, "", logdumpHelp, false, {}},
        Session{"help of sub-command", {"logdump", "help"}, "", logdumpHelp, true, {}},
        Session{"help with a word after it", {"help", "logdump"}, "", invalid("help") + rootHelp, false, {}},
        Session{"failed group skips the rest", {"bogus", "--", "help"}, "", invalid("bogus") + rootHelp, false, {}},
        Session{"quit", {"quit"}, "", "", true, {}},
        Session{"exit ends before later groups", {"exit", "--", "bogus"}, "", "", true, {}},
        Session{"quit not alone", {"logdump", "quit"}, "", invalid("quit") + logdumpHelp, false, {}},
        Session{"each group starts at the root", {"cd", "logdump", "--", "tel"}, "", invalid("tel") + rootHelp, false, {}},
        Session{"handler with words", {"logdump", "tel", "a", "b"}, "", "", true, {"logdump:tel a b"}},
        Session{"two groups", {"logdump", "tel", "--", "logdump", "deep", "x", "y"}, "", "", true,
                {"logdump:tel", "deep:x y"}},
        Session{"failing handler stops the line", {"logdump", "fail", "--", "logdump", "tel"}, "", "", false,
                {"logdump:fail"}},
        Session{"refused handler is silent", {"logdump", "locked"}, "", "", false, {}},
        Session{"cd after sub-command words", {"logdump", "cd", ".."}, "", "", true, {}},
        Session{"cd without a path", {"cd"}, "", rootHelp, false, {}},
        Session{"cd with two words", {"logdump", "cd", "a", "b"}, "", logdumpHelp, false, {}},
        Session{"cd to an unknown place", {"cd", "logdump/nowhere"}, "", logdumpHelp, false, {}},
        Session{"words are case-sensitive", {"Logdump"}, "", invalid("Logdump") + rootHelp, false, {}}),
    caseName);

INSTANTIATE_TEST_SUITE_P(
    Interactive, ShellSession,
    testing::Values(
        Session{"end of input", {}, "", kRoot, false, {}},
        Session{"empty line", {}, "\n", kRoot + kRoot, false, {}},
        Session{"cd and back", {}, "cd logdump\nback\nback\n", kRoot + kLogdump + kRoot + kRoot, false, {}},
        Session{"paths that stay at the root", {}, "cd ..\ncd /\ncd //\ncd logdump/..\n",
                kRoot + kRoot + kRoot + kRoot + kRoot, false, {}},
        Session{"deep path", {}, "cd /logdump//deep/\nx 1\n", kRoot + "(/vorntool/logdump/deep)>> " +
                "(/vorntool/logdump/deep)>> ", false, {"deep:x 1"}},
        Session{"unknown component", {}, "cd logdump/x\n", kRoot + logdumpHelp + kRoot, false, {}},
        Session{"back not alone", {}, "logdump back\n", kRoot + invalid("back") + logdumpHelp + kRoot, false, {}},
        Session{"last line without line end", {}, "logdump tel a", kRoot + kRoot, false, {"logdump:tel a"}},
        Session{"failure flag is sticky", {}, "bogus\nhelp -- help\n",
                kRoot + invalid("bogus") + rootHelp + kRoot + rootHelp + kRoot, false, {}},
        Session{"sticky flag runs only the first group", {}, "logdump fail\nlogdump tel -- logdump tel\n",
                kRoot + kRoot + kRoot, false, {"logdump:fail", "logdump:tel"}},
        Session{"quit after failures", {}, "bogus\nquit\nhelp\n", kRoot + invalid("bogus") + rootHelp + kRoot, true, {}},
        Session{"exit inside a group", {}, "cd logdump\nexit\n", kRoot + kLogdump, true, {}}),
    caseName);

class NoRoot : public CommandShell {
  std::shared_ptr<CommandBase> createRootCommand() override { return nullptr; }
};

TEST(ShellStart, NoRootCommandFailsSilently) {
  NoRoot shell;
  StdioCapture io("help\n");
  EXPECT_FALSE(shell.run({"vorntool"}));
  EXPECT_EQ(io.out(), "");
}

}  // namespace
