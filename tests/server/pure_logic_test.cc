// SPDX-License-Identifier: MIT
// The daemons' pure logic, as tables: collection timestamps, requests,
// snapshot scans, byte budgets and the server's trace properties.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "server/common/collect_request.h"
#include "server/common/collector.h"
#include "server/common/file_extents.h"
#include "server/common/snapshot_scan.h"
#include "server/common/timestamp_naming.h"
#include "server/common/trace_properties.h"

using namespace vorn::server;
using xpc::object;

namespace {

TEST(TimestampNaming, ParsesOnlyCollectionTimestampsAndOrdersTheCounterNumerically) {
  struct Case {
    const char* text;
    std::optional<TimestampKey> key;
  } const cases[] = {
      {"2026-01-02-030405", TimestampKey{"2026-01-02-030405", 1}},
      {"2026-01-02-030405-2", TimestampKey{"2026-01-02-030405", 2}},
      {"2026-01-02-030405-10", TimestampKey{"2026-01-02-030405", 10}},
      {"2026-01-02-030405-1", std::nullopt},   // the first has no counter
      {"2026-01-02-030405-02", std::nullopt},  // no leading zero
      {"2026-01-02-030405-", std::nullopt},
      {"2026-01-02-030405-x", std::nullopt},
      {"2026-01-02-03040", std::nullopt},
      {"0999-01-02-030405", TimestampKey{"0999-01-02-030405", 1}},
      {"10000-01-02-030405-3", TimestampKey{"10000-01-02-030405", 3}},
      {"999-01-02-030405", std::nullopt},
      {"09999-01-02-030405", std::nullopt},  // a fifth digit is no padding
      {"2026/01/02-030405", std::nullopt},
      {"", std::nullopt},
  };
  for (const auto& c : cases) EXPECT_EQ(parseTimestamp(c.text), c.key) << c.text;
}

TEST(TimestampNaming, NamesEveryYearTheClockCanShowSoThatTheNamesReadBackInOrder) {
  const char* zone = std::getenv("TZ");
  const std::string saved = zone ? zone : "";
  setenv("TZ", "UTC0", 1);
  tzset();
  // In time order; the earliest name stands for every time it cannot name.
  const std::pair<std::time_t, std::string> cases[] = {
      {-62167219201, std::string(kEarliestTimestamp)},  // the year -1
      {-62167219200, "0000-01-01-000000"},
      {-30610224001, "0999-12-31-235959"},
      {1767323045, "2026-01-02-030405"},
      {253402300799, "9999-12-31-235959"},
      {253402300800, "10000-01-01-000000"},
      {INT64_MAX, std::string(kEarliestTimestamp)},  // past what localtime reaches
  };
  std::optional<TimestampKey> previous;
  for (const auto& [when, name] : cases) {
    EXPECT_EQ(formatTimestamp(when), name) << when;
    const auto key = parseTimestamp(name);
    ASSERT_TRUE(key.has_value()) << name;
    if (name != kEarliestTimestamp && previous) {
      EXPECT_LT(*previous, *key) << name;
    }
    previous = key;
  }
  zone ? setenv("TZ", saved.c_str(), 1) : unsetenv("TZ");
  tzset();
}

TEST(TimestampNaming, KnowsWhichNamesUseATimestamp) {
  struct Case {
    const char* name;
    bool uses;
  } const cases[] = {
      {"log-bb-T", true},         {"log-bb-T.tar.gz", true},   {"log-bb-T-tel", true},
      {"log-bb-T-bb-trace", true}, {"log-bb-T-", true},         {"log-bb-T-2", false},
      {"log-bb-T-2-tel", false},   {"log-bb-TX", false},        {"log-bb-", false},
      {"other-T", false},
  };
  for (const auto& c : cases) EXPECT_EQ(nameUsesTimestamp(c.name, "T"), c.uses) << c.name;
}

struct RequestCase {
  const char* label;
  std::vector<xpc::entry> entries;
  std::optional<Compression> compression;  // empty: a bad request
  std::string reason = {};
};

void PrintTo(const RequestCase& c, std::ostream* os) { *os << c.label; }

class CollectRequests : public ::testing::TestWithParam<RequestCase> {};

TEST_P(CollectRequests, AreReadOrRefused) {
  auto parsed = parseCollectRequest(object::dictionary(GetParam().entries));
  ASSERT_EQ(parsed.has_value(), GetParam().compression.has_value());
  if (!parsed) return;
  EXPECT_EQ(parsed->compression, *GetParam().compression);
  EXPECT_EQ(parsed->reason, GetParam().reason);
}

xpc::entry action(const char* name) { return {"TraceAction", object::string(name)}; }
xpc::entry reason(std::string text) { return {"TraceDumpStateReason", object::string(std::move(text))}; }
xpc::entry compression(object value) { return {"TraceDumpStatePerformCompression", std::move(value)}; }

INSTANTIATE_TEST_SUITE_P(
    Server, CollectRequests,
    ::testing::Values(
        RequestCase{"Defaults", {action("CollectTelephonyLogs")}, Compression::tarGz, "Unknown"},
        RequestCase{"Tar", {action("CollectBasebandLogs"), compression(object::int64(2))}, Compression::tar, "Unknown"},
        RequestCase{"UnsignedNone", {action("CollectBasebandLogs"), compression(object::uint64(0))}, Compression::none,
                    "Unknown"},
        RequestCase{"CompressionThree", {action("CollectBasebandLogs"), compression(object::int64(3))}, std::nullopt},
        RequestCase{"CompressionAsText", {action("CollectBasebandLogs"), compression(object::string("1"))},
                    std::nullopt},
        RequestCase{"CoreDumpReasonFromTheResetReason",
                    {action("CollectTelephonyLogsWithCoredump"), reason("ignored"),
                     {"BasebandResetReason", object::string("watchdog")}},
                    Compression::tarGz, "watchdog"},
        RequestCase{"ReasonOf4KiB", {action("CollectTelephonyLogs"), reason(std::string(4096, 'r'))},
                    Compression::tarGz, std::string(4096, 'r')},
        RequestCase{"ReasonLongerThan4KiB", {action("CollectTelephonyLogs"), reason(std::string(4097, 'r'))},
                    std::nullopt},
        RequestCase{"HugeUnrelatedEntry",
                    {action("CollectTelephonyLogs"), {"Padding", object::string(std::string(70000, 'p'))}},
                    std::nullopt},
        RequestCase{"ReasonNotAString", {action("CollectTelephonyLogs"), {"TraceDumpStateReason", object::int64(1)}},
                    std::nullopt},
        RequestCase{"UnknownAction", {action("CollectEverything")}, std::nullopt},
        RequestCase{"NoAction", {reason("r")}, std::nullopt}),
    [](const auto& paramInfo) { return std::string(paramInfo.param.label); });

TEST(SnapshotScan, FindsTheNewestBasebandSnapshotByTimestamp) {
  struct Case {
    std::vector<std::string> names;
    std::optional<std::string> newest;
  } const cases[] = {
      {{}, std::nullopt},
      {{"log-bb-2026-01-02-030405-bb-trace"}, "2026-01-02-030405"},
      {{"log-bb-2026-01-02-030405-9-bb-trace", "log-bb-2026-01-02-030405-10-bb-trace"}, "2026-01-02-030405-10"},
      {{"log-bb-2027-01-01-000000-tel", "log-bb-2026-01-01-000000-bb-trace"}, "2026-01-01-000000"},
      {{"log-bb-garbage-bb-trace", "log-bb--bb-trace", "x-bb-trace"}, std::nullopt},
  };
  for (const auto& c : cases) EXPECT_EQ(newestTimestamp(c.names, "-bb-trace"), c.newest) << c.names.size();
}

TEST(ByteBudget, StoresWholeFilesUntilItRunsOutThenCuts) {
  struct Case {
    const char* label;
    std::vector<Extent> extents;
    off_t size;
    std::uint64_t budget;
    StoredPart part;
    std::uint64_t left;
  } const cases[] = {
      {"fits", {{0, 100}}, 100, 1000, {{{0, 100}}, 100, 100, false}, 900},
      {"sparse fits, trailing hole kept", {{10, 5}}, 1000, 5, {{{10, 5}}, 1000, 5, false}, 0},
      {"cut inside an extent", {{0, 100}, {200, 100}}, 300, 150, {{{0, 100}, {200, 50}}, 250, 150, true}, 0},
      {"nothing left", {{0, 100}}, 100, 0, {{}, 0, 0, true}, 0},
      {"all holes", {}, 1000, 0, {{}, 1000, 0, false}, 0},
  };
  for (const auto& c : cases) {
    std::uint64_t budget = c.budget;
    StoredPart part = fitToBudget(c.extents, c.size, &budget);
    EXPECT_EQ(part.extents, c.part.extents) << c.label;
    EXPECT_EQ(part.size, c.part.size) << c.label;
    EXPECT_EQ(part.bytes, c.part.bytes) << c.label;
    EXPECT_EQ(part.cut, c.part.cut) << c.label;
    EXPECT_EQ(budget, c.left) << c.label;
  }
}

TEST(ServerTraceProperties, StartFromTheDefaultsOverlaidByTheFileAndWriteThemWhenMissing) {
  char pattern[] = "/tmp/vorn-props.XXXXXX";
  const std::string root = mkdtemp(pattern);
  const std::string file = root + "/var/lib/vorn/trace.properties";
  std::string error;
  auto props = loadTraceProperties(root, &error);
  EXPECT_EQ(error, "");
  EXPECT_EQ(props.get("Baseband", "Enabled"), "1");
  std::ifstream written(file);
  EXPECT_EQ(TraceProperties::parse(std::string(std::istreambuf_iterator<char>(written), {})).entries(),
            defaultTraceProperties().entries());

  std::ofstream(file) << "# comment\nSystemLogs.Mode=3\nBaseband.Path=/a=b\n";
  props = loadTraceProperties(root, &error);
  EXPECT_EQ(props.get("SystemLogs", "Mode"), "3");
  EXPECT_EQ(props.get("Baseband", "Enabled"), "1");
  EXPECT_EQ(props.get("Baseband", "Path"), "/a=b");
  std::filesystem::remove_all(root);
}

}  // namespace
