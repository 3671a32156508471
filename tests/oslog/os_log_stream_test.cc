// SPDX-License-Identifier: MIT
#include "oslog/os_log_stream.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "oslog/line_formatter.h"
#include "platform/logstore/system_log.h"
#include "tests/oslog/fake_log_store.h"
#include "tests/oslog/test_files.h"

namespace {

using namespace std::chrono_literals;
using oslog_test::FakeScript;
using oslog_test::FakeStore;
using oslog_test::messageEvent;
using oslog_test::readFile;
using testing::ElementsAre;

std::int64_t secondsAgo(std::int64_t s) {
  return std::chrono::duration_cast<std::chrono::seconds>(logstore::Clock::now().time_since_epoch()).count() - s;
}

std::string lineFor(const logstore::Event& e) {
  oslog::LineFormatter formatter;
  std::string out;
  formatter.append(e, out);
  return out;
}

bool exists(const std::string& path) {
  struct stat st {};
  return ::stat(path.c_str(), &st) == 0;
}

/// Runs the export over a scripted store, keeping what it logged.
class AnExportOverAFakeStore : public testing::Test {
 protected:
  bool run(FakeScript script, std::vector<std::string> processes = {}, std::vector<std::string> images = {},
           double history = 600, std::chrono::nanoseconds timeout = 10s) {
    FakeStore store(std::move(script));
    return OsLogStream::putOsLogStreamToFile(store, out_, processes, images, history, timeout);
  }
  std::vector<std::string> logged() const { return capture_.messages(); }

