// SPDX-License-Identifier: MIT
#include "oslog/line_formatter.h"

#include <gtest/gtest.h>
#include <time.h>

#include "tests/oslog/fake_log_store.h"
#include "tests/oslog/test_files.h"

namespace {

using logstore::Event;

// 2026-03-05 14:07:09 UTC
constexpr std::int64_t kMarch5 = 1772719629;

std::string line(const Event& e) {
  oslog::LineFormatter formatter;
  std::string out;
  formatter.append(e, out);
  return out;
}

struct LineCase {
  const char* name;
  Event event;
  std::string expected;
};

Event withIds(std::uint64_t thread, std::uint64_t activity, std::int32_t pid) {
  Event e = oslog_test::messageEvent(kMarch5, "Telhub", "hello");
  e.threadIdentifier = thread;
  e.activityIdentifier = activity;
  e.processIdentifier = pid;
  return e;
}

Event withFields(const char* sender, const char* subsystem, const char* category, std::string message) {
  Event e = oslog_test::messageEvent(kMarch5, "Telhub", "");
  e.processIdentifier = 312;
  if (sender) e.sender.assign(sender); else e.sender.clear();
  if (subsystem) e.subsystem.assign(subsystem);
  if (category) e.category.assign(category);
  e.composedMessage.assign(message);
  return e;
}

Event at(std::int64_t micros, std::int32_t offset) {
  Event e = oslog_test::messageEvent(0, "p", "m", offset);
  e.dateMicros = micros;
  e.processIdentifier = 1;
  return e;
}

Event noProcess() {
  Event e = withIds(0, 0, 0);
  e.process.clear();
  e.sender.clear();
  e.composedMessage.clear();
  return e;
}

class LineFormat : public testing::TestWithParam<LineCase> {};

TEST_P(LineFormat, PrintsFieldsInTheExportLayout) { EXPECT_EQ(line(GetParam().event), GetParam().expected); }

INSTANTIATE_TEST_SUITE_P(
    Lines, LineFormat,
    testing::Values(
        LineCase{"ThreadPaddedActivityBare", withIds(0x1f, 0, 312),
                 "2026-03-05 14:07:09 +0000 0x0001f 0x0 312 Telhub(Telhub):(null) [(null)] hello\n"},
        LineCase{"WideIdentifiersUnpadded", withIds(0x123456789abcdef0, 0xabc, -7),
                 "2026-03-05 14:07:09 +0000 0x123456789abcdef0 0xabc -7 Telhub(Telhub):(null) [(null)] hello\n"},
        LineCase{"AllFieldsPresent", withFields("libZelmarIPC", "org.vorn.radio", "power", "up"),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 312 Telhub(libZelmarIPC):org.vorn.radio [power] up\n"},
        LineCase{"EmptyIsNotMissing", withFields("", "", "", ""),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 312 Telhub(): [] \n"},
        LineCase{"MissingTextsPrintNull", noProcess(),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 0 (null)((null)):(null) [(null)] (null)\n"},
        LineCase{"InvalidBytesBecomeReplacement", withFields("s", nullptr, nullptr, "a\xff" "b\xc3"),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 312 Telhub(s):(null) [(null)] a\uFFFDb\uFFFD\n"},
        LineCase{"OverlongAndSurrogateRejected", withFields("s", nullptr, nullptr, "\xc0\x80|\xed\xa0\x80"),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 312 Telhub(s):(null) [(null)] "
                 "\uFFFD\uFFFD|\uFFFD\uFFFD\uFFFD\n"},
        LineCase{"ValidMultibyteKept", withFields("s", nullptr, nullptr, "état \xf0\x9f\x93\xb6 Ω"),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 312 Telhub(s):(null) [(null)] état \xf0\x9f\x93\xb6 Ω\n"},
        LineCase{"TwoHoursEastShowsLocalClock", at((kMarch5 - 7200) * 1000000, 7200),
                 "2026-03-05 14:07:09 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n"},
        LineCase{"WestOffsetCrossesNewYear", at(1767225600LL * 1000000 + 999999, -3600),
                 "2025-12-31 23:00:00 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n"},
        LineCase{"LeapDay", at(1709164800LL * 1000000, 0),
                 "2024-02-29 00:00:00 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n"},
        LineCase{"BeforeEpochRoundsDown", at(-1, 0),
                 "1969-12-31 23:59:59 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n"}),
    [](const testing::TestParamInfo<LineCase>& info) { return std::string(info.param.name); });

TEST(LineFormatter, ReusedFormatterTracksEachEventsSecond) {
  oslog::LineFormatter formatter;
  std::string out;
  formatter.append(at(kMarch5 * 1000000, 0), out);
  formatter.append(at(kMarch5 * 1000000 + 500000, 0), out);
  formatter.append(at((kMarch5 + 61) * 1000000, 0), out);
  EXPECT_EQ(out,
            "2026-03-05 14:07:09 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n"
            "2026-03-05 14:07:09 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n"
            "2026-03-05 14:08:10 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n");
}

/// The zone of an event is the process's local zone at the event's date.
class LocalZone : public testing::Test {
 protected:
  void use(const char* tz) {
    env_.reset();  // restore first, so the next one saves the original zone
    env_ = std::make_unique<oslog_test::ScopedEnv>("TZ", tz);
    tzset();
  }
  void TearDown() override {
    env_.reset();
    tzset();
  }
  std::unique_ptr<oslog_test::ScopedEnv> env_;
};

TEST_F(LocalZone, NoonTwoHoursEastPrintsNoon) {
  use("<+02>-2");
  const std::int64_t noonLocal = 1772712000 - 7200;  // 2026-03-05 12:00 at +02:00
  Event e = at(noonLocal * 1000000, logstore::localSecondsFromGMT(noonLocal));
  EXPECT_EQ(line(e), "2026-03-05 12:00:00 +0000 0x00000 0x0 1 p(p):(null) [(null)] m\n");
}

TEST_F(LocalZone, OffsetFollowsDaylightSavingAtTheEventsDate) {
  use("CET-1CEST,M3.5.0,M10.5.0/3");
  EXPECT_EQ(logstore::localSecondsFromGMT(1768478400), 3600);  // 2026-01-15
  EXPECT_EQ(logstore::localSecondsFromGMT(1784116800), 7200);  // 2026-07-15
  use("<-05>5");
  EXPECT_EQ(logstore::localSecondsFromGMT(1784116800), -18000);
}

}  // namespace
