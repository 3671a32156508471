// SPDX-License-Identifier: MIT
// vorn::client over sd-bus: one Manager, one connection, one I/O thread;
// events and asynchronous completions are handed to the Manager's queue.
#include <atomic>
#include <map>
#include <mutex>

#include "platform/linux/bus_guard.h"
#include "platform/linux/bus_link.h"
#include "platform/linux/bus_message.h"
#include "platform/linux/name_watch.h"
#include "platform/linux/text_lines.h"
#include "platform/protocol/trace_properties.h"
#include "platform/vorn_client.h"

namespace vorn::client {
namespace {

using namespace std::chrono_literals;
using Done = std::function<void(TelephonyXPC::Result, xpc::object)>;

constexpr bus::CallTarget kPerform{protocol::kManagerBusName, protocol::kManagerObjectPath,
                                   protocol::kManagerInterface, protocol::kPerformCommandMethod};
constexpr bus::CallTarget kHello{protocol::kManagerBusName, protocol::kManagerObjectPath,
                                 protocol::kManagerInterface, protocol::kHelloMethod};

std::chrono::microseconds timeoutFor(const std::string& command) {
  // A collection can take minutes; everything else answers at once.
  if (command == kCommandTraceDumpState) return bus::callTimeout(15min);
  return bus::callTimeout(25s);
}

/// What the I/O thread and the queue share to deliver events: the handlers
/// and whether delivery is on.
struct Events : std::enable_shared_from_this<Events> {
  dispatch::queue queue;
  std::mutex mutex;
  std::map<std::string, EventHandler> handlers;
  bool on = false;

  bool isOn() {
    std::lock_guard lock(mutex);
    return on;
  }

  /// Hands the event to its handler on the queue; called on the I/O thread.
  void deliver(const std::string& name, xpc::object payload) {
    EventHandler handler;
    {
      std::lock_guard lock(mutex);
      auto found = handlers.find(name);
      if (!on || found == handlers.end()) return;
      handler = found->second;
    }
    queue.async([self = shared_from_this(), handler = std::move(handler),
                 payload = std::move(payload)] {
      // Events switched off while this one waited on the queue stay undelivered.
      if (!self->isOn()) return;
      handler(payload, dispatch::group());
    });
  }
};

/// The answer to GetTraceProperty while the server is down, from the file the
/// server keeps.
void answerFromTraceProperties(const std::string& root, const xpc::object& request,
                               const Done& done) {
  auto value =
      protocol::TraceProperties::parse(
          bus::readSmallFile(protocol::underRoot(root, protocol::kTracePropertiesPath)))
          .get(xpc::dyn_cast_or_default(request.get(kKeyTraceName), ""),
               xpc::dyn_cast_or_default(request.get(kKeyTracePropertyName), ""));
  if (!value) {
    done({kResultServerNotRunning, "server is not running"}, {});
    return;
  }
  done({0, ""}, xpc::object::dictionary({{kKeyTracePropertyValue, xpc::object::string(*value)}}));
}

class BusManager final : public Manager {
 public:
  BusManager(std::string clientName, dispatch::queue queue)
      : clientName_(std::move(clientName)),
        events_(std::make_shared<Events>()),
        server_(protocol::kManagerBusName, {[this] { serverLost(); }, [this] { serverGained(); }}) {
    events_->queue = std::move(queue);
    root_ = protocol::platformRoot();
    // Both subscriptions go out on every new connection before any call, so
    // no event can slip in between an answer (the owner's, Hello's) and the
    // subscription. The bus drops broadcasts from anyone but the owner; the
    // check in onEvent also catches signals addressed to this client alone.
    link_ = std::make_unique<bus::BusLink>([this](sd_bus* bus) {
      sd_bus_match_signal_async(bus, nullptr, protocol::kManagerBusName,
                                protocol::kManagerObjectPath, protocol::kManagerInterface,
                                protocol::kEventSignal, &BusManager::onEvent,
                                /* install_callback= */ nullptr, this);
      server_.attach(bus);
    });
  }

  void registerEventHandler(const std::string& eventName, EventHandler handler) override {
    std::lock_guard lock(events_->mutex);
    events_->handlers[eventName] = std::move(handler);
  }

  void eventsOff() override {
    std::lock_guard lock(events_->mutex);
    events_->on = false;
  }

  void eventsOn() override {
    {
      std::lock_guard lock(events_->mutex);
      events_->on = true;
    }
    sayHello();
  }

  bool accessDenied() const override { return denied_; }

  TelephonyXPC::Result performCommand(const std::string& command, const xpc::object& request,
                                      xpc::object& response) override {
    auto reply = std::make_shared<bus::SyncReply>();
    submit(command, request, [reply](TelephonyXPC::Result result, xpc::object answer) {
      reply->deliver(std::move(result), std::move(answer));
    });
    return reply->wait(response);
  }

