// SPDX-License-Identifier: MIT
#include "tests/server/daemons_fixture.h"

#include <unistd.h>

#include <fstream>
#include <thread>

#include "platform/linux/bus_message.h"

namespace vorn::test {

namespace fs = std::filesystem;
using namespace std::chrono_literals;
using xpc::object;

object dict(std::vector<xpc::entry> entries) { return object::dictionary(std::move(entries)); }

std::string text(const object& response, const char* key) { return xpc::dyn_cast_or_default(response.get(key), ""); }

object collect(const char* action, std::optional<int> compression) {
  std::vector<xpc::entry> entries = {{"TraceAction", object::string(action)},
                                     {"TraceDumpStateReason", object::string("e2e")}};
  if (compression) entries.push_back({"TraceDumpStatePerformCompression", object::int64(*compression)});
  return dict(std::move(entries));
}

std::set<std::string> namesIn(const fs::path& dir) {
  std::set<std::string> names;
  if (fs::exists(dir)) {
    for (const auto& e : fs::directory_iterator(dir)) names.insert(e.path().filename().string());
  }
  return names;
}

namespace {

bus::MessagePtr newCall(sd_bus* raw, const std::string& service, const char* member) {
  const std::string name = "org.vorn." + service;
  sd_bus_message* m = nullptr;
  sd_bus_message_new_method_call(raw, &m, name.c_str(), ("/org/vorn/" + service).c_str(), (name + "1").c_str(),
                                 member);
  return bus::MessagePtr(m);
}

/// Calls org.vorn.<service> on a connection of its own; `append` writes the
/// arguments. A D-Bus error gives status -1 and its name.
Reply call(const std::string& service, const char* member, const std::function<int(sd_bus_message*)>& append) {
  sd_bus* raw = nullptr;
  if (sd_bus_open_system(&raw) < 0) return {"test.NoBus", -1, {}};
  bus::BusPtr connection(raw);
  bus::MessagePtr message = newCall(raw, service, member);
  if (!message || append(message.get()) < 0) return {"test.CannotBuild", -1, {}};
  sd_bus_error error = SD_BUS_ERROR_NULL;
  sd_bus_message* r = nullptr;
  Reply out;
  if (sd_bus_call(raw, message.get(), 60'000'000, &error, &r) < 0) {
    out = {error.name ? error.name : "test.CallFailed", -1, {}};
  }
  sd_bus_error_free(&error);
  bus::MessagePtr reply(r);
  return out.error.empty() ? readReply(r) : out;
}

}  // namespace

bus::MessagePtr performCall(sd_bus* raw, const std::string& command, const object& request) {
  bus::MessagePtr m = newCall(raw, "Manager", "PerformCommand");
  if (sd_bus_message_append(m.get(), "ss", "test", command.c_str()) < 0 || !bus::appendDictionary(m.get(), request)) {
    return nullptr;
  }
  return m;
}

Reply readReply(sd_bus_message* r) {
  Reply out;
  if (const sd_bus_error* e = sd_bus_message_get_error(r)) return {e->name, -1, {}};
  const char* description = nullptr;  // (isa{sv}) for commands, (a{sv}) for Hello
  const bool isStatus = sd_bus_message_get_signature(r, 1)[0] == 'i';
  if ((isStatus && sd_bus_message_read(r, "is", &out.status, &description) < 0) ||
      !bus::readDictionary(r, out.response)) {
    out = {"test.BadReply", -1, {}};
  }
  return out;
}

Reply hello() { return call("Manager", "Hello", [](sd_bus_message* m) { return sd_bus_message_append(m, "s", "t"); }); }

Reply perform(const std::string& command, const object& request) {
  return call("Manager", "PerformCommand", [&](sd_bus_message* m) {
    int r = sd_bus_message_append(m, "ss", "test", command.c_str());
    return r < 0 ? r : bus::appendDictionary(m, request) ? 0 : -EINVAL;
  });
}

Reply diagsnapStatus(std::uint32_t task, const char* command) {
  return call("Helper", "Perform", [&](sd_bus_message* m) {
    int r = sd_bus_message_append(m, "sus", "test", task, command);
    return r < 0 ? r : bus::appendDictionary(m, dict({{"Timeout", object::int64(1500)}})) ? 0 : -EINVAL;
  });
}

void Daemons::SetUp() {
  if (geteuid() != 0) GTEST_SKIP() << "the bus policy lets only root own org.vorn.Manager and org.vorn.Helper";
  bus.emplace();
  ASSERT_TRUE(bus->ok()) << bus->error();
  root = fs::path(bus->directory()) / "root";
  write("etc/vorn/device.conf", "radio=1\nproduct=1\nvendor=2\nbuild=internal\n");
  write("var/log/vorn/telhub.log", "telhub up\n");
  write("var/wireless/Library/Logs/ZelmarBasebandManager/bbmgr.log", "bb up\n");
  write("var/lib/vorn/modem/ram.bin", "core");
}

void Daemons::write(const std::string& rel, const std::string& data) const {
  fs::create_directories((root / rel).parent_path());
  std::ofstream(root / rel, std::ios::binary) << data;
}

void Daemons::start(std::vector<std::string> argv, Reply (*ready)()) {
  argv.insert(argv.end(), {"--root", root.string()});
  daemons.emplace_back(ChildProcess::Options{argv, {}, -1, ""});
  for (auto deadline = std::chrono::steady_clock::now() + 10s; !ready().error.empty();
       std::this_thread::sleep_for(10ms)) {
    ASSERT_LT(std::chrono::steady_clock::now(), deadline) << argv[0] << " did not come up";
  }
}

fs::path Daemons::folder() const { return root / "var/wireless/Library/Logs/CrashReporter/Baseband"; }

}  // namespace vorn::test
