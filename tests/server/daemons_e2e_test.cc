// SPDX-License-Identifier: MIT
// vornd and vorn-helper, built, on a private bus with the project's policy.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <functional>
#include <list>
#include <optional>
#include <random>
#include <set>

#include "platform/protocol/protocol.h"
#include "platform/linux/bus_handles.h"
#include "platform/linux/bus_message.h"
#include "tests/support/private_bus.h"

namespace fs = std::filesystem;
using namespace std::chrono_literals;
using xpc::object;
using vorn::status::kBadRequest;
using vorn::status::kCollectionFailed;

namespace {

struct Reply {
  std::string error;  // D-Bus error name; empty on a method return
  int status = 0;
  object response;
};

object dict(std::vector<xpc::entry> entries) { return object::dictionary(std::move(entries)); }
std::string text(const object& response, const char* key) { return xpc::dyn_cast_or_default(response.get(key), ""); }

object collect(const char* action, std::optional<int> compression) {
  std::vector<xpc::entry> entries = {{"TraceAction", object::string(action)},
                                     {"TraceDumpStateReason", object::string("e2e")}};
  if (compression) entries.push_back({"TraceDumpStatePerformCompression", object::int64(*compression)});
  return dict(std::move(entries));
}

std::string noise(size_t size) {
  std::mt19937 random(7);
  std::string out(size, '\0');
  for (auto& c : out) c = static_cast<char>(random());
  return out;
}

std::set<std::string> namesIn(const fs::path& dir) {
  std::set<std::string> names;
  if (fs::exists(dir)) for (const auto& e : fs::directory_iterator(dir)) names.insert(e.path().filename().string());
  return names;
}

/// Calls org.vorn.<service> on a connection of its own; `append` writes the
/// arguments. A D-Bus error gives status -1 and its name.
Reply call(const std::string& service, const char* member, const std::function<int(sd_bus_message*)>& append) {
  sd_bus* raw = nullptr;
  if (sd_bus_open_system(&raw) < 0) return {"test.NoBus", -1, {}};
  vorn::bus::BusPtr bus(raw);
  const std::string name = "org.vorn." + service;
  sd_bus_message* m = nullptr;
  sd_bus_message_new_method_call(raw, &m, name.c_str(), ("/org/vorn/" + service).c_str(), (name + "1").c_str(), member);
  vorn::bus::MessagePtr message(m);
  if (m == nullptr || append(m) < 0) return {"test.CannotBuild", -1, {}};
  sd_bus_error error = SD_BUS_ERROR_NULL;
  sd_bus_message* r = nullptr;
  Reply out;
  if (sd_bus_call(raw, m, 60'000'000, &error, &r) < 0) out = {error.name ? error.name : "test.CallFailed", -1, {}};
  sd_bus_error_free(&error);
  vorn::bus::MessagePtr reply(r);
  const char* description = nullptr;  // (isa{sv}) for commands, (a{sv}) for Hello
  bool isStatus = out.error.empty() && sd_bus_message_get_signature(r, 1)[0] == 'i';
  if (out.error.empty() && ((isStatus && sd_bus_message_read(r, "is", &out.status, &description) < 0) ||
                            !vorn::bus::readDictionary(r, out.response))) {
    out = {"test.BadReply", -1, {}};
  }
  return out;
}

Reply hello() { return call("Manager", "Hello", [](sd_bus_message* m) { return sd_bus_message_append(m, "s", "t"); }); }
std::string serverState() { return text(hello().response, "ServerState"); }

Reply perform(const std::string& command, const object& request) {
  return call("Manager", "PerformCommand", [&](sd_bus_message* m) {
    int r = sd_bus_message_append(m, "ss", "test", command.c_str());
    return r < 0 ? r : vorn::bus::appendDictionary(m, request) ? 0 : -EINVAL;
  });
}

Reply diagsnapStatus(std::uint32_t task = 4, const char* command = "DiagsnapStatus") {
  return call("Helper", "Perform", [&](sd_bus_message* m) {
    int r = sd_bus_message_append(m, "sus", "test", task, command);
    return r < 0 ? r : vorn::bus::appendDictionary(m, dict({{"Timeout", object::int64(1500)}})) ? 0 : -EINVAL;
  });
}

}  // namespace

