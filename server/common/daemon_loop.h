// SPDX-License-Identifier: MIT
#pragma once

#include <functional>
#include <string>

#include "platform/linux/bus_handles.h"

/// The event loop both daemons run: the system bus, SIGTERM/SIGINT, and
/// timers for delayed answers, all on one thread.
namespace vorn::server {

class DaemonLoop {
 public:
  DaemonLoop() = default;
  DaemonLoop(const DaemonLoop&) = delete;
  DaemonLoop& operator=(const DaemonLoop&) = delete;

  /// Blocks SIGTERM and SIGINT for this thread and every thread started
  /// after it (they arrive through the loop instead), connects to the
  /// system bus and attaches it. `onStop` runs once when a signal comes,
  /// before the loop ends.
  bool open(std::function<void()> onStop, std::string* error);

  sd_bus* bus() const { return bus_.get(); }
  sd_event* event() const { return event_.get(); }

  /// Runs `fn` on the loop after `delayMs` (0: on the next iteration).
  bool after(long delayMs, std::function<void()> fn);

  /// Sends `reply` after `delayMs`; the reply is held until then.
  void sendReply(bus::MessagePtr reply, long delayMs);

  /// Takes a well-known name; false (with `error`) when the bus refuses.
  bool requestName(const char* name, std::string* error);
  /// Gives the name up and flushes, so a watcher sees it go before we exit.
  void releaseName(const char* name);

  /// Runs until a signal arrives or `exit` is called; the exit code.
  int run();
  void exit(int code);

 private:
  static int onSignal(sd_event_source* s, const struct signalfd_siginfo* si, void* userdata);

  bus::EventPtr event_;
  bus::BusPtr bus_;
  bus::EventSourcePtr sigterm_;
  bus::EventSourcePtr sigint_;
  std::function<void()> onStop_;
  bool stopping_ = false;
};

}  // namespace vorn::server
