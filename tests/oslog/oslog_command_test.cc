// SPDX-License-Identifier: MIT
#include "logdump/oslog_command.h"

#include <gtest/gtest.h>

#include "platform/logstore/system_log.h"

namespace {

using logdump::defaultOsLogImagePaths;
using logdump::defaultOsLogProcesses;
using logdump::parseOsLogArguments;
using Words = std::vector<std::string>;

/// A handler's word list for words in command-line order.
std::list<std::string> wordList(const Words& words) { return {words.rbegin(), words.rend()}; }

struct ParseCase {
  const char* name;
  Words words;
  double history;
  std::string path;
  Words processes;
  Words images;
};

class OsLogArguments : public testing::TestWithParam<ParseCase> {};

TEST_P(OsLogArguments, ParseInCommandLineOrder) {
  const auto& c = GetParam();
  auto request = parseOsLogArguments(wordList(c.words));
  ASSERT_TRUE(request.has_value());
  EXPECT_EQ(request->history, c.history);
  EXPECT_EQ(request->path, c.path);
  EXPECT_EQ(request->processes, c.processes);
  EXPECT_EQ(request->imagePaths, c.images);
}

const Words kDefaults = defaultOsLogProcesses();

INSTANTIATE_TEST_SUITE_P(
    CommandLines, OsLogArguments,
    testing::Values(
        ParseCase{"TwoWordsUseDefaults", {"600", "/var/tmp/a.txt"}, 600, "/var/tmp/a.txt", kDefaults, {"ZelmarBaseband"}},
        ParseCase{"ProcessOnly", {"600", "/var/tmp/a.txt", "-p", "Telhub"}, 600, "/var/tmp/a.txt", {"Telhub"}, {}},
        ParseCase{"ImageOnly", {"600", "a", "-i", "ZelmarBaseband"}, 600, "a", {}, {"ZelmarBaseband"}},
        ParseCase{"StrayWordIsDroppedNoFilter", {"600", "a", "extra"}, 600, "a", {}, {}},
        ParseCase{"BareModeWordNoFilter", {"600", "a", "-p"}, 600, "a", {}, {}},
        ParseCase{"UnknownOptionIgnoresUntilNextMode",
                  {"600", "a", "-p", "Telhub", "-x", "modemd", "-p", "pwrkeepd"},
                  600, "a", {"Telhub", "pwrkeepd"}, {}},
        ParseCase{"ModesInterleave", {"1", "a", "-i", "x", "-p", "P", "-i", "y"}, 1, "a", {"P"}, {"x", "y"}},
        ParseCase{"ModeWordsAreExact", {"1", "a", "-pi", "x", "-P", "y"}, 1, "a", {}, {}},
        ParseCase{"NonNumericHistoryIsZero", {"abc", "a"}, 0, "a", kDefaults, {"ZelmarBaseband"}},
        ParseCase{"HistoryReadLikeAtoi", {"  -12xyz", "a", "-p"}, -12, "a", {}, {}},
        ParseCase{"PositionalWordsMayStartWithDash", {"-p", "-i", "-p", "x"}, 0, "-i", {"x"}, {}},
        ParseCase{"OverflowClamps", {"99999999999", "a", "-p"}, 2147483647, "a", {}, {}}),
    [](const testing::TestParamInfo<ParseCase>& info) { return std::string(info.param.name); });

TEST(OsLogDefaults, NameTheTelephonyAndBasebandProcesses) {
  EXPECT_EQ(defaultOsLogProcesses(), (Words{"Telhub", "TelhubMobileHelper", "TelhubRootHelper", "vorn-helper",
                                            "Wavelockd", "org.vorn.CellularDiagnostics", "pwrkeepd"}));
  EXPECT_EQ(defaultOsLogImagePaths(), Words{"ZelmarBaseband"});
}

TEST(OsLogCommand, FewerThanTwoWordsFailsOnStandardOutput) {
  for (const Words& words : {Words{}, Words{"600"}}) {
    logstore::SystemLogCapture capture;
    testing::internal::CaptureStdout();
    EXPECT_FALSE(logdump::runOsLogCommand(wordList(words)));
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "os log collection: Failed\n");
    EXPECT_TRUE(capture.messages().empty()) << "the export must not have started";
  }
}

}  // namespace
