// SPDX-License-Identifier: MIT
// The export over a scripted store, as the tool shows it, and the oslog
// command in front of it.
#include <gtest/gtest.h>

#include "logdump/export_progress.h"
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
using Words = std::vector<std::string>;

std::int64_t secondsAgo(std::int64_t s) { return ::time(nullptr) - s; }
std::string lineFor(const logstore::Event& e) { std::string out; oslog::LineFormatter().append(e, out); return out; }

/// What the tool's progress line was told of an export, in order.
struct RecordingProgress : Progress {
  void begin(Activity activity) override { calls.push_back(activity == Activity::exporting ? "exporting" : "other"); }
  void setCount(std::uint64_t count) override { calls.push_back(std::to_string(count)); }
  void end() override { calls.push_back("end"); }
  std::vector<std::string> calls;
};

/// An export into a folder of its own, over a file that is already there.
class AnExportOverAFakeStore : public testing::Test {
 protected:
  oslog_test::TempDir dir_;
  std::string out_ = dir_.path + "/oslog.txt";
};

TEST_F(AnExportOverAFakeStore, ReplacesTheFileWithTheSpansMessagesOrFailsAndSaysWhy) {
  const auto kept = messageEvent(secondsAgo(2), "Telhub", "kept");
  auto first = messageEvent(secondsAgo(300), "Telhub", "first"), other = messageEvent(secondsAgo(200), "T", "x"),
       second = messageEvent(secondsAgo(100), "pwrkeepd", "second");
  other.type = logstore::kEventTypeOther;
  const std::vector<logstore::Event> many(513, messageEvent(secondsAgo(5), "Telhub", "m"));
  std::string manyLines;
  for (const auto& e : many) manyLines += lineFor(e);
  oslog_test::FakeScript unopenable;
  unopenable.openError = "No such file or directory";
  const std::string unopened = dir_.path + "/unopened.txt", missing = dir_.path + "/missing/oslog.txt";
  const std::string began600 = "Getting oslog stream: history = 600.000000";
  const std::string began60 = "Getting oslog stream: history = 60.000000";
  const Words oneLine = {"exporting", "1", "end"};
  struct Case {
    const char* what;
    oslog_test::FakeScript script;
    double history;
    std::string path;
    bool ok;
    std::optional<std::string> file;  // none: not created
    Words logged;
    Words shown;  // on the progress line
  };
  const Case cases[] = {
      {"the span's messages in order", {{messageEvent(secondsAgo(700), "Telhub", "too old"), first, other, second}},
       600, out_, true, lineFor(first) + lineFor(second), {began600}, {"exporting", "2", "end"}},
      {"counted in blocks", {many}, 600, out_, true, manyLines, {began600},
       {"exporting", "256", "512", "513", "end"}},
      {"zero history", {{kept}}, 0, out_, true, "", {"Getting oslog stream: history = 0.000000"},
       {"exporting", "0", "end"}},
      {"read error", {{kept}, logstore::kReasonReadError}, 60, out_, true, lineFor(kept),
       {began60, "Invalid oslog stream: reason = " + std::to_string(logstore::kReasonReadError)}, oneLine},
      {"unknown end", {{kept}, 1234}, 60, out_, true, lineFor(kept), {began60, "Invalid oslog stream: reason = 1234"},
       oneLine},
      {"timed out, partial file kept", {{kept}, std::nullopt}, 30, out_, false, lineFor(kept),
       {"Getting oslog stream: history = 30.000000", "Invalid oslog stream: reason = 1",
        "Timeout on getting oslog stream"},
       oneLine},
      {"store not opened", unopenable, 600, unopened, false, std::nullopt,
       {"Could not open: No such file or directory", "Failed to prepare oslog stream"}, {}},
      {"folder missing", {many}, 600, missing, false, std::nullopt, {"Failed to create file: " + missing}, {}},
  };
  for (const auto& c : cases) {
    std::ofstream(out_) << std::string(100000, 'x');
    logstore::SystemLogCapture capture;
    oslog_test::FakeStore store(c.script);
    auto progress = std::make_shared<RecordingProgress>();
    logdump::ExportProgress observer(progress);
    // Only a store that never ends waits the timeout out.
    const auto timeout = c.script.endReason ? std::chrono::nanoseconds(10s) : 100ms;
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(OsLogStream::putOsLogStreamToFile(store, c.path, {}, {}, c.history, timeout, &observer), c.ok) << c.what;
    EXPECT_LT(std::chrono::steady_clock::now() - start, 5s) << c.what;
    if (c.file) {
      EXPECT_EQ(readFile(c.path), *c.file) << c.what;
    } else {
      EXPECT_FALSE(std::filesystem::exists(c.path)) << c.what;
    }
    EXPECT_EQ(capture.messages(), c.logged) << c.what;
    EXPECT_EQ(progress->calls, c.shown) << c.what;
  }
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
  logstore::SystemLogCapture capture;
  std::vector<std::string> expected;
  for (const auto& c : cases) {
    vorn::test::FileSizeLimit disk(limit);
    oslog_test::FakeStore store(oslog_test::FakeScript{lines});
    EXPECT_FALSE(OsLogStream::putOsLogStreamToFile(store, c.path, {}, {}, 600)) << c.path;
    expected.insert(expected.end(), {"Getting oslog stream: history = 600.000000",
                                     "Failed to write file: " + c.path + " (" + c.error + ")"});
  }
  EXPECT_EQ(capture.messages(), expected);
  EXPECT_EQ(std::filesystem::file_size(out_), limit);
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
