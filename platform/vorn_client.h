// SPDX-License-Identifier: MIT
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "platform/dispatch.h"
#include "platform/result.h"
#include "platform/protocol/protocol.h"
#include "platform/xpc.h"

/// The server's client library. `CreateManager` connects over D-Bus.
namespace vorn::client {

/// Called with the event's payload (possibly null) and a group that the
/// library may hand out; the tool ignores the group.
using EventHandler = dispatch::block<void(xpc::object payload, dispatch::group group)>;
/// Called exactly once with the outcome and the response (null on failure).
using Completion = dispatch::block<void(TelephonyXPC::Result result, xpc::object response)>;

/// One client's link to the server.
class Manager {
 public:
  virtual ~Manager() = default;

  /// Keeps a copy of `handler` and calls it on the client's queue for each
  /// event of that name while events are on. A later handler replaces it.
  virtual void registerEventHandler(const std::string& eventName, EventHandler handler) = 0;
  virtual void eventsOff() = 0;
  /// Starts event delivery and delivers the server's current state to the
  /// server-state handler as if it were that event.
  virtual void eventsOn() = 0;
  /// Blocks until the server answers or the call times out.
  virtual TelephonyXPC::Result performCommand(const std::string& command,
                                              const xpc::object& request,
                                              xpc::object& response) = 0;
  /// Returns at once; `completion` runs later on the client's queue.
  virtual void performCommand(const std::string& command, Completion completion,
                              const xpc::object& request) = 0;
  /// True when the bus refused this client's last word with the server (its
  /// policy admits root and the group "vorn" only) and the server has not
  /// answered it since. A caller that finds the server silent can say why.
  virtual bool accessDenied() const = 0;
};

/// Whatever opens a client as `CreateManager` does: `CreateManager` itself, or
/// a test's.
using ManagerFactory =
    std::function<std::shared_ptr<Manager>(const std::string& clientName, dispatch::queue queue)>;

std::shared_ptr<Manager> CreateManager(const std::string& clientName, dispatch::queue queue);
void RegisterEventHandler(std::shared_ptr<Manager> manager, const std::string& eventName,
                          EventHandler handler);
void EventsOff(std::shared_ptr<Manager> manager);
void EventsOn(std::shared_ptr<Manager> manager);
TelephonyXPC::Result PerformCommand(std::shared_ptr<Manager> manager, const std::string& command,
                                    xpc::object request, xpc::object& response);
void PerformCommand(std::shared_ptr<Manager> manager, const std::string& command,
                    Completion completion, xpc::object request);

}  // namespace vorn::client
