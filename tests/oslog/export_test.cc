// SPDX-License-Identifier: MIT
// The export over a scripted store, and the oslog command in front of it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "logdump/oslog_command.h"
#include "oslog/line_formatter.h"
#include "oslog/os_log_stream.h"
#include "platform/logstore/system_log.h"
#include "tests/oslog/oslog_test_support.h"
#include "tests/support/file_size_limit.h"

namespace {

using namespace std::chrono_literals;
using oslog_test::messageEvent;
using oslog_test::readFile;
using testing::ElementsAre;
using Words = std::vector<std::string>;

std::int64_t secondsAgo(std::int64_t s) { return ::time(nullptr) - s; }
std::string lineFor(const logstore::Event& e) { std::string out; oslog::LineFormatter().append(e, out); return out; }

/// Runs the export over a scripted store, keeping what it logged.
class AnExportOverAFakeStore : public testing::Test {
 protected:
  bool run(oslog_test::FakeScript script, double history = 600, std::chrono::nanoseconds timeout = 10s) {
    oslog_test::FakeStore store(std::move(script));
    return OsLogStream::putOsLogStreamToFile(store, out_, {}, {}, history, timeout);
  }
  std::vector<std::string> logged() const { return capture_.messages(); }

  oslog_test::TempDir dir_;
  std::string out_ = dir_.path + "/oslog.txt";
  logstore::SystemLogCapture capture_;
};

TEST_F(AnExportOverAFakeStore, ReplacesTheFileWithTheSpansMessagesInOrder) {
  std::ofstream(out_) << std::string(100000, 'x');
  auto first = messageEvent(secondsAgo(300), "Telhub", "first"), other = messageEvent(secondsAgo(200), "T", "x"),
       second = messageEvent(secondsAgo(100), "pwrkeepd", "second");
  other.type = logstore::kEventTypeOther;
  EXPECT_TRUE(run({{messageEvent(secondsAgo(700), "Telhub", "too old"), first, other, second}}));
  EXPECT_EQ(readFile(out_), lineFor(first) + lineFor(second));
  EXPECT_THAT(logged(), ElementsAre("Getting oslog stream: history = 600.000000"));
}

TEST_F(AnExportOverAFakeStore, ZeroHistoryGivesAnEmptyFileAndSuccess) {
  EXPECT_TRUE(run({{messageEvent(secondsAgo(1), "Telhub", "before the call")}}, 0));
  EXPECT_EQ(std::filesystem::file_size(out_), 0u);
}

class AStreamEnding : public AnExportOverAFakeStore, public testing::WithParamInterface<std::uint64_t> {};

TEST_P(AStreamEnding, SucceedsWhateverTheReasonAndLogsAbnormalOnes) {
  const std::uint64_t reason = GetParam();
  EXPECT_TRUE(run({{messageEvent(secondsAgo(1), "Telhub", "kept")}, reason}, 60));
  std::vector<std::string> expected{"Getting oslog stream: history = 60.000000"};
  if (reason != logstore::kReasonEnded) expected.push_back("Invalid oslog stream: reason = " + std::to_string(reason));
  EXPECT_EQ(logged(), expected);
  EXPECT_EQ(oslog_test::splitLines(readFile(out_)).size(), 1u);
}

INSTANTIATE_TEST_SUITE_P(Reasons, AStreamEnding,
                         testing::Values(logstore::kReasonEnded, logstore::kReasonReadError, std::uint64_t{1234}),
                         [](const testing::TestParamInfo<std::uint64_t>& paramInfo) {
                           return "Reason" + std::to_string(paramInfo.param);
                         });

TEST_F(AnExportOverAFakeStore, TimeoutInvalidatesFailsAndKeepsThePartialFile) {
  auto delivered = messageEvent(secondsAgo(2), "Telhub", "delivered before the wait ran out");
  const auto began = std::chrono::steady_clock::now();
  EXPECT_FALSE(run({{delivered}, /*endReason=*/std::nullopt}, 30, 100ms));
  EXPECT_LT(std::chrono::steady_clock::now() - began, 5s);
  EXPECT_EQ(readFile(out_), lineFor(delivered));
  EXPECT_THAT(logged(), ElementsAre("Getting oslog stream: history = 30.000000", "Invalid oslog stream: reason = 1",
                                    "Timeout on getting oslog stream"));
}

TEST_F(AnExportOverAFakeStore, UnopenableStoreFailsWithoutCreatingTheFile) {
  oslog_test::FakeScript unopenable;
  unopenable.openError = "No such file or directory";
  EXPECT_FALSE(run(unopenable));
  EXPECT_FALSE(std::filesystem::exists(out_));
  EXPECT_THAT(logged(), ElementsAre("Could not open: No such file or directory", "Failed to prepare oslog stream"));
}

TEST_F(AnExportOverAFakeStore, PathInAMissingFolderFailsAndLogsThePath) {
  out_ = dir_.path + "/missing/oslog.txt";
  EXPECT_FALSE(run({}));
  EXPECT_FALSE(std::filesystem::exists(out_));
  EXPECT_THAT(logged(), ElementsAre("Failed to create file: " + out_));
}

TEST_F(AnExportOverAFakeStore, AFailedWriteFailsTheExport) {
  // Less than two blocks of lines: one is written while they come, the
  // rest at the end, where a limit just below the total cuts it short.
  const std::vector<logstore::Event> lines(1000, messageEvent(secondsAgo(5), "Telhub", std::string(60, 'm')));
  const std::size_t total = lines.size() * lineFor(lines[0]).size();
  const std::size_t limit = total - 100;
  struct Case {
    std::string path;
    std::string error;
  } const cases[] = {{"/dev/full", "No space left on device"}, {out_, "File too large"}};
  std::vector<std::string> expected;
  for (const auto& c : cases) {
    vorn::test::FileSizeLimit disk(limit);
    out_ = c.path;
    EXPECT_FALSE(run({lines})) << c.path;
    expected.insert(expected.end(), {"Getting oslog stream: history = 600.000000",
                                     "Failed to write file: " + c.path + " (" + c.error + ")"});
  }
  EXPECT_EQ(logged(), expected);
  EXPECT_EQ(std::filesystem::file_size(out_), limit);
}

/// What an observer was told, in order.
struct RecordingObserver : oslog::ExportObserver {
  void started() override { calls.push_back("started"); }
  void linesWritten(std::uint64_t lines) override { calls.push_back(std::to_string(lines)); }
  void finished() override { calls.push_back("finished"); }
  std::vector<std::string> calls;
};

TEST_F(AnExportOverAFakeStore, TellsItsObserverOfTheStreamOnlyWhileOneRuns) {
  struct Case {
    const char* what;
    oslog_test::FakeScript script;
    std::string path;
    std::vector<std::string> calls;
  };
  std::vector<logstore::Event> many(513, messageEvent(secondsAgo(5), "Telhub", "m"));
  oslog_test::FakeScript unopenable;
  unopenable.openError = "gone";
  const Case cases[] = {
      {"lines", {many}, out_, {"started", "256", "512", "513", "finished"}},
      {"no lines", {}, out_, {"started", "0", "finished"}},
      {"timed out", {{many[0]}, std::nullopt}, out_, {"started", "1", "finished"}},
      {"store not opened", unopenable, out_, {}},
      {"file not created", {many}, dir_.path + "/missing/x.txt", {}},
  };
  for (const auto& c : cases) {
    oslog_test::FakeStore store(c.script);
    RecordingObserver observer;
    OsLogStream::putOsLogStreamToFile(store, c.path, {}, {}, 60, 200ms, &observer);
    EXPECT_EQ(observer.calls, c.calls) << c.what;
  }
}

/// A handler's word list for words in command-line order.
std::list<std::string> wordList(const Words& words) { return {words.rbegin(), words.rend()}; }

struct ParseCase {
  const char* name;
  Words words;
  logdump::OsLogRequest expected;
};
void PrintTo(const ParseCase& c, std::ostream* os) { *os << c.name; }

class OsLogArguments : public testing::TestWithParam<ParseCase> {};

TEST_P(OsLogArguments, ParseInCommandLineOrder) {
  const auto& [name, words, e] = GetParam();
  auto r = logdump::parseOsLogArguments(wordList(words));
  ASSERT_TRUE(r.has_value());
  EXPECT_EQ(std::tie(r->history, r->path, r->processes, r->imagePaths),
            std::tie(e.history, e.path, e.processes, e.imagePaths));
}

const Words kDefaults = {"Telhub",    "TelhubMobileHelper",           "TelhubRootHelper", "vorn-helper",
                         "Wavelockd", "org.vorn.CellularDiagnostics", "pwrkeepd"};

INSTANTIATE_TEST_SUITE_P(
    CommandLines, OsLogArguments,
    testing::Values(
        ParseCase{"TwoWordsUseDefaults", {"600", "/tmp/a.txt"}, {600, "/tmp/a.txt", kDefaults, {"ZelmarBaseband"}}},
        ParseCase{"ProcessOnly", {"600", "a", "-p", "Telhub"}, {600, "a", {"Telhub"}, {}}},
        ParseCase{"ImageOnly", {"600", "a", "-i", "ZelmarBaseband"}, {600, "a", {}, {"ZelmarBaseband"}}},
        ParseCase{"StrayWordIsDroppedNoFilter", {"600", "a", "extra"}, {600, "a", {}, {}}},
        ParseCase{"BareModeWordNoFilter", {"600", "a", "-p"}, {600, "a", {}, {}}},
        ParseCase{"UnknownOptionIgnoresUntilNextMode", {"600", "a", "-p", "Telhub", "-x", "modemd", "-p", "pwrkeepd"},
                  {600, "a", {"Telhub", "pwrkeepd"}, {}}},
        ParseCase{"ModesInterleave", {"1", "a", "-i", "x", "-p", "P", "-i", "y"}, {1, "a", {"P"}, {"x", "y"}}},
        ParseCase{"ModeWordsAreExact", {"1", "a", "-pi", "x", "-P", "y"}, {1, "a", {}, {}}},
        ParseCase{"NonNumericHistoryIsZero", {"abc", "a"}, {0, "a", kDefaults, {"ZelmarBaseband"}}},
        ParseCase{"HistoryReadLikeAtoi", {"  -12xyz", "a", "-p"}, {-12, "a", {}, {}}},
        ParseCase{"PositionalWordsMayStartWithDash", {"-p", "-i", "-p", "x"}, {0, "-i", {"x"}, {}}}),
    [](const testing::TestParamInfo<ParseCase>& paramInfo) { return std::string(paramInfo.param.name); });

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
