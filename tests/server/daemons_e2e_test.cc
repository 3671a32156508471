// SPDX-License-Identifier: MIT
// vornd and vorn-helper, built, on a private bus with the project's policy.
#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <memory>
#include <set>

#include "archive_listing.h"
#include "bus_harness.h"
#include "platform/vorn_constants.h"
#include "temp_dir.h"

using namespace harness;
namespace fs = std::filesystem;
using xpc::object;

namespace {

object dict(std::vector<xpc::entry> entries) { return object::dictionary(std::move(entries)); }

object telRequest(int compression = 1, std::string reason = "e2e") {
  return dict({{"TraceAction", object::string("CollectTelephonyLogs")},
               {"TraceDumpStateReason", object::string(std::move(reason))},
               {"TraceDumpStatePerformCompression", object::int64(compression)}});
}

std::set<std::string> namesIn(const fs::path& dir) {
  std::set<std::string> names;
  std::error_code ec;
  for (fs::directory_iterator it(dir, ec); !ec && it != fs::directory_iterator(); it.increment(ec)) {
    names.insert(it->path().filename().string());
  }
  return names;
}

}  // namespace

class DaemonsOnPrivateBus : public ::testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() != 0) GTEST_SKIP() << "the bus policy lets only root own org.vorn.Manager and org.vorn.Helper";
    root.write("etc/vorn/device.conf", "radio=1\nproduct=1\nvendor=2\nbuild=internal\n");
    root.write("var/log/vorn/telhub.log", "telhub up\n");
    root.write("var/wireless/Library/Logs/ZelmarBasebandManager/bbmgr.log", "bb up\n");
    root.write("var/lib/vorn/modem/ram.bin", "core");
    bus = std::make_unique<PrivateBus>(busDir.path().string(), VORN_BUS_CONF);
    ASSERT_TRUE(bus->ok()) << "dbus-daemon did not start";
    ASSERT_TRUE(client.connect(bus->address()));
  }

  void startVornd(std::vector<std::string> args = {}, std::optional<unsigned long> fileSizeLimit = std::nullopt) {
    std::vector<std::string> argv = {VORND_PATH, "--root", root.path().string()};
    argv.insert(argv.end(), args.begin(), args.end());
    ASSERT_TRUE(vornd.start(argv, {bus->env()}, -1, fileSizeLimit));
    ASSERT_TRUE(client.waitFor([&] { return client.hasOwner("org.vorn.Manager"); }, 10s));
  }

  void startHelper(std::vector<std::string> args = {}) {
    std::vector<std::string> argv = {VORN_HELPER_PATH, "--root", root.path().string()};
    argv.insert(argv.end(), args.begin(), args.end());
    ASSERT_TRUE(helper.start(argv, {bus->env()}));
    ASSERT_TRUE(client.waitFor([&] { return client.hasOwner("org.vorn.Helper"); }, 10s));
  }

  bool sawState(const std::string& state) const {
    for (const auto& e : client.events()) {
      if (e.name == "ServerStateChange" && e.state == state) return true;
    }
    return false;
  }

  fs::path folder() const { return root.path() / "var/wireless/Library/Logs/CrashReporter/Baseband"; }

  TempDir root, busDir;
  std::unique_ptr<PrivateBus> bus;
  Client client;
  Process vornd, helper;
};

TEST_F(DaemonsOnPrivateBus, AnnouncesStartedAndStopsCleanlyOnSigterm) {
  startVornd();
  ASSERT_TRUE(client.waitFor([&] { return sawState("Started"); }, 10s));
  auto hello = client.hello();
  ASSERT_EQ(hello.error, "");
  EXPECT_EQ(xpc::dyn_cast_or_default(hello.response.get("ServerState"), ""), "Started");
  // The missing properties file was written back with the defaults.
  std::ifstream props(root.path() / "var/lib/vorn/trace.properties");
  std::string text((std::istreambuf_iterator<char>(props)), std::istreambuf_iterator<char>());
  EXPECT_EQ(text, "Baseband.Enabled=1\nSystemLogs.Mode=1\n");

  vornd.signal(SIGTERM);
  EXPECT_TRUE(client.waitFor([&] { return sawState("Stopping") && !client.hasOwner("org.vorn.Manager"); }, 10s));
  EXPECT_EQ(vornd.waitExit(10s), 0);
}