  oslog_test::TempDir dir_;
  std::string out_ = dir_.file("oslog.txt");
  logstore::SystemLogCapture capture_;
};

TEST_F(AnExportOverAFakeStore, WritesMessagesOfTheSpanInOrderAndSkipsOtherEvents) {
  FakeScript script;
  auto old = messageEvent(secondsAgo(700), "Telhub", "too old");
  auto first = messageEvent(secondsAgo(300), "Telhub", "first");
  auto other = messageEvent(secondsAgo(200), "Telhub", "not a message");
  other.type = logstore::kEventTypeOther;
  auto second = messageEvent(secondsAgo(100), "pwrkeepd", "second");
  script.events = {old, first, other, second};

  EXPECT_TRUE(run(script));
  EXPECT_EQ(readFile(out_), lineFor(first) + lineFor(second));
  EXPECT_THAT(logged(), ElementsAre("Getting oslog stream: history = 600.000000"));
}

TEST_F(AnExportOverAFakeStore, PassesTheFilterToTheStore) {
  FakeScript script;
  auto telhub = messageEvent(secondsAgo(5), "Telhub", "a");
  auto lower = messageEvent(secondsAgo(4), "telhub", "b");
  auto image = messageEvent(secondsAgo(3), "ZelmarBasebandd", "c");
  image.senderImagePath.assign("/usr/libexec/Zélmar/ZelmarBasebandd");
  script.events = {telhub, lower, image};

  EXPECT_TRUE(run(script, {"Telhub"}, {"zelmar/"}));
  EXPECT_EQ(readFile(out_), lineFor(telhub) + lineFor(image));
  EXPECT_TRUE(run(script, {}, {}));
  EXPECT_EQ(oslog_test::splitLines(readFile(out_)).size(), 3u);
}

TEST_F(AnExportOverAFakeStore, ReplacesAnExistingFile) {
  oslog_test::writeFile(out_, std::string(100000, 'x'));
  FakeScript script;
  auto only = messageEvent(secondsAgo(1), "Telhub", "fresh");
  script.events = {only};
  EXPECT_TRUE(run(script));
  EXPECT_EQ(readFile(out_), lineFor(only));
}

TEST_F(AnExportOverAFakeStore, ZeroHistoryGivesAnEmptyFileAndSuccess) {
  FakeScript script;
  script.events = {messageEvent(secondsAgo(1), "Telhub", "before the call")};
  EXPECT_TRUE(run(script, {}, {}, 0));
  EXPECT_TRUE(exists(out_));
  EXPECT_EQ(readFile(out_), "");
}

struct EndCase {
  std::uint64_t reason;
  std::vector<std::string> expectedLog;
};

class AStreamEnding : public AnExportOverAFakeStore, public testing::WithParamInterface<EndCase> {};

TEST_P(AStreamEnding, SucceedsWhateverTheReasonAndLogsAbnormalOnes) {
  FakeScript script;
  script.events = {messageEvent(secondsAgo(1), "Telhub", "kept")};
  script.endReason = GetParam().reason;
  EXPECT_TRUE(run(script, {}, {}, 60));
  EXPECT_EQ(logged(), GetParam().expectedLog);
  EXPECT_EQ(oslog_test::splitLines(readFile(out_)).size(), 1u);
}

INSTANTIATE_TEST_SUITE_P(
    Reasons, AStreamEnding,
    testing::Values(EndCase{logstore::kReasonEnded, {"Getting oslog stream: history = 60.000000"}},
                    EndCase{logstore::kReasonReadError,
                            {"Getting oslog stream: history = 60.000000", "Invalid oslog stream: reason = 2"}},
                    EndCase{1234, {"Getting oslog stream: history = 60.000000", "Invalid oslog stream: reason = 1234"}}));

TEST_F(AnExportOverAFakeStore, TimeoutInvalidatesFailsAndKeepsThePartialFile) {
  FakeScript script;
  auto delivered = messageEvent(secondsAgo(2), "Telhub", "delivered before the wait ran out");
  script.events = {delivered};
  script.hangAfterEvents = true;

  const auto began = std::chrono::steady_clock::now();
  EXPECT_FALSE(run(script, {}, {}, 30, 100ms));
  EXPECT_LT(std::chrono::steady_clock::now() - began, 5s);
  EXPECT_EQ(readFile(out_), lineFor(delivered));
  EXPECT_THAT(logged(), ElementsAre("Getting oslog stream: history = 30.000000", "Invalid oslog stream: reason = 1",
                                    "Timeout on getting oslog stream"));
}

TEST_F(AnExportOverAFakeStore, UnopenableStoreFailsWithoutCreatingTheFile) {
  FakeScript script;
  script.openError = "No such file or directory";
  EXPECT_FALSE(run(script));
  EXPECT_FALSE(exists(out_));
  EXPECT_THAT(logged(), ElementsAre("Could not open: No such file or directory", "Failed to prepare oslog stream"));
}

TEST_F(AnExportOverAFakeStore, PathInAMissingFolderFailsAndLogsThePath) {
  out_ = dir_.file("missing/oslog.txt");
  EXPECT_FALSE(run(FakeScript{}));
  EXPECT_FALSE(exists(out_));
  EXPECT_THAT(logged(), ElementsAre("Failed to create file: " + out_));
}

TEST_F(AnExportOverAFakeStore, AFailedWriteFailsTheExport) {
  FakeScript script;
  script.events = {messageEvent(secondsAgo(5), "Telhub", "lost on a full disk")};
  out_ = "/dev/full";
  EXPECT_FALSE(run(script));
  EXPECT_THAT(logged(), ElementsAre("Getting oslog stream: history = 600.000000",
                                    "Failed to write file: /dev/full (No space left on device)"));
}

TEST(AStream, ReportsItsEndExactlyOnce) {
  struct Case {
    bool activate;
    bool invalidateAfter;
    std::vector<std::uint64_t> expected;
  };
  for (const Case& c : {Case{false, true, {logstore::kReasonInvalidatedByCaller}},
                        Case{true, true, {logstore::kReasonEnded}},
                        Case{true, false, {logstore::kReasonEnded}}}) {
    oslog_test::FakeSource source(std::make_shared<FakeScript>());
    auto stream = source.makeStream();
    std::vector<std::uint64_t> reasons;
    dispatch::group done;
    done.enter();
    stream->setFlags(logstore::kStreamOptionsStoredThenEnd);
    stream->setInvalidationHandler([&](std::uint64_t r) {
      reasons.push_back(r);
      done.leave();
    });
    if (c.activate) {
      stream->activateStreamFromDate(logstore::Clock::now());
      ASSERT_TRUE(done.wait(5s));
    }
    if (c.invalidateAfter) stream->invalidate();
    stream.reset();
    EXPECT_EQ(reasons, c.expected) << "activate=" << c.activate << " invalidate=" << c.invalidateAfter;
  }
}

TEST(AStream, RefusesOptionsOtherThanStoredThenEnd) {
  oslog_test::FakeSource source(std::make_shared<FakeScript>());
  auto stream = source.makeStream();
  std::uint64_t reason = 0;
  dispatch::group done;
  done.enter();
  stream->setFlags(1);
  stream->setInvalidationHandler([&](std::uint64_t r) {
    reason = r;
    done.leave();
  });
  stream->activateStreamFromDate(logstore::Clock::now());
  ASSERT_TRUE(done.wait(5s));
  stream.reset();
  EXPECT_EQ(reason, logstore::kReasonUnsupportedOptions);
}

}  // namespace