  void performCommand(const std::string& command, Completion completion,
                      const xpc::object& request) override {
    dispatch::queue queue = events_->queue;
    submit(command, request,
           [queue, completion = std::move(completion)](TelephonyXPC::Result result,
                                                       xpc::object response) mutable {
             auto run = [completion = std::move(completion), result = std::move(result),
                         response = std::move(response)] {
               if (completion) completion(result, response);
             };
             if (queue)
               queue.async(std::move(run));
             else
               run();
           });
  }

 private:
  /// Registers with the server and delivers its answer as its state.
  void sayHello() {
    std::string client = clientName_;
    link_->call(
        kHello,
        [client](sd_bus_message* m) { return sd_bus_message_append(m, "s", client.c_str()) >= 0; },
        bus::callTimeout(25s), [this](const bus::CallOutcome& outcome) {
          noteAccess(outcome.status);
          xpc::object state;
          if (outcome.status != 0 || sd_bus_message_has_signature(outcome.message, "a{sv}") <= 0 ||
              !bus::readDictionary(outcome.message, state))
            return;
          events_->deliver(kEventServerStateChange, std::move(state));
        });
  }

  /// Remembers whether the bus let the last call through to the server.
  void noteAccess(std::int32_t status) {
    if (status == status::kAccessDenied)
      denied_ = true;
    else if (status == 0)
      denied_ = false;
  }

  /// A server that went away says nothing more: its state is unknown now.
  void serverLost() { events_->deliver(kEventServerStateChange, xpc::object::dictionary({})); }

  /// A server that took the name over has its own state; ask it as EventsOn does.
  void serverGained() {
    if (events_->isOn()) sayHello();
  }

  /// An Event signal, on the I/O thread. Anyone on the bus may send one, even
  /// to this client alone; only the server's own connection speaks for it.
  static int onEvent(sd_bus_message* m, void* userdata, sd_bus_error* error) {
    return bus::guarded(error, [&] {
      auto* self = static_cast<BusManager*>(userdata);
      if (!self->server_.isOwner(sd_bus_message_get_sender(m))) return 0;
      if (sd_bus_message_has_signature(m, "sa{sv}") <= 0) return 0;
      const char* name = nullptr;
      xpc::object payload;
      if (sd_bus_message_read_basic(m, 's', &name) < 0 || !bus::readDictionary(m, payload))
        return 0;
      self->events_->deliver(name, std::move(payload));
      return 0;
    });
  }

  void submit(const std::string& command, const xpc::object& request, Done done) {
    std::string client = clientName_;
    auto args = [client, command, request](sd_bus_message* m) {
      return sd_bus_message_append(m, "ss", client.c_str(), command.c_str()) >= 0 &&
             bus::appendDictionary(m, request);
    };
    auto handle = [this, done = std::move(done), command, request,
                   root = root_](const bus::CallOutcome& outcome) {
      noteAccess(outcome.status);
      if (outcome.status == kResultServerNotRunning && command == kCommandGetTraceProperty)
        return answerFromTraceProperties(root, request, done);
      if (outcome.status != 0) return done({outcome.status, outcome.description}, {});
      TelephonyXPC::Result result;
      xpc::object response;
      if (!bus::readResultReply(outcome.message, result.status, result.description, response))
        return done({status::kMalformedReply, "reply has an unexpected signature"}, {});
      done(std::move(result), std::move(response));
    };
    link_->call(kPerform, std::move(args), timeoutFor(command), std::move(handle));
  }

  std::string clientName_;
  std::string root_;
  std::shared_ptr<Events> events_;
  bus::NameWatch server_;  // I/O thread only
  std::atomic<bool> denied_ = false;
  // Last, so it goes first: its shutdown fails pending calls while the
  // events and the queue are still there.
  std::unique_ptr<bus::BusLink> link_;
};

}  // namespace

std::shared_ptr<Manager> CreateManager(const std::string& clientName, dispatch::queue queue) {
  return std::make_shared<BusManager>(clientName, std::move(queue));
}

void RegisterEventHandler(std::shared_ptr<Manager> manager, const std::string& eventName,
                          EventHandler handler) {
  if (manager) manager->registerEventHandler(eventName, std::move(handler));
}

void EventsOff(std::shared_ptr<Manager> manager) {
  if (manager) manager->eventsOff();
}

void EventsOn(std::shared_ptr<Manager> manager) {
  if (manager) manager->eventsOn();
}

TelephonyXPC::Result PerformCommand(std::shared_ptr<Manager> manager, const std::string& command,
                                    xpc::object request, xpc::object& response) {
  if (!manager) {
    response = {};
    return {kResultServerNotRunning, "no manager"};
  }
  return manager->performCommand(command, request, response);
}

void PerformCommand(std::shared_ptr<Manager> manager, const std::string& command,
                    Completion completion, xpc::object request) {
  if (manager) return manager->performCommand(command, std::move(completion), request);
  if (completion) completion({kResultServerNotRunning, "no manager"}, {});
}

}  // namespace vorn::client
