// SPDX-License-Identifier: MIT
// The daemons' pure parts: file formats, naming rules, requests, options.
#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <set>

#include "platform/vorn_constants.h"
#include "server/common/collect_request.h"
#include "server/common/collector.h"
#include "server/common/daemon_options.h"
#include "server/common/device_facts.h"
#include "server/common/snapshot_scan.h"
#include "server/common/text_util.h"
#include "server/common/timestamp_naming.h"
#include "server/common/trace_properties.h"
#include "temp_dir.h"

using namespace vorn::server;

TEST(TraceProperties, ParsesLinesLeniently) {
  struct Case {
    const char* text;
    std::map<std::string, std::string> want;
  } cases[] = {
      {"Baseband.Enabled=1\nSystemLogs.Mode=3\n", {{"Baseband.Enabled", "1"}, {"SystemLogs.Mode", "3"}}},
      {"  Baseband.Enabled =  0 \r\n", {{"Baseband.Enabled", "0"}}},
      {"# comment\n\nnoequals\n=1\nNoDot=2\n.Lead=3\nTrail.=4\n", {}},
      {"A.B=1\nA.B=2", {{"A.B", "2"}}},         // later wins, last line without '\n'
      {"A.B=x=y\n", {{"A.B", "x=y"}}},          // value keeps later '='
      {"A.B.C=5\n", {{"A.B.C", "5"}}},          // trace names split at the first dot
  };
  for (const auto& c : cases) {
    EXPECT_EQ(TraceProperties::parse(c.text).entries(), c.want) << c.text;
  }
}

TEST(TraceProperties, SerializeRoundTripsAndLookupSplitsNames) {
  auto p = TraceProperties::defaults();
  p.set("Baseband", "Enabled", "0");
  p.set("X", "Y", "z");
  EXPECT_EQ(p.serialize(), "Baseband.Enabled=0\nSystemLogs.Mode=1\nX.Y=z\n");
  auto back = TraceProperties::parse(p.serialize());
  EXPECT_EQ(back.entries(), p.entries());
  EXPECT_EQ(back.get("SystemLogs", "Mode"), "1");
  EXPECT_EQ(back.get("SystemLogs", "Enabled"), std::nullopt);
}

TEST(TraceProperties, LoadWritesDefaultsOnlyWhenTheFileIsMissing) {
  TempDir root;
  std::string error;
  auto loaded = loadTraceProperties(root.path(), &error);
  EXPECT_EQ(error, "");
  EXPECT_EQ(loaded.get("Baseband", "Enabled"), "1");
  std::ifstream in(tracePropertiesPath(root.path()));
  std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  EXPECT_EQ(text, "Baseband.Enabled=1\nSystemLogs.Mode=1\n");

  // A present file overlays the defaults and is left as it was.
  root.write("var/lib/vorn/trace.properties", "SystemLogs.Mode=3\n");
  loaded = loadTraceProperties(root.path(), &error);
  EXPECT_EQ(loaded.get("SystemLogs", "Mode"), "3");
  EXPECT_EQ(loaded.get("Baseband", "Enabled"), "1");
  std::ifstream again(tracePropertiesPath(root.path()));
  std::string kept((std::istreambuf_iterator<char>(again)), std::istreambuf_iterator<char>());
  EXPECT_EQ(kept, "SystemLogs.Mode=3\n");
}

TEST(TextUtil, ParsesStatusesInDecimalAndHex) {
  struct Case {
    const char* text;
    bool ok;
    int want;
  } cases[] = {
      {"0", true, 0},
      {"3760193537", true, vorn::status::kBadRequest},
      {"0xE0200002", true, vorn::status::kCollectionFailed},
      {"0Xe0200003", true, vorn::status::kBusy},
      {"-5", true, -5},
      {"0x100000000", false, 0},
      {"", false, 0},
      {"0x", false, 0},
      {"12abc", false, 0},
      {"-0x5", false, 0},
  };
  for (const auto& c : cases) {
    int got = 0;
    EXPECT_EQ(parseStatus(c.text, &got), c.ok) << c.text;
    if (c.ok) {
      EXPECT_EQ(got, c.want) << c.text;
    }
  }
}

