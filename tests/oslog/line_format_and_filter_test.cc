// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "oslog/line_formatter.h"
#include "platform/logstore/predicate.h"
#include "tests/oslog/oslog_test_support.h"

namespace {

using logstore::Event;

constexpr std::int64_t kMarch5 = 1772719629;  // 2026-03-05 14:07:09 UTC
const std::string kDate = "2026-03-05 14:07:09 +0000 ";
const std::string kTail = "0x00000 0x0 1 p(p):(null) [(null)] m\n";

/// An event with the given ids and texts: process, sender, subsystem,
/// category, message (nullptr: the event lacks it).
Event event(std::uint64_t thread, std::uint64_t activity, std::int32_t pid, std::vector<const char*> texts) {
  Event e = oslog_test::messageEvent(kMarch5, "", "");
  e.threadIdentifier = thread, e.activityIdentifier = activity, e.processIdentifier = pid;
  logstore::Text* fields[] = {&e.process, &e.sender, &e.subsystem, &e.category, &e.composedMessage};
  for (std::size_t i = 0; i < 5; ++i) texts[i] ? fields[i]->assign(texts[i]) : fields[i]->clear();
  return e;
}

Event at(std::int64_t micros, std::int32_t secondsFromGMT) {
  Event e = event(0, 0, 1, {"p", "p", nullptr, nullptr, "m"});
  e.dateMicros = micros, e.secondsFromGMT = secondsFromGMT;
  return e;
}

struct LineCase {
  const char* name;
  Event event;
  std::string expected;
};
void PrintTo(const LineCase& c, std::ostream* os) { *os << c.name; }

class LineFormat : public testing::TestWithParam<LineCase> {};

TEST_P(LineFormat, PrintsFieldsInTheExportLayout) {
  std::string out;
  oslog::LineFormatter().append(GetParam().event, out);
  EXPECT_EQ(out, GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, LineFormat,
    testing::Values(
        LineCase{"ThreadPaddedActivityBare", event(0x1f, 0, 312, {"Telhub", "libIPC", "org.vorn.radio", "power", "up"}),
                 kDate + "0x0001f 0x0 312 Telhub(libIPC):org.vorn.radio [power] up\n"},
        LineCase{"EmptyIsNotMissing", event(0, 0, 2, {"", "", "", "", ""}), kDate + "0x00000 0x0 2 (): [] \n"},
        LineCase{"MissingTextsPrintNullWideIdsUnpadded",
                 event(0x123456789abcdef0, 0xabc, -7, {nullptr, nullptr, nullptr, nullptr, nullptr}),
                 kDate + "0x123456789abcdef0 0xabc -7 (null)((null)):(null) [(null)] (null)\n"},
        LineCase{"InvalidUtf8BecomesReplacement",
                 event(0, 0, 3, {"T\xff", "s", nullptr, nullptr, "é \xf0\x9f\x93\xb6 \xc0\x80|\xed\xa0\x80|a\xff" "b\xc3"}),
                 kDate + "0x00000 0x0 3 T\uFFFD(s):(null) [(null)] é \xf0\x9f\x93\xb6 "
                         "\uFFFD\uFFFD|\uFFFD\uFFFD\uFFFD|a\uFFFDb\uFFFD\n"},
        LineCase{"LineBreaksInFieldsStayOnTheLine", event(0, 0, 4, {"p\n", "s", nullptr, nullptr, "one\ntwo\n\xff\n"}),
                 kDate + "0x00000 0x0 4 p\\n(s):(null) [(null)] one\\ntwo\\n\uFFFD\\n\n"},
        LineCase{"NoonTwoHoursEastPrintsNoon", at((1772712000LL - 7200) * 1000000, 7200),
                 "2026-03-05 12:00:00 +0000 " + kTail},
        LineCase{"WestOffsetCrossesNewYear", at(1767225600LL * 1000000 + 999999, -3600),
                 "2025-12-31 23:00:00 +0000 " + kTail},
        LineCase{"LeapDay", at(1709164800LL * 1000000, 0), "2024-02-29 00:00:00 +0000 " + kTail}),
    [](const testing::TestParamInfo<LineCase>& paramInfo) { return std::string(paramInfo.param.name); });

// An event's zone is the local zone at the event's own date, daylight saving included.
TEST(LocalSecondsFromGMT, FollowsTheZoneAtTheEventsDate) {
  oslog_test::ScopedEnv zone("TZ", "CET-1CEST,M3.5.0,M10.5.0/3");
  EXPECT_EQ(logstore::localSecondsFromGMT(1768478400), 3600);  // 2026-01-15
  EXPECT_EQ(logstore::localSecondsFromGMT(1784116800), 7200);  // 2026-07-15
  EXPECT_EQ(logstore::localSecondsFromGMT(1761440399), 7200);  // 2025-10-26 00:59:59, the last second of CEST
  EXPECT_EQ(logstore::localSecondsFromGMT(1761440400), 3600);
}

// One formatter keeps the date text of the last second it printed: the
// text follows the local clock, not the instant, across changes of offset.
TEST(LineFormatter, FollowsTheLocalClockAcrossOffsetChanges) {
  constexpr std::int64_t kFallBack = 1761438600;  // 2025-10-26 00:30:00 UTC, 02:30 in Berlin, either side
  constexpr std::int64_t kSpringForward = 1743296399;  // 2025-03-30 00:59:59 UTC, a second before 03:00 CEST
  const std::pair<Event, const char*> lines[] = {
      {at(kFallBack * 1000000, 7200), "2025-10-26 02:30:00"},
      {at(kFallBack * 1000000 + 500000, 3600), "2025-10-26 01:30:00"},  // the same instant's second
      {at((kFallBack + 3600) * 1000000, 3600), "2025-10-26 02:30:00"},  // an hour on, the same wall clock
      {at(kSpringForward * 1000000, 3600), "2025-03-30 01:59:59"},
      {at((kSpringForward + 1) * 1000000, 7200), "2025-03-30 03:00:00"},
  };
  oslog::LineFormatter formatter;
  for (const auto& [event, date] : lines) {
    std::string out;
    formatter.append(event, out);
    EXPECT_EQ(out, std::string(date) + " +0000 " + kTail);
  }
}

// Image fragments ignore case and diacritics across Unicode, not ASCII only
// (process names and the OR of terms are covered over the journal).
TEST(ImageFragment, MatchesIgnoringCaseAndDiacritics) {
  for (auto [fragment, path, expected] :
       {std::tuple{"zélmar", "/opt/Ze\u0301lmar", true}, {"αθηνα/y", "/usr/lib/ΆΘΉΝΑ/ÿ", true},
        {"иошкар", "/srv/Йошкар", true}, {"STRASSE", "/srv/Straße", true}, {"zelmar", "/bad/\xff/Zelmar", true},
        {"orsted", "/srv/Ørsted", false} /* a letter of its own */, {"", "/usr/sbin/Telhub", false},
        {"zelmar", "/bad/Zel\xffmar", false} /* an invalid byte does not vanish */,
        {"का", "/opt/कि", false} /* a spacing vowel sign is no diacritic */,
        {"a\U00016FF0\U0001D165", "/opt/a\U0001D165\u0301\U00016FF0", true} /* canonical order of marks */,
        {"가", "/opt/각", false} /* not part of a syllable */, {"각", "/opt/\u1100\u1161\u11A8", true}}) {
    Event e = oslog_test::messageEvent(0, "x", "m");
    e.senderImagePath.assign(path);
    EXPECT_EQ(logstore::Predicate({}, {fragment}).matches(e), expected) << fragment << " in " << path;
  }
}

}  // namespace
