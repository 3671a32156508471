// SPDX-License-Identifier: MIT
// The export over real journal files generated into a fixture root; the
// host's own journal is never read.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <time.h>

#include <set>

#include "logdump/oslog_command.h"
#include "oslog/os_log_stream.h"
#include "platform/logstore/system_log.h"
#include "tests/oslog/journal_fixture.h"
#include "tests/oslog/test_files.h"

namespace {

using oslog_test::JournalFixture;
using oslog_test::readFile;
using oslog_test::splitLines;

constexpr double kAllOfIt = 10 * 24 * 3600.0;

/// The process field of an export line: the word before "(" after the pid.
std::string processOf(const std::string& line) {
  // "YYYY-MM-DD HH:MM:SS +0000 0xT 0xA PID process(sender):..."
  std::size_t pos = 0;
  for (int spaces = 0; spaces < 6 && pos != std::string::npos; ++spaces) pos = line.find(' ', pos + 1);
  if (pos == std::string::npos) return {};
  return line.substr(pos + 1, line.find('(', pos) - pos - 1);
}

class AnExportFromTheJournal : public testing::Test {
 protected:
  void SetUp() override {
    const auto& f = JournalFixture::get();
    if (!f.error.empty()) GTEST_SKIP() << f.error;
    root_ = std::make_unique<oslog_test::ScopedEnv>("VORN_ROOT", f.root);
  }
  std::vector<std::string> exportLines(std::vector<std::string> processes, std::vector<std::string> images,
                                       double history = kAllOfIt) {
    ok_ = OsLogStream::putOsLogStreamToFile(out_, processes, images, history);
    return splitLines(readFile(out_));
  }
  const JournalFixture& fixture() const { return JournalFixture::get(); }