class Daemons : public ::testing::Test {
 public:
  void SetUp() override {
    if (geteuid() != 0) GTEST_SKIP() << "the bus policy lets only root own org.vorn.Manager and org.vorn.Helper";
    bus.emplace();
    ASSERT_TRUE(bus->ok()) << bus->error();
    root = fs::path(bus->directory()) / "root";
    write("etc/vorn/device.conf", "radio=1\nproduct=1\nvendor=2\nbuild=internal\n");
    write("var/log/vorn/telhub.log", "telhub up\n");
    write("var/wireless/Library/Logs/ZelmarBasebandManager/bbmgr.log", "bb up\n");
    write("var/lib/vorn/modem/ram.bin", "core");
  }

  void write(const std::string& rel, const std::string& data) const {
    fs::create_directories((root / rel).parent_path());
    std::ofstream(root / rel, std::ios::binary) << data;
  }

  /// Runs `argv` with "--root <root>" appended until `ready` gets an answer.
  void start(std::vector<std::string> argv, Reply (*ready)() = hello) {
    argv.insert(argv.end(), {"--root", root.string()});
    daemons.emplace_back(vorn::test::ChildProcess::Options{argv, {}, -1, ""});
    for (auto deadline = std::chrono::steady_clock::now() + 10s; !ready().error.empty();
         std::this_thread::sleep_for(10ms)) {
      ASSERT_LT(std::chrono::steady_clock::now(), deadline) << argv[0] << " did not come up";
    }
  }

  fs::path folder() const { return root / "var/wireless/Library/Logs/CrashReporter/Baseband"; }

  std::optional<vorn::test::PrivateBus> bus;
  fs::path root;
  std::list<vorn::test::ChildProcess> daemons;  // ended before the bus goes
};

TEST_F(Daemons, NocompressLeavesDirectoriesTheHelperReportsTheNewestOf) {
  start({VORND_PATH});
  start({VORN_HELPER_PATH}, [] { return diagsnapStatus(); });
  EXPECT_EQ(diagsnapStatus().status, kCollectionFailed);

  std::string newest;
  for (int i = 0; i < 2; ++i) {
    auto reply = perform("TraceDumpState", collect("CollectBasebandLogs", 0));
    ASSERT_EQ(reply.status, 0) << reply.error;
    newest = text(reply.response, "TimestampString");
    EXPECT_TRUE(fs::is_regular_file(folder() / ("log-bb-" + newest + "-bb-trace") / "manifest.txt")) << newest;
  }
  auto core = perform("TraceDumpState", collect("CollectTelephonyLogsWithCoredump", 0));
  ASSERT_EQ(core.status, 0) << core.error;
  EXPECT_EQ(fs::file_size(folder() / ("log-bb-" + text(core.response, "TimestampString") + "-coredump") /
                          "coredump/ram.bin"), 4u);
  // The core dump afterwards is not a baseband snapshot.
  auto found = diagsnapStatus();
  EXPECT_EQ(found.status, 0);
  EXPECT_EQ(text(found.response, "TimestampString"), newest);
  EXPECT_EQ(diagsnapStatus(3).status, kBadRequest);
  EXPECT_EQ(diagsnapStatus(4, "Other").status, kBadRequest);
}

// A collection that fails answers 0xE0200002 and leaves nothing behind.
struct Failure {
  const char* label;
  const char* file;  // written once the telephony logs are gone
  std::string data;
  std::vector<std::string> argv;
};

class FailedCollection : public Daemons, public ::testing::WithParamInterface<Failure> {};

TEST_P(FailedCollection, LeavesNoArchiveAndTheServerGoesOn) {
  fs::remove_all(root / "var/log/vorn");
  write(GetParam().file, GetParam().data);
  start(GetParam().argv);
  auto reply = perform("TraceDumpState", collect("CollectTelephonyLogsWithCoredump", 1));
  EXPECT_EQ(reply.status, kCollectionFailed) << reply.error;
  EXPECT_TRUE(reply.response.asEntries() == nullptr || reply.response.asEntries()->empty());
  EXPECT_EQ(namesIn(folder()), std::set<std::string>{});
  EXPECT_EQ(serverState(), "Started");
}

INSTANTIATE_TEST_SUITE_P(
    Daemons, FailedCollection,
    ::testing::Values(
        Failure{"UnreadableSource", "var/log/vorn", "a file where a folder belongs", {VORND_PATH}},
        // A file-size limit fails writes the way a full disk does; the data
        // must not compress below it.
        Failure{"NoRoom", "var/lib/vorn/modem/ram.bin", noise(1 << 20),
                {"/bin/sh", "-c", "ulimit -f 256 && exec \"$0\" \"$@\"", VORND_PATH}}),
    [](const auto& info) { return std::string(info.param.label); });
