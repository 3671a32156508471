// SPDX-License-Identifier: MIT
#include "server/vornd/manager_service.h"

#include <unistd.h>

#include "platform/protocol/protocol.h"
#include "platform/linux/bus_guard.h"
#include "platform/linux/bus_message.h"

namespace vorn::server {

namespace {

xpc::object stateDict(const std::string& state) {
  return xpc::object::dictionary({{kKeyServerState, xpc::object::string(state)}});
}

}  // namespace

ManagerService::ManagerService(const ManagerOptions& options, DaemonLoop& loop, TraceProperties properties,
                               CollectionLine& line)
    : options_(options), loop_(loop), properties_(std::move(properties)), line_(line) {}

bool ManagerService::start(std::string* error) {
  static const sd_bus_vtable kVtable[] = {
      SD_BUS_VTABLE_START(0),
      SD_BUS_METHOD_WITH_ARGS(protocol::kHelloMethod, SD_BUS_ARGS("s", client_name), SD_BUS_RESULT("a{sv}", server_state),
                              &ManagerService::onHello, SD_BUS_VTABLE_UNPRIVILEGED),
      SD_BUS_METHOD_WITH_ARGS(protocol::kPerformCommandMethod, SD_BUS_ARGS("s", client_name, "s", command, "a{sv}", request),
                              SD_BUS_RESULT("i", status, "s", description, "a{sv}", response), &ManagerService::onPerformCommand,
                              SD_BUS_VTABLE_UNPRIVILEGED),
      SD_BUS_SIGNAL_WITH_ARGS(protocol::kEventSignal, SD_BUS_ARGS("s", name, "a{sv}", payload), 0),
      SD_BUS_VTABLE_END,
  };
  sd_bus_slot* slot = nullptr;
  // The handlers find `this` through the vtable's userdata.
  int r = sd_bus_add_object_vtable(loop_.bus(), &slot, protocol::kManagerObjectPath, protocol::kManagerInterface, kVtable, this);
  if (r < 0) {
    *error = "cannot publish " + std::string(protocol::kManagerObjectPath);
    return false;
  }
  slot_.reset(slot);
  if (!loop_.requestName(protocol::kManagerBusName, error)) return false;
  std::string state = options_.state;
  if (options_.startDelayMs > 0) {
    loop_.after(options_.startDelayMs, [this, state] { announce(state); });
  } else {
    announce(state);
  }
  return true;
}

void ManagerService::stopping() {
  announce("Stopping");
  loop_.releaseName(protocol::kManagerBusName);
}

void ManagerService::announce(const std::string& state) {
  state_ = state;
  sd_bus_message* raw = nullptr;
  if (sd_bus_message_new_signal(loop_.bus(), &raw, protocol::kManagerObjectPath, protocol::kManagerInterface,
                                 protocol::kEventSignal) < 0) return;
  bus::MessagePtr signal(raw);
  if (sd_bus_message_append_basic(signal.get(), 's', kEventServerStateChange) < 0) return;
  if (!bus::appendDictionary(signal.get(), stateDict(state))) return;
  sd_bus_send(loop_.bus(), signal.get(), nullptr);
  // Watchers (the sandbox, tests) learn the state from this line as well.
  fprintf(stderr, "vornd: state %s\n", state.c_str());
}

int ManagerService::onHello(sd_bus_message* m, void* userdata, sd_bus_error* err) {
  auto* self = static_cast<ManagerService*>(userdata);
  return bus::guarded(err, [&] { return self->hello(m, err); });
}

int ManagerService::onPerformCommand(sd_bus_message* m, void* userdata, sd_bus_error* err) {
  auto* self = static_cast<ManagerService*>(userdata);
  return bus::guarded(err, [&] { return self->performCommand(m, err); });
}

int ManagerService::hello(sd_bus_message* m, sd_bus_error*) {
  const char* client = nullptr;
  int r = sd_bus_message_read_basic(m, 's', &client);
  if (r < 0) return r;
#ifdef VORN_TEST_SWITCHES
  if (options_.exitOn.count(protocol::kHelloMethod)) _exit(0);
  if (options_.noReply.count(protocol::kHelloMethod)) return 1;
#endif
  sd_bus_message* raw = nullptr;
  if ((r = sd_bus_message_new_method_return(m, &raw)) < 0) return r;
  bus::MessagePtr answer(raw);
  if (!bus::appendDictionary(answer.get(), stateDict(state_))) return -ENOMEM;
  loop_.sendReply(std::move(answer), options_.replyDelayMs);
  return 1;
}

int ManagerService::performCommand(sd_bus_message* m, sd_bus_error*) {
  const char* client = nullptr;
  const char* command = nullptr;
  int r = sd_bus_message_read(m, "ss", &client, &command);
  if (r < 0) return r;
  std::string name = command;
  xpc::object request;
  if (!bus::readDictionary(m, request)) return -EBADMSG;

  if (misbehave(m, name)) return 1;
  if (name == kCommandGetTraceProperty) {
    reply(m, getTraceProperty(request));
  } else if (name == kCommandTraceDumpState) {
    traceDumpState(m, request);
  } else {
    reply(m, {status::kBadRequest, "unknown command " + name.substr(0, 200), {}});
  }
  return 1;
}

bool ManagerService::misbehave([[maybe_unused]] sd_bus_message* call, [[maybe_unused]] const std::string& command) {
#ifdef VORN_TEST_SWITCHES
  if (options_.exitOn.count(command)) _exit(0);
  if (options_.noReply.count(command)) return true;
  if (auto it = options_.fail.find(command); it != options_.fail.end()) {
    reply(call, {it->second, "failing " + command + " on purpose", {}});
    return true;
  }
#endif
  return false;
}

ManagerService::Answer ManagerService::getTraceProperty(const xpc::object& request) const {
  const std::string* trace = request.get(kKeyTraceName).asString();
  const std::string* property = request.get(kKeyTracePropertyName).asString();
  if (trace == nullptr || property == nullptr) {
    return {status::kBadRequest, "GetTraceProperty needs the strings TraceName and TracePropertyName", {}};
  }
  auto value = properties_.get(*trace, *property);
  if (!value) return {status::kBadRequest, "no such trace property", {}};
  return {0, "", xpc::object::dictionary({{kKeyTracePropertyValue, xpc::object::string(*value)}})};
}

void ManagerService::traceDumpState(sd_bus_message* call, const xpc::object& request) {
  auto parsed = parseCollectRequest(request);
  if (!parsed) {
    reply(call, {status::kBadRequest,
                 "TraceDumpState needs a collect action, a compression of 0, 1 or 2 and a reason of at most " +
                     std::to_string(kReasonLimit) + " bytes",
                 {}});
    return;
  }
  auto held = std::make_shared<bus::MessagePtr>(bus::retain(call));
  const bool taken = line_.submit(call, *parsed, [this, held](const CollectOutcome& outcome) {
    if (outcome.ok) {
      reply(held->get(),
            {0, "", xpc::object::dictionary({{kKeyTimestampString, xpc::object::string(outcome.timestamp)}})});
    } else {
      reply(held->get(), {status::kCollectionFailed, "collection failed: " + outcome.error, {}});
    }
  });
  if (!taken) {
    reply(call, {status::kBusy,
                 "busy: a collection is running and " + std::to_string(CollectionLine::kMaxWaiting) + " wait", {}});
  }
}

void ManagerService::reply(sd_bus_message* call, const Answer& answer) {
  sd_bus_message* raw = nullptr;
  if (sd_bus_message_new_method_return(call, &raw) < 0) return;
  bus::MessagePtr msg(raw);
  bool ok = sd_bus_message_append(msg.get(), "is", answer.status, answer.description.c_str()) >= 0 &&
            bus::appendDictionary(msg.get(), answer.response);
  if (!ok) {
    // A description that is not valid UTF-8 cannot travel; answer without it.
    if (sd_bus_message_new_method_return(call, &raw) < 0) return;
    msg.reset(raw);
    if (sd_bus_message_append(msg.get(), "is", answer.status, "") < 0) return;
    if (!bus::appendDictionary(msg.get(), xpc::object())) return;
  }
  loop_.sendReply(std::move(msg), options_.replyDelayMs);
}

}  // namespace vorn::server
