// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "platform/linux/bus_message.h"
#include "platform/result.h"
#include "platform/xpc.h"

/// One connection to the system bus, owned by one I/O thread. sd_bus objects
/// are not thread-safe, so every use of the connection happens on that thread;
/// other threads hand it calls through a locked queue and wake it with an
/// eventfd.
namespace vorn::bus {

/// Where a method call goes.
struct CallTarget {
  const char* destination;
  const char* path;
  const char* interface;
  const char* member;
};

/// The outcome of one call as seen from the bus. `message` is the reply, valid
/// only during the handler and only when `status` is 0.
struct CallOutcome {
  std::int32_t status = 0;
  std::string description;
  sd_bus_message* message = nullptr;
};

/// Appends the call's arguments; false when they cannot be encoded.
using ArgumentWriter = std::function<bool(sd_bus_message*)>;
/// Called exactly once, on the I/O thread, with the outcome of a call.
using OutcomeHandler = std::function<void(const CallOutcome&)>;
/// Called on the I/O thread after each (re)connection, before any call is
/// sent on it: the place to add signal matches.
using ConnectHook = std::function<void(sd_bus*)>;

/// The call timeout in force: `wanted`, capped by VORN_CALL_TIMEOUT_MS when
/// that variable holds a positive number of milliseconds. The variable exists
/// for tests only, so that a call that never gets an answer fails in a second
/// rather than in 25 s or 15 minutes; the tool itself never sets it.
std::chrono::microseconds callTimeout(std::chrono::microseconds wanted);

/// Where a synchronous call's outcome meets the thread that waits for it:
/// the handler delivers on the I/O thread, the caller waits. The call's own
/// timeout bounds the wait, since every handler runs exactly once.
class SyncReply {
 public:
  void deliver(TelephonyXPC::Result result, xpc::object response) {
    std::lock_guard lock(mutex_);
    result_ = std::move(result);
    response_ = std::move(response);
    done_ = true;
    delivered_.notify_all();
  }
  TelephonyXPC::Result wait(xpc::object& response) {
    std::unique_lock lock(mutex_);
    delivered_.wait(lock, [&] { return done_; });
    response = response_;
    return result_;
  }

 private:
  std::mutex mutex_;
  std::condition_variable delivered_;
  bool done_ = false;
  TelephonyXPC::Result result_;
  xpc::object response_;
};

class BusLink {
 public:
  explicit BusLink(ConnectHook onConnect = {});
  /// Fails every call not yet answered (status 0xE020E002) and stops the
  /// thread. Must not run on the I/O thread itself.
  ~BusLink();
  BusLink(const BusLink&) = delete;
  BusLink& operator=(const BusLink&) = delete;

  /// Sends a call from any thread. When no bus can be reached the handler
  /// gets 0xE020E001, and the next call tries to connect again.
  void call(CallTarget target, ArgumentWriter args, std::chrono::microseconds timeout,
            OutcomeHandler handler);

 private:
  struct Request {
    CallTarget target;
    ArgumentWriter args;
    std::chrono::microseconds timeout;
    OutcomeHandler handler;
  };

  void run();
  void send(Request& request);
  sd_bus* connection();
  void wake();

  ConnectHook onConnect_;
  int wakeFd_ = -1;
  std::mutex mutex_;
  std::deque<Request> requests_;
  bool stopping_ = false;
  BusPtr bus_;  // I/O thread only
  std::thread thread_;
};

}  // namespace vorn::bus
