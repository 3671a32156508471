// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>

#include <functional>
#include <string>

namespace vorn::bus {

/// Follows which connection owns one well-known name, as the bus itself tells
/// it: GetNameOwner once per connection, then NameOwnerChanged from
/// org.freedesktop.DBus. The sender of a message is the unique name that the
/// bus stamps on it, so comparing it with the owner tells the service's own
/// signals from anyone else's. Lives on the I/O thread of its connection.
class NameWatch {
 public:
  struct Handlers {
    /// The name has lost its owner.
    std::function<void()> lost;
    /// Another connection owns the name now. The owner found by the very
    /// first question is not announced: whoever asked is talking to it already.
    std::function<void()> gained;
  };

  NameWatch(std::string name, Handlers handlers);
  NameWatch(const NameWatch&) = delete;
  NameWatch& operator=(const NameWatch&) = delete;

  /// Starts following the name on a new connection. Call it before anything
  /// else is sent there: the bus handles a connection's messages in order, so
  /// every answer to a later call comes after the subscription is in force and
  /// after the owner's answer.
  void attach(sd_bus* bus);
  /// True when `sender` (a unique name, or null) owns the name.
  bool isOwner(const char* sender) const;

 private:
  static int onOwnerChanged(sd_bus_message* m, void* userdata, sd_bus_error* error);
  static int onOwnerAnswer(sd_bus_message* m, void* userdata, sd_bus_error* error);
  void update(const std::string& owner, bool announce);

  std::string name_;
  Handlers handlers_;
  std::string owner_;     // empty: no owner, or none known on this connection yet
  bool settled_ = false;  // the first connection's question has been answered
};

}  // namespace vorn::bus