TEST_F(DaemonsOnPrivateBus, ReportsStartingUntilTheDelayedAnnouncement) {
  startVornd({"--start-delay-ms", "1500", "--state", "Warming"});
  auto early = client.hello();
  ASSERT_EQ(early.error, "");
  EXPECT_EQ(xpc::dyn_cast_or_default(early.response.get("ServerState"), ""), "Starting");
  EXPECT_FALSE(sawState("Warming"));
  ASSERT_TRUE(client.waitFor([&] { return sawState("Warming"); }, 10s));
  EXPECT_FALSE(sawState("Started"));
  EXPECT_EQ(xpc::dyn_cast_or_default(client.hello().response.get("ServerState"), ""), "Warming");
}

TEST_F(DaemonsOnPrivateBus, AnswersTracePropertiesFromTheFile) {
  root.write("var/lib/vorn/trace.properties", "SystemLogs.Mode=3\n");
  startVornd();
  struct Case {
    object request;
    int status;
    const char* value;
  } cases[] = {
      {dict({{"TraceName", object::string("SystemLogs")}, {"TracePropertyName", object::string("Mode")}}), 0, "3"},
      {dict({{"TraceName", object::string("Baseband")}, {"TracePropertyName", object::string("Enabled")}}), 0, "1"},
      {dict({{"TraceName", object::string("Baseband")}, {"TracePropertyName", object::string("Nope")}}),
       vorn::status::kBadRequest, nullptr},
      {dict({{"TraceName", object::string("Baseband")}}), vorn::status::kBadRequest, nullptr},
      {dict({{"TraceName", object::string("Baseband")}, {"TracePropertyName", object::int64(1)}}),
       vorn::status::kBadRequest, nullptr},
  };
  for (const auto& c : cases) {
    auto reply = client.perform("GetTraceProperty", c.request);
    ASSERT_EQ(reply.error, "");
    EXPECT_EQ(reply.status, c.status);
    if (c.value != nullptr) {
      EXPECT_EQ(xpc::dyn_cast_or_default(reply.response.get("TracePropertyValue"), "?"), c.value);
    } else {
      EXPECT_TRUE(reply.response.asEntries() == nullptr || reply.response.asEntries()->empty());
    }
  }
}

TEST_F(DaemonsOnPrivateBus, TelephonyCollectionIsAnArchiveOfManifestAndLogs) {
  startVornd();
  auto reply = client.perform("TraceDumpState", dict({{"TraceAction", object::string("CollectTelephonyLogs")},
                                                      {"TraceDumpStateReason", object::string("e2e")}}));
  ASSERT_EQ(reply.error, "");
  ASSERT_EQ(reply.status, 0) << reply.description;
  const std::string ts = xpc::dyn_cast_or_default(reply.response.get("TimestampString"), "");
  ASSERT_FALSE(ts.empty());
  EXPECT_EQ(namesIn(folder()), std::set<std::string>{"log-bb-" + ts + ".tar.gz"});
  auto listing = listArchive(folder() / ("log-bb-" + ts + ".tar.gz"));
  ASSERT_TRUE(listing.readable);
  const std::string dir = "log-bb-" + ts + "-tel/";
  EXPECT_EQ(listing.filter, ARCHIVE_FILTER_GZIP);
  EXPECT_EQ(listing.entries[dir + "vorn/telhub.log"], "telhub up\n");
  EXPECT_EQ(listing.entries[dir + "ZelmarBasebandManager/bbmgr.log"], "bb up\n");
  EXPECT_NE(listing.entries[dir + "manifest.txt"].find("reason: e2e\n"), std::string::npos);
  EXPECT_EQ(listing.entries.count(dir + "coredump/ram.bin"), 0u);
}

