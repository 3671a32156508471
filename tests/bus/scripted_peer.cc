// SPDX-License-Identifier: MIT
#include "tests/bus/scripted_peer.h"

#include "platform/linux/bus_message.h"

namespace vorn::test {
namespace {

const char* nameOf(ScriptedPeer::Service s) {
  return s == ScriptedPeer::Service::manager ? "org.vorn.Manager" : "org.vorn.Helper";
}
const char* pathOf(ScriptedPeer::Service s) {
  return s == ScriptedPeer::Service::manager ? "/org/vorn/Manager" : "/org/vorn/Helper";
}

}  // namespace

ScriptedPeer::ScriptedPeer(Service service) : service_(service) {
  if (sd_bus_open_system(&bus_) < 0) {
    bus_ = nullptr;
    return;
  }
  if (sd_bus_add_object(bus_, nullptr, pathOf(service), &ScriptedPeer::onCall, this) < 0 ||
      sd_bus_request_name(bus_, nameOf(service), 0) < 0)
    return;
  owned_ = true;
  thread_ = std::thread([this] { run(); });
}

ScriptedPeer::~ScriptedPeer() {
  {
    std::lock_guard lock(mutex_);
    stop_ = true;
  }
  if (thread_.joinable()) thread_.join();
  for (auto* m : unanswered_) sd_bus_message_unref(m);
  if (bus_) sd_bus_flush_close_unref(bus_);
}

void ScriptedPeer::script(const std::string& command, Script script) {
  std::lock_guard lock(mutex_);
  scripts_[command] = std::move(script);
}

void ScriptedPeer::setState(xpc::object state) {
  std::lock_guard lock(mutex_);
  state_ = std::move(state);
}

void ScriptedPeer::emit(const std::string& name, xpc::object payload) {
  std::lock_guard lock(mutex_);
  tasks_.push_back([this, name, payload] {
    sd_bus_message* m = nullptr;
    if (sd_bus_message_new_signal(bus_, &m, "/org/vorn/Manager", "org.vorn.Manager1", "Event") < 0)
      return;
    if (sd_bus_message_append(m, "s", name.c_str()) >= 0 && bus::appendDictionary(m, payload))
      sd_bus_send(bus_, m, nullptr);
    sd_bus_message_unref(m);
  });
}

std::vector<ScriptedPeer::Received> ScriptedPeer::waitForCalls(std::size_t count,
                                                               std::chrono::milliseconds limit) {
  std::unique_lock lock(mutex_);
  changed_.wait_for(lock, limit, [&] { return received_.size() >= count; });
  return received_;
}

int ScriptedPeer::onCall(sd_bus_message* m, void* userdata, sd_bus_error*) {
  return static_cast<ScriptedPeer*>(userdata)->handle(m);
}

int ScriptedPeer::handle(sd_bus_message* m) {
  Received call;
  call.member = sd_bus_message_get_member(m) ? sd_bus_message_get_member(m) : "";
  const char* client = nullptr;
  const char* command = nullptr;
  if (call.member == "Hello") {
    sd_bus_message_read(m, "s", &client);
    command = "Hello";
  } else if (call.member == "PerformCommand") {
    sd_bus_message_read(m, "ss", &client, &command);
    bus::readDictionary(m, call.request);
  } else if (call.member == "Perform") {
    sd_bus_message_read(m, "sus", &client, &call.task, &command);
    bus::readDictionary(m, call.request);
  } else {
    return 0;
  }
  call.client = client ? client : "";
  call.command = command ? command : "";
  Script script;
  xpc::object state;
  {
    std::lock_guard lock(mutex_);
    auto found = scripts_.find(call.command);
    if (found != scripts_.end()) script = found->second;
    else script.response = call.request;
    state = state_;
    received_.push_back(call);
  }
  changed_.notify_all();

  sd_bus_message* reply = nullptr;
  switch (script.act) {
    case Act::noReply:
      unanswered_.push_back(sd_bus_message_ref(m));
      return 1;
    case Act::exit:
      closed_ = true;
      return 1;
    case Act::wrongSignature:
      sd_bus_reply_method_return(m, "s", "not what you asked for");
      return 1;
    case Act::answer:
      break;
  }
  if (sd_bus_message_new_method_return(m, &reply) < 0) return -ENOMEM;
  bool ok = call.member == "Hello"
                ? bus::appendDictionary(reply, state)
                : sd_bus_message_append(reply, "is", script.status, "scripted") >= 0 &&
                      bus::appendDictionary(reply, script.response);
  if (ok) sd_bus_send(bus_, reply, nullptr);
  sd_bus_message_unref(reply);
  return 1;
}

void ScriptedPeer::run() {
  for (;;) {
    std::vector<std::function<void()>> tasks;
    {
      std::lock_guard lock(mutex_);
      if (stop_) return;
      tasks.swap(tasks_);
    }
    for (auto& task : tasks) task();
    int r;
    while ((r = sd_bus_process(bus_, nullptr)) > 0 && !closed_) {
    }
    if (closed_ || r < 0) {
      // Leaving the bus with calls pending makes the daemon fail them.
      sd_bus_flush_close_unref(bus_);
      bus_ = nullptr;
      owned_ = false;
      return;
    }
    // A short tick keeps the loop responsive to emit() and the stop flag.
    sd_bus_wait(bus_, 10000);
  }
}

}  // namespace vorn::test
