// SPDX-License-Identifier: MIT
#include "server/helper/helper_service.h"

#include "platform/protocol/protocol.h"
#include "platform/linux/bus_guard.h"
#include "platform/linux/bus_message.h"
#include "server/common/device_facts.h"
#include "server/common/snapshot_scan.h"

namespace vorn::server {

HelperAnswer performHelperTask(const std::string& root, std::uint32_t task, const std::string& command,
                               const xpc::object& request) {
  if (task != helper::kTaskDiagsnapStatus || command != helper::kCommandDiagsnapStatus) {
    return {status::kBadRequest, "unknown task or command", {}};
  }
  // The answer is about what is on disk now; the caller's Timeout bounds
  // its own wait, and a scan of one folder never comes near it.
  xpc::object timeout = request.get(helper::kKeyTimeout);
  if (!timeout.isNull() && timeout.asInt64() == nullptr && timeout.asUint64() == nullptr) {
    return {status::kBadRequest, "Timeout must be a number of milliseconds", {}};
  }
  auto ts = newestSnapshotTimestamp(snapshotFolder(root), trace::basebandTraceDirSuffix(loadDeviceFacts(root).vendor));
  if (!ts) return {status::kCollectionFailed, "no baseband snapshot", {}};
  return {0, "", xpc::object::dictionary({{helper::kKeyTimestampString, xpc::object::string(*ts)}})};
}

HelperService::HelperService(const HelperOptions& options, DaemonLoop& loop) : options_(options), loop_(loop) {}

bool HelperService::start(std::string* error) {
  static const sd_bus_vtable kVtable[] = {
      SD_BUS_VTABLE_START(0),
      SD_BUS_METHOD_WITH_ARGS(protocol::kPerformMethod, SD_BUS_ARGS("s", client_name, "u", task, "s", command, "a{sv}", request),
                              SD_BUS_RESULT("i", status, "s", description, "a{sv}", response),
                              &HelperService::onPerform, SD_BUS_VTABLE_UNPRIVILEGED),
      SD_BUS_VTABLE_END,
  };
  sd_bus_slot* slot = nullptr;
  if (sd_bus_add_object_vtable(loop_.bus(), &slot, protocol::kHelperObjectPath, protocol::kHelperInterface, kVtable, this) < 0) {
    *error = "cannot publish " + std::string(protocol::kHelperObjectPath);
    return false;
  }
  slot_.reset(slot);
  return loop_.requestName(protocol::kHelperBusName, error);
}

void HelperService::stopping() { loop_.releaseName(protocol::kHelperBusName); }

int HelperService::onPerform(sd_bus_message* m, void* userdata, sd_bus_error* err) {
  return bus::guarded(err, [&] { return static_cast<HelperService*>(userdata)->perform(m); });
}

int HelperService::perform(sd_bus_message* m) {
  const char* client = nullptr;
  std::uint32_t task = 0;
  const char* command = nullptr;
  int r = sd_bus_message_read(m, "sus", &client, &task, &command);
  if (r < 0) return r;
  xpc::object request;
  if (!bus::readDictionary(m, request)) return -EBADMSG;

#ifdef VORN_TEST_SWITCHES
  HelperAnswer answer = options_.fail ? HelperAnswer{*options_.fail, "failing on purpose", {}}
                                      : performHelperTask(options_.root, task, command, request);
#else
  HelperAnswer answer = performHelperTask(options_.root, task, command, request);
#endif
  sd_bus_message* raw = nullptr;
  if ((r = sd_bus_message_new_method_return(m, &raw)) < 0) return r;
  bus::MessagePtr reply(raw);
  if ((r = sd_bus_message_append(reply.get(), "is", answer.status, answer.description.c_str())) < 0) return r;
  if (!bus::appendDictionary(reply.get(), answer.response)) return -ENOMEM;
  loop_.sendReply(std::move(reply), options_.replyDelayMs);
  return 1;
}

}  // namespace vorn::server