  oslog_test::TempDir dir_;
  std::string out_ = dir_.file("oslog.txt");
  std::unique_ptr<oslog_test::ScopedEnv> root_;
  logstore::SystemLogCapture capture_;
  bool ok_ = false;
};

struct FilterCase {
  const char* name;
  std::vector<std::string> processes;
  std::vector<std::string> images;
  std::vector<std::string> expectedProcesses;  ///< every process that must appear, and no other
};

class AFilteredJournalExport : public AnExportFromTheJournal, public testing::WithParamInterface<FilterCase> {};

TEST_P(AFilteredJournalExport, SelectsExactlyTheMatchingMessages) {
  const auto& c = GetParam();
  auto lines = exportLines(c.processes, c.images);
  ASSERT_TRUE(ok_);
  long expected = 0;
  for (const auto& p : c.expectedProcesses) expected += fixture().count("process\t" + p);
  EXPECT_EQ(static_cast<long>(lines.size()), expected);
  std::set<std::string> seen;
  for (const auto& line : lines) seen.insert(processOf(line));
  EXPECT_EQ(seen, std::set<std::string>(c.expectedProcesses.begin(), c.expectedProcesses.end()));
}

INSTANTIATE_TEST_SUITE_P(
    Filters, AFilteredJournalExport,
    testing::Values(
        FilterCase{"ExactCaseSensitiveName", {"Telhub"}, {}, {"Telhub"}},
        FilterCase{"LowerCaseIsAnotherProcess", {"telhub"}, {}, {"telhub"}},
        FilterCase{"NameLongerThanComm", {"TelhubRootHelper"}, {}, {"TelhubRootHelper"}},
        FilterCase{"LongNameWithoutSyslogIdentifier", {"TelhubMobileHelper"}, {}, {"TelhubMobileHelper"}},
        FilterCase{"ProcessWithoutExecutable", {"pwrkeepd"}, {}, {"pwrkeepd"}},
        FilterCase{"PlainFragmentMatchesAccentedPaths", {}, {"zelmar"}, {"ZelmarBasebandd", "zélmartool"}},
        FilterCase{"FragmentAcrossAccentedFolder", {}, {"ZELMAR/ZELMARBASEBAND"}, {"ZelmarBasebandd"}},
        FilterCase{"FragmentMatchingNothingSelectsNothing", {}, {"no-such-image"}, {}},
        FilterCase{"UnknownProcessSelectsNothing", {"NoSuchProcess"}, {}, {}},
        FilterCase{"TermsAreOrJoined", {"Telhub", "sshd"}, {"ZelmarBaseband"}, {"Telhub", "sshd", "ZelmarBasebandd"}},
        FilterCase{"NoTermsNoFilter",
                   {},
                   {},
                   {"Telhub", "telhub", "TelhubMobileHelper", "TelhubRootHelper", "TelhubRootHelperd",
                    "ZelmarBasebandd", "zélmartool", "pwrkeepd", "systemd", "sshd", "cron", "kworker/0:1"}}),
    [](const testing::TestParamInfo<FilterCase>& info) { return std::string(info.param.name); });

TEST_F(AnExportFromTheJournal, MapsJournalFieldsOntoTheLine) {
  auto lines = exportLines({}, {});
  ASSERT_TRUE(ok_);
  ASSERT_EQ(static_cast<long>(lines.size()), fixture().count("messages"));
  long replaced = 0;
  bool sawIpcSender = false, sawThread = false, sawSubsystem = false, sawCommOnly = false;
  for (const auto& line : lines) {
    if (line.find("\uFFFD") != std::string::npos) ++replaced;
    sawIpcSender |= line.find(" 400 ZelmarBasebandd(libZelmarIPC):") != std::string::npos;
    sawThread |= line.find(" 0x00157 0x0 312 Telhub(Telhub):") != std::string::npos;
    sawSubsystem |= line.find(":org.vorn.fixture [cat") != std::string::npos;
    sawCommOnly |= line.find(" 14 kworker/0:1(kworker/0:1):") != std::string::npos;
  }
  EXPECT_EQ(replaced, fixture().count("invalid_utf8"));
  EXPECT_TRUE(sawIpcSender) << "SYSLOG_IDENTIFIER is the sender";
  EXPECT_TRUE(sawThread) << "TID is the thread, padded to five digits";
  EXPECT_TRUE(sawSubsystem) << "LOG_SUBSYSTEM and LOG_CATEGORY";
  EXPECT_TRUE(sawCommOnly) << "_COMM names the process when there is no _EXE";
  EXPECT_THAT(lines.front(), testing::MatchesRegex("[0-9]{4}-[0-9]{2}-[0-9]{2} [0-9]{2}:[0-9]{2}:[0-9]{2} \\+0000 .*"));
}

TEST_F(AnExportFromTheJournal, ZeroHistoryGivesAnEmptyFileAndSuccess) {
  auto lines = exportLines({}, {}, 0);
  EXPECT_TRUE(ok_);
  EXPECT_TRUE(lines.empty());
  struct stat st {};
  EXPECT_EQ(::stat(out_.c_str(), &st), 0);
}

TEST_F(AnExportFromTheJournal, PrintsTheLocalWallClock) {
  auto dates = [&](const char* tz) {
    oslog_test::ScopedEnv zone("TZ", tz);
    tzset();
    auto lines = exportLines({"Telhub"}, {});
    std::vector<std::string> firstFields;
    for (const auto& l : lines) firstFields.push_back(l.substr(0, 25));
    return firstFields;
  };
  auto utc = dates("UTC");
  auto east = dates("<+02>-2");
  tzset();
  ASSERT_FALSE(utc.empty());
  ASSERT_EQ(utc.size(), east.size());
  auto secondsOf = [](const std::string& date) {
    std::tm tm{};
    strptime(date.c_str(), "%Y-%m-%d %H:%M:%S", &tm);
    return timegm(&tm);
  };
  for (std::size_t i = 0; i < utc.size(); ++i) ASSERT_EQ(secondsOf(east[i]) - secondsOf(utc[i]), 7200) << utc[i];
}

TEST_F(AnExportFromTheJournal, HistoryBoundsTheSpan) {
  // The fixture spreads its entries evenly over the 24 hours before it was made.
  auto all = exportLines({}, {});
  auto recent = exportLines({}, {}, 48 * 3600.0);
  EXPECT_EQ(recent.size(), all.size());
  auto none = exportLines({}, {}, 1);
  EXPECT_TRUE(none.empty());
}

TEST(AJournalStore, MissingRootFailsAndCreatesNoFile) {
  oslog_test::TempDir dir;
  oslog_test::ScopedEnv root("VORN_ROOT", dir.file("no-such-root"));
  logstore::SystemLogCapture capture;
  const std::string out = dir.file("oslog.txt");
  EXPECT_FALSE(OsLogStream::putOsLogStreamToFile(out, {}, {}, kAllOfIt));
  struct stat st {};
  EXPECT_NE(::stat(out.c_str(), &st), 0);
  EXPECT_THAT(capture.messages(),
              testing::ElementsAre(testing::StartsWith("Could not open: "), "Failed to prepare oslog stream"));
}

TEST_F(AnExportFromTheJournal, OslogCommandDefaultsSelectTheTelephonyProcesses) {
  EXPECT_TRUE(logdump::runOsLogCommand({out_, std::to_string(static_cast<long>(kAllOfIt))}));
  auto lines = splitLines(readFile(out_));
  const auto& f = fixture();
  EXPECT_EQ(static_cast<long>(lines.size()),
            f.count("process\tTelhub") + f.count("process\tTelhubMobileHelper") +
                f.count("process\tTelhubRootHelper") + f.count("process\tpwrkeepd") +
                f.count("exe\t/usr/libexec/Zélmar/ZelmarBasebandd"));
}

}  // namespace