TEST(DeviceFacts, ReadsVendorAndChoosesSuffixes) {
  struct Case {
    const char* text;
    int vendor;
    const char* trace;
    const char* core;
  } cases[] = {
      {"vendor=2\n", 2, "-bb-trace", "-coredump"},
      {"  vendor =  2  # the radio\n", 2, "-bb-trace", "-coredump"},
      {"vendor=1\n", 1, "-diag", "-cd"},
      {"vendor=3\n", 3, "-diag", "-cd"},
      {"vendor=two\n", 0, "-diag", "-cd"},
      {"# vendor=2\nradio=1\n", 0, "-diag", "-cd"},
      {"", 0, "-diag", "-cd"},
  };
  for (const auto& c : cases) {
    auto facts = parseDeviceFacts(c.text);
    EXPECT_EQ(facts.vendor, c.vendor) << c.text;
    EXPECT_EQ(directorySuffix(CollectAction::basebandLogs, facts.vendor), c.trace) << c.text;
    EXPECT_EQ(directorySuffix(CollectAction::telephonyLogsWithCoredump, facts.vendor), c.core) << c.text;
    EXPECT_EQ(directorySuffix(CollectAction::telephonyLogs, facts.vendor), "-tel") << c.text;
  }
  auto facts = parseDeviceFacts("radio=1\nbroken line\nbuild = internal\n");
  ASSERT_EQ(facts.entries.size(), 2u);
  EXPECT_EQ(facts.entries[1], (std::pair<std::string, std::string>("build", "internal")));
}

TEST(Timestamp, FormatsLocalTime) {
  const char* old = std::getenv("TZ");
  std::string saved = old ? old : "";
  setenv("TZ", "UTC", 1);
  tzset();
  EXPECT_EQ(formatTimestamp(1700000000), "2023-11-14-221320");
  setenv("TZ", "Europe/Berlin", 1);
  tzset();
  EXPECT_EQ(formatTimestamp(1700000000), "2023-11-14-231320");
  if (old) setenv("TZ", saved.c_str(), 1); else unsetenv("TZ");
  tzset();
}

TEST(Timestamp, UniqueAppendsTheFirstFreeCounter) {
  std::set<std::string> taken = {"T", "T-2", "T-3", "T-5"};
  auto isTaken = [&](const std::string& ts) { return taken.count(ts) > 0; };
  EXPECT_EQ(uniqueTimestamp("U", isTaken), "U");
  EXPECT_EQ(uniqueTimestamp("T", isTaken), "T-4");
}

TEST(Timestamp, ParsesOnlyCollectionTimestamps) {
  struct Case {
    const char* ts;
    bool ok;
    unsigned long counter;
  } cases[] = {
      {"2024-01-02-030405", true, 1}, {"2024-01-02-030405-2", true, 2}, {"2024-01-02-030405-10", true, 10},
      {"2024-01-02-030405-1", false, 0}, {"2024-01-02-030405-02", false, 0}, {"2024-01-02-030405-", false, 0},
      {"2024-01-02-03040", false, 0},    {"2024-01-02T030405", false, 0},    {"2024-01-02-030405x", false, 0},
  };
  for (const auto& c : cases) {
    auto key = parseTimestamp(c.ts);
    EXPECT_EQ(key.has_value(), c.ok) << c.ts;
    if (key) {
      EXPECT_EQ(key->counter, c.counter) << c.ts;
    }
  }
}