TEST_F(DaemonsOnPrivateBus, NocompressLeavesADirectoryTheHelperReports) {
  startVornd();
  startHelper();
  auto none = client.helper(4, "DiagsnapStatus", dict({{"Timeout", object::int64(1500)}}));
  ASSERT_EQ(none.error, "");
  EXPECT_EQ(none.status, vorn::status::kCollectionFailed);

  std::string newest;
  for (int i = 0; i < 2; ++i) {
    auto reply = client.perform("TraceDumpState", dict({{"TraceAction", object::string("CollectBasebandLogs")},
                                                        {"TraceDumpStatePerformCompression", object::int64(0)}}));
    ASSERT_EQ(reply.status, 0) << reply.description;
    newest = xpc::dyn_cast_or_default(reply.response.get("TimestampString"), "");
    EXPECT_TRUE(fs::is_regular_file(folder() / ("log-bb-" + newest + "-bb-trace") / "manifest.txt"));
  }
  // A telephony collection afterwards is not a baseband snapshot.
  ASSERT_EQ(client.perform("TraceDumpState", telRequest(0)).status, 0);
  auto found = client.helper(4, "DiagsnapStatus", dict({{"Timeout", object::int64(1500)}}));
  ASSERT_EQ(found.error, "");
  EXPECT_EQ(found.status, 0);
  EXPECT_EQ(xpc::dyn_cast_or_default(found.response.get("TimestampString"), ""), newest);

  struct Case {
    std::uint32_t task;
    const char* command;
  } bad[] = {{3, "DiagsnapStatus"}, {4, "diagsnapstatus"}, {4, "Other"}};
  for (const auto& c : bad) {
    EXPECT_EQ(client.helper(c.task, c.command, dict({})).status, vorn::status::kBadRequest) << c.command;
  }
}

TEST_F(DaemonsOnPrivateBus, CollectionsQueueWhileHelloIsAnsweredAtOnce) {
  // Incompressible data keeps each collection busy for a noticeable time.
  {
    std::ifstream random("/dev/urandom", std::ios::binary);
    std::string data(24 << 20, '\0');
    random.read(data.data(), static_cast<std::streamsize>(data.size()));
    root.write("var/log/vorn/big.bin", data);
  }
  startVornd();
  constexpr int kCount = 3;
  Reply replies[kCount];
  bool done[kCount] = {false, false, false};
  for (int i = 0; i < kCount; ++i) ASSERT_TRUE(client.performAsync("TraceDumpState", telRequest(), &replies[i], &done[i]));
  auto hello = client.hello();
  EXPECT_EQ(hello.error, "");
  EXPECT_FALSE(done[kCount - 1]) << "the last collection ended before Hello was answered";
  ASSERT_TRUE(client.waitFor([&] { return done[0] && done[1] && done[2]; }, 60s));
  std::set<std::string> stamps;
  for (const auto& r : replies) {
    EXPECT_EQ(r.status, 0) << r.description;
    stamps.insert(xpc::dyn_cast_or_default(r.response.get("TimestampString"), ""));
  }
  EXPECT_EQ(stamps.size(), 3u);
  EXPECT_EQ(namesIn(folder()).size(), 3u);
}

TEST_F(DaemonsOnPrivateBus, FailedCollectionsLeaveNoArchive) {
  struct Case {
    const char* label;
    std::function<void()> setup;
    std::optional<unsigned long> fileSizeLimit;
  } cases[] = {
      {"source is not a folder",
       [&] {
         fs::remove_all(root.path() / "var/log/vorn");
         root.write("var/log/vorn", "not a folder");
       },
       std::nullopt},
      // A file-size limit fails writes the way a full disk does.
      {"no room",
       [&] {
         fs::remove_all(root.path() / "var/log/vorn");
         root.write("var/log/vorn/telhub.log", "telhub up\n");
         root.write("var/lib/vorn/modem/ram.bin", std::string(1 << 20, 'x'));
       },
       256 << 10},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.label);
    c.setup();
    startVornd({}, c.fileSizeLimit);
    auto reply = client.perform("TraceDumpState", dict({{"TraceAction", object::string("CollectTelephonyLogsWithCoredump")}}));
    ASSERT_EQ(reply.error, "");
    EXPECT_EQ(reply.status, vorn::status::kCollectionFailed);
    EXPECT_TRUE(reply.response.asEntries() == nullptr || reply.response.asEntries()->empty());
    EXPECT_EQ(namesIn(folder()), std::set<std::string>{});
    // The server lives on and still answers.
    EXPECT_EQ(client.hello().error, "");
    vornd.terminate();
    ASSERT_TRUE(client.waitFor([&] { return !client.hasOwner("org.vorn.Manager"); }, 10s));
  }
}

