// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "test_tree.h"

namespace {

const TestCommand::Layout kTree{
    "vorntool", {}, {{"logdump", {{"tel", "collect"}, {"fail", ""}, {"locked", ""}}, {{"deep", {{"x", ""}}}}, {"locked"}}}};

std::string invalid(const std::string& word) { return "\nInvalid command option '\x1b[31m" + word + "\x1b[39m'"; }

const std::string kRoot = "(/vorntool)>> ";
const std::string kLogdump = "(/vorntool/logdump)>> ";
const std::string rootHelp = helpOf(*TestCommand::create(kTree));
const std::string logdumpHelp = helpOf(*TestCommand::create(kTree)->getSubCommandObj("logdump"));

struct Session {
  const char* name;
  std::vector<std::string> args;  // after the program name
  std::string input;
  std::string output;
  bool result;
  std::vector<std::string> calls;
};
void PrintTo(const Session& s, std::ostream* os) { *os << s.name; }

class ShellSession : public testing::TestWithParam<Session> {};

TEST_P(ShellSession, PrintsAndReturnsExactly) {
  const Session& s = GetParam();
  std::vector<std::string> calls;
  TestShell shell(kTree, &calls);
  std::list<std::string> words(s.args.rbegin(), s.args.rend());
  words.push_back("vorntool");
  StdioCapture io(s.input);
  EXPECT_EQ(shell.run(words), s.result);
  EXPECT_EQ(io.out(), s.output);
  EXPECT_EQ(io.err(), "");
  EXPECT_EQ(calls, s.calls);
}

std::string caseName(const testing::TestParamInfo<Session>& info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(
    OneShot, ShellSession,
    testing::Values(
        Session{"SeparatorOnly", {"--"}, "", "", true, {}},
        Session{"Help", {"help"}, "", rootHelp, true, {}},
        Session{"SubCommandAsLastWord", {"logdump"}, "", logdumpHelp, false, {}},
        Session{"HelpOfSubCommand", {"logdump", "help"}, "", logdumpHelp, true, {}},
        Session{"HelpWithAWordAfterIt", {"help", "logdump"}, "", invalid("help") + rootHelp, false, {}},
        Session{"FailedGroupSkipsTheRest", {"bogus", "--", "help"}, "", invalid("bogus") + rootHelp, false, {}},
        Session{"Quit", {"quit"}, "", "", true, {}},
        Session{"ExitEndsBeforeLaterGroups", {"exit", "--", "bogus"}, "", "", true, {}},
        Session{"QuitNotAlone", {"logdump", "quit"}, "", invalid("quit") + logdumpHelp, false, {}},
        Session{"EachGroupStartsAtTheRoot", {"cd", "logdump", "--", "tel"}, "", invalid("tel") + rootHelp, false, {}},
        Session{"HandlerWithWords", {"logdump", "tel", "a", "b"}, "", "", true, {"logdump:tel a b"}},
        Session{"TwoGroups", {"logdump", "tel", "--", "logdump", "deep", "x", "y"}, "", "", true,
                {"logdump:tel", "deep:x y"}},
        Session{"FailingHandlerStopsTheLine", {"logdump", "fail", "--", "logdump", "tel"}, "", "", false,
                {"logdump:fail"}},
        Session{"RefusedHandlerIsSilent", {"logdump", "locked"}, "", "", false, {}},
        Session{"CdAfterSubCommandWords", {"logdump", "cd", ".."}, "", "", true, {}},
        Session{"CdWithoutAPath", {"cd"}, "", rootHelp, false, {}},
        Session{"CdWithTwoWords", {"logdump", "cd", "a", "b"}, "", logdumpHelp, false, {}},
        Session{"CdToAnUnknownPlace", {"cd", "logdump/nowhere"}, "", logdumpHelp, false, {}},
        Session{"WordsAreCaseSensitive", {"Logdump"}, "", invalid("Logdump") + rootHelp, false, {}}),
    caseName);

INSTANTIATE_TEST_SUITE_P(
    Interactive, ShellSession,
    testing::Values(
        Session{"EndOfInput", {}, "", kRoot, false, {}},
        Session{"EmptyLine", {}, "\n", kRoot + kRoot, false, {}},
        Session{"CdAndBack", {}, "cd logdump\nback\nback\n", kRoot + kLogdump + kRoot + kRoot, false, {}},
        Session{"PathsThatStayAtTheRoot", {}, "cd ..\ncd /\ncd //\ncd logdump/..\n",
                kRoot + kRoot + kRoot + kRoot + kRoot, false, {}},
        Session{"DeepPath", {}, "cd /logdump//deep/\nx 1\n",
                kRoot + "(/vorntool/logdump/deep)>> (/vorntool/logdump/deep)>> ", false, {"deep:x 1"}},
        Session{"UnknownComponent", {}, "cd logdump/x\n", kRoot + logdumpHelp + kRoot, false, {}},
        Session{"BackNotAlone", {}, "logdump back\n", kRoot + invalid("back") + logdumpHelp + kRoot, false, {}},
        Session{"LastLineWithoutLineEnd", {}, "logdump tel a", kRoot + kRoot, false, {"logdump:tel a"}},
        Session{"FailureFlagIsSticky", {}, "bogus\nhelp -- help\n",
                kRoot + invalid("bogus") + rootHelp + kRoot + rootHelp + kRoot, false, {}},
        Session{"StickyFlagRunsOnlyTheFirstGroup", {}, "logdump fail\nlogdump tel -- logdump tel\n",
                kRoot + kRoot + kRoot, false, {"logdump:fail", "logdump:tel"}},
        Session{"QuitAfterFailures", {}, "bogus\nquit\nhelp\n", kRoot + invalid("bogus") + rootHelp + kRoot, true, {}},
        Session{"ExitInsideAGroup", {}, "cd logdump\nexit\n", kRoot + kLogdump, true, {}}),
    caseName);

TEST(ShellStart, NoRootCommandFailsSilently) {
  TestShell shell({});
  StdioCapture io("help\n");
  EXPECT_FALSE(shell.run({"vorntool"}));
  EXPECT_EQ(io.out(), "");
}

}  // namespace