TEST(Timestamp, NamesBelongToExactlyOneTimestamp) {
  struct Case {
    const char* name;
    const char* ts;
    bool uses;
  } cases[] = {
      {"log-bb-T.tar.gz", "T", true},    {"log-bb-T.tar", "T", true},     {"log-bb-T-tel", "T", true},
      {"log-bb-T-bb-trace", "T", true},  {"log-bb-T-2-tel", "T", false},  {"log-bb-T-2-tel", "T-2", true},
      {"log-bb-T-20.tar", "T-2", false}, {"log-bb-TT-tel", "T", false},   {".log-bb-T-tel.partial", "T", false},
  };
  for (const auto& c : cases) EXPECT_EQ(nameUsesTimestamp(c.name, c.ts), c.uses) << c.name << " / " << c.ts;
}

TEST(SnapshotScan, PicksTheNewestByTimestampOrder) {
  std::vector<std::string> names = {
      "log-bb-2024-05-01-120000-bb-trace",   "log-bb-2024-05-01-120000-9-bb-trace",
      "log-bb-2024-05-01-120000-10-bb-trace", "log-bb-2024-04-30-235959-bb-trace",
      "log-bb-2099-01-01-000000-diag",       "log-bb-2099-01-01-000000-tel",
      "log-bb-garbage-bb-trace",             "log-bb-2099-01-01-000000.tar.gz",
  };
  EXPECT_EQ(newestTimestamp(names, "-bb-trace"), "2024-05-01-120000-10");
  EXPECT_EQ(newestTimestamp(names, "-diag"), "2099-01-01-000000");
  EXPECT_EQ(newestTimestamp(names, "-coredump"), std::nullopt);
  EXPECT_EQ(newestTimestamp({}, "-bb-trace"), std::nullopt);
}

TEST(SnapshotScan, CountsDirectoriesOnly) {
  TempDir dir;
  std::filesystem::create_directories(dir.path() / "log-bb-2024-01-01-000000-bb-trace");
  dir.write("log-bb-2025-01-01-000000-bb-trace", "a file, not a snapshot");
  EXPECT_EQ(newestSnapshotTimestamp(dir.path(), "-bb-trace"), "2024-01-01-000000");
  EXPECT_EQ(newestSnapshotTimestamp((dir.path() / "missing").string(), "-bb-trace"), std::nullopt);
}

TEST(CollectRequest, ChecksActionCompressionAndReason) {
  using xpc::object;
  auto req = [](std::vector<xpc::entry> e) { return object::dictionary(std::move(e)); };
  struct Case {
    const char* label;
    object request;
    bool ok;
    CollectAction action;
    Compression compression;
    const char* reason;
  } cases[] = {
      {"defaults", req({{"TraceAction", object::string("CollectTelephonyLogs")}}), true,
       CollectAction::telephonyLogs, Compression::tarGz, "Unknown"},
      {"tel reason", req({{"TraceAction", object::string("CollectTelephonyLogs")},
                          {"TraceDumpStateReason", object::string("why")},
                          {"TraceDumpStatePerformCompression", object::int64(0)}}),
       true, CollectAction::telephonyLogs, Compression::none, "why"},
      {"core reads the reset reason",
       req({{"TraceAction", object::string("CollectTelephonyLogsWithCoredump")},
            {"TraceDumpStateReason", object::string("ignored")},
            {"BasebandResetReason", object::string("reset")},
            {"TraceDumpStatePerformCompression", object::uint64(2)}}),
       true, CollectAction::telephonyLogsWithCoredump, Compression::tar, "reset"},
      {"bb", req({{"TraceAction", object::string("CollectBasebandLogs")}}), true, CollectAction::basebandLogs,
       Compression::tarGz, "Unknown"},
      {"no action", req({}), false, {}, {}, ""},
      {"not a dictionary", object::string("CollectTelephonyLogs"), false, {}, {}, ""},
      {"unknown action", req({{"TraceAction", object::string("collecttelephonylogs")}}), false, {}, {}, ""},
      {"action not a string", req({{"TraceAction", object::int64(1)}}), false, {}, {}, ""},
      {"compression 3", req({{"TraceAction", object::string("CollectBasebandLogs")},
                             {"TraceDumpStatePerformCompression", object::int64(3)}}),
       false, {}, {}, ""},
      {"compression -1", req({{"TraceAction", object::string("CollectBasebandLogs")},
                              {"TraceDumpStatePerformCompression", object::int64(-1)}}),
       false, {}, {}, ""},
      {"compression text", req({{"TraceAction", object::string("CollectBasebandLogs")},
                                {"TraceDumpStatePerformCompression", object::string("1")}}),
       false, {}, {}, ""},
      {"reason not a string", req({{"TraceAction", object::string("CollectBasebandLogs")},
                                   {"TraceDumpStateReason", object::boolean(true)}}),
       false, {}, {}, ""},
  };
  for (const auto& c : cases) {
    auto got = parseCollectRequest(c.request);
    ASSERT_EQ(got.has_value(), c.ok) << c.label;
    if (!got) continue;
    EXPECT_EQ(got->action, c.action) << c.label;
    EXPECT_EQ(got->compression, c.compression) << c.label;
    EXPECT_EQ(got->reason, c.reason) << c.label;
  }
}