TEST_F(DaemonsOnPrivateBus, TestSwitchesMisbehaveOnPurpose) {
  startVornd({"--fail", "TraceDumpState=0xE0200003", "--no-reply", "GetTraceProperty", "--reply-delay-ms", "300",
              "--exit-on", "Shutdown"});
  auto failed = client.perform("TraceDumpState", telRequest());
  EXPECT_EQ(failed.status, vorn::status::kBusy);
  EXPECT_TRUE(failed.response.asEntries() == nullptr || failed.response.asEntries()->empty());
  EXPECT_EQ(namesIn(folder()), std::set<std::string>{});

  auto before = Clock::now();
  EXPECT_EQ(client.hello().error, "");
  EXPECT_GE(Clock::now() - before, 300ms);

  auto silent = client.perform("GetTraceProperty",
                               dict({{"TraceName", object::string("Baseband")},
                                     {"TracePropertyName", object::string("Enabled")}}),
                               800ms);
  EXPECT_EQ(silent.error, "org.freedesktop.DBus.Error.Timeout");

  auto gone = client.perform("Shutdown", dict({}));
  EXPECT_NE(gone.error, "");
  EXPECT_TRUE(vornd.waitExit(10s).has_value());
  EXPECT_TRUE(client.waitFor([&] { return !client.hasOwner("org.vorn.Manager"); }, 10s));
}

TEST_F(DaemonsOnPrivateBus, HelperSwitchesFailAndDelay) {
  fs::create_directories(folder() / "log-bb-2024-01-01-000000-bb-trace");
  startHelper({"--fail", "0xE0200001", "--reply-delay-ms", "200"});
  auto before = Clock::now();
  auto reply = client.helper(4, "DiagsnapStatus", dict({{"Timeout", object::int64(1500)}}));
  EXPECT_GE(Clock::now() - before, 200ms);
  EXPECT_EQ(reply.status, vorn::status::kBadRequest);
  EXPECT_TRUE(reply.response.asEntries() == nullptr || reply.response.asEntries()->empty());
}

TEST_F(DaemonsOnPrivateBus, HostileRequestsGetAnswersNotCrashes) {
  startVornd();
  const char* kIface = "org.vorn.Manager1";
  auto call = [&](const std::function<int(sd_bus_message*)>& append) {
    return client.raw("org.vorn.Manager", "/org/vorn/Manager", kIface, "PerformCommand", append);
  };
  // Wrong signature: sd-bus refuses it before our code runs.
  EXPECT_EQ(call([](sd_bus_message* m) { return sd_bus_message_append(m, "s", "x"); }).error,
            "org.freedesktop.DBus.Error.InvalidArgs");
  // A compression of a type outside the protocol reads as missing: tar.gz.
  auto odd = call([](sd_bus_message* m) {
    return sd_bus_message_append(m, "ssa{sv}", "x", "TraceDumpState", 2, "TraceAction", "s", "CollectBasebandLogs",
                                 "TraceDumpStatePerformCompression", "i", 0);
  });
  ASSERT_EQ(odd.error, "");
  EXPECT_EQ(odd.status, 0) << odd.description;
  EXPECT_TRUE(fs::exists(folder() / ("log-bb-" + xpc::dyn_cast_or_default(odd.response.get("TimestampString"), "") +
                                     ".tar.gz")));

  struct Case {
    const char* label;
    std::string command;
    object request;
    int status;
  } cases[] = {
      {"unknown command", "Reboot", dict({}), vorn::status::kBadRequest},
      {"huge unknown command", std::string(1 << 20, 'C'), dict({}), vorn::status::kBadRequest},
      {"compression as text", "TraceDumpState",
       dict({{"TraceAction", object::string("CollectTelephonyLogs")},
             {"TraceDumpStatePerformCompression", object::string("0")}}),
       vorn::status::kBadRequest},
      {"action nested in a dictionary", "TraceDumpState",
       dict({{"TraceAction", dict({{"TraceAction", object::string("CollectTelephonyLogs")}})}}),
       vorn::status::kBadRequest},
      {"huge reason", "TraceDumpState", telRequest(2, std::string(4 << 20, 'r')), 0},
  };
  for (const auto& c : cases) {
    auto reply = client.perform(c.command, c.request);
    ASSERT_EQ(reply.error, "") << c.label;
    EXPECT_EQ(reply.status, c.status) << c.label << ": " << reply.description.substr(0, 200);
  }
  EXPECT_EQ(client.hello().error, "");
  EXPECT_TRUE(vornd.running());
  EXPECT_FALSE(vornd.waitExit(0ms).has_value());
}
