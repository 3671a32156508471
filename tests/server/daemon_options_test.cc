// SPDX-License-Identifier: MIT
// The daemons' command lines. Built twice: as the shipped daemons read them,
// and with VORN_TEST_SWITCHES as their test builds do.
#include <gtest/gtest.h>

#include "server/common/daemon_options.h"

using namespace vorn::server;

namespace {

#ifdef VORN_TEST_SWITCHES
constexpr bool kTesting = true;
#else
constexpr bool kTesting = false;
#endif

struct Line {
  const char* label;
  std::vector<std::string> args;
  OptionsVerdict verdict;
  std::string text;  // what it prints, or the error (a prefix is enough)
  bool testSwitch = false;  // refused as unknown by the shipped daemons
};

void PrintTo(const Line& line, std::ostream* os) { *os << line.label; }

class ManagerCommandLines : public ::testing::TestWithParam<Line> {};

TEST_P(ManagerCommandLines, AreReadWithGetoptLong) {
  const Line& line = GetParam();
  ManagerOptions options;
  std::string text;
  OptionsVerdict verdict = parseManagerOptions(line.args, "/env-root", &options, &text);
  if (line.testSwitch && !kTesting) {
    EXPECT_EQ(verdict, OptionsVerdict::error);
    EXPECT_EQ(text.rfind("unknown option " + line.args.front(), 0), 0u) << text;
    return;
  }
  EXPECT_EQ(verdict, line.verdict);
  EXPECT_EQ(text.substr(0, line.text.size()), line.text) << text;
}

INSTANTIATE_TEST_SUITE_P(
    Vornd, ManagerCommandLines,
    ::testing::Values(Line{"Nothing", {}, OptionsVerdict::run, ""},
                      Line{"Help", {"--help"}, OptionsVerdict::help, "Usage: vornd [OPTION]...\n"},
                      Line{"RootWithoutValue", {"--root"}, OptionsVerdict::error, "--root needs a value"},
                      Line{"EmptyRoot", {"--root="}, OptionsVerdict::error, "--root wants a folder"},
                      Line{"Unknown", {"--bogus"}, OptionsVerdict::error, "unknown option --bogus"},
                      Line{"ShortUnknown", {"-x"}, OptionsVerdict::error, "unknown option -x"},
                      Line{"Positional", {"extra"}, OptionsVerdict::error, "unexpected argument extra"},
                      Line{"BadLimit", {"--max-collection-bytes", "1G"}, OptionsVerdict::error,
                           "--max-collection-bytes wants a number of bytes"},
                      Line{"State", {"--state", "Busy"}, OptionsVerdict::run, "", true},
                      Line{"BadDelay", {"--start-delay-ms", "-1"}, OptionsVerdict::error,
                           "--start-delay-ms wants a number of milliseconds", true},
                      Line{"BadFail", {"--fail", "TraceDumpState"}, OptionsVerdict::error,
                           "--fail wants COMMAND=STATUS", true},
                      Line{"ExitOn", {"--exit-on=Hello"}, OptionsVerdict::run, "", true}),
    [](const auto& paramInfo) { return std::string(paramInfo.param.label); });

TEST(ManagerCommandLine, TakesTheRootFromTheOptionThenTheEnvironmentThenSlash) {
  ManagerOptions options;
  std::string text;
  ASSERT_EQ(parseManagerOptions({"--root", "/r", "--max-collection-bytes=4096"}, "/env", &options, &text),
            OptionsVerdict::run);
  EXPECT_EQ(options.root, "/r");
  EXPECT_EQ(options.maxCollectionBytes, 4096u);
  ASSERT_EQ(parseManagerOptions({}, "/env", &options, &text), OptionsVerdict::run);
  EXPECT_EQ(options.root, "/env");
  EXPECT_EQ(options.maxCollectionBytes, std::uint64_t{1} << 30);
  ASSERT_EQ(parseManagerOptions({}, "", &options, &text), OptionsVerdict::run);
  EXPECT_EQ(options.root, "/");
  if (!kTesting) return;
  ASSERT_EQ(parseManagerOptions({"--fail", "TraceDumpState=0xE0200003", "--fail=Hello=-1", "--no-reply", "Hello",
                                 "--reply-delay-ms", "250", "--collect-delay-ms=9"},
                                nullptr, &options, &text),
            OptionsVerdict::run)
      << text;
  EXPECT_EQ(options.fail, (std::map<std::string, int>{{"TraceDumpState", int(0xE0200003)}, {"Hello", -1}}));
  EXPECT_EQ(options.noReply, std::set<std::string>{"Hello"});
  EXPECT_EQ(options.replyDelayMs, 250);
  EXPECT_EQ(options.collectDelayMs, 9);
}

TEST(HelperCommandLine, KnowsItsOwnSwitches) {
  HelperOptions options;
  std::string text;
  EXPECT_EQ(parseHelperOptions({"--max-collection-bytes", "1"}, nullptr, &options, &text), OptionsVerdict::error);
  const OptionsVerdict fail = parseHelperOptions({"--fail", "0xE0200002"}, nullptr, &options, &text);
  EXPECT_EQ(fail, kTesting ? OptionsVerdict::run : OptionsVerdict::error) << text;
  if (kTesting) {
    EXPECT_EQ(options.fail, int(0xE0200002));
  }
}

}  // namespace