TEST(DaemonOptions, ParsesManagerSwitches) {
  ManagerOptions o;
  std::string error;
  ASSERT_TRUE(parseManagerOptions({"--root", "/r", "--state=Busy", "--start-delay-ms", "250", "--fail",
                                   "TraceDumpState=0xE0200003", "--fail=GetTraceProperty=5", "--no-reply", "Hello",
                                   "--exit-on=TraceDumpState", "--reply-delay-ms=10"},
                                  "/env", &o, &error))
      << error;
  EXPECT_EQ(o.root, "/r");
  EXPECT_EQ(o.state, "Busy");
  EXPECT_EQ(o.startDelayMs, 250);
  EXPECT_EQ(o.replyDelayMs, 10);
  EXPECT_EQ(o.fail, (std::map<std::string, int>{{"TraceDumpState", vorn::status::kBusy}, {"GetTraceProperty", 5}}));
  EXPECT_EQ(o.noReply, std::set<std::string>{"Hello"});
  EXPECT_EQ(o.exitOn, std::set<std::string>{"TraceDumpState"});
}

TEST(DaemonOptions, RootFallsBackToTheEnvironmentThenSlash) {
  ManagerOptions o;
  HelperOptions h;
  std::string error;
  ASSERT_TRUE(parseManagerOptions({}, "/env", &o, &error));
  EXPECT_EQ(o.root, "/env");
  ASSERT_TRUE(parseManagerOptions({}, "", &o, &error));
  EXPECT_EQ(o.root, "/");
  ASSERT_TRUE(parseHelperOptions({"--fail", "0xE0200002"}, nullptr, &h, &error));
  EXPECT_EQ(h.root, "/");
  EXPECT_EQ(h.fail, vorn::status::kCollectionFailed);
}

TEST(DaemonOptions, RejectsMalformedSwitches) {
  const std::vector<std::vector<std::string>> bad = {
      {"--bogus"},          {"--root"},           {"--root="},         {"--start-delay-ms", "-1"},
      {"--fail", "Hello"},  {"--fail", "=5"},      {"--fail", "X=abc"}, {"--reply-delay-ms=1.5"},
  };
  for (const auto& args : bad) {
    ManagerOptions o;
    std::string error;
    EXPECT_FALSE(parseManagerOptions(args, nullptr, &o, &error)) << args[0];
    EXPECT_FALSE(error.empty());
  }
  HelperOptions h;
  std::string error;
  EXPECT_FALSE(parseHelperOptions({"--exit-on", "Perform"}, nullptr, &h, &error));
  EXPECT_FALSE(parseHelperOptions({"--fail", "soon"}, nullptr, &h, &error));
}
