// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "platform/xpc.h"

namespace vorn::test {

/// A stand-in for the server or its helper on the private bus, on its own
/// thread and connection, answering each command as scripted. Unscripted
/// commands succeed and echo the request as the response.
class ScriptedPeer {
 public:
  enum class Service { manager, helper };
  enum class Act {
    answer,          // reply (status, "scripted", response)
    wrongSignature,  // reply with a lone string
    noReply,         // never reply
    exit,            // drop the connection without replying
  };
  struct Script {
    Act act = Act::answer;
    std::int32_t status = 0;
    xpc::object response;
  };
  struct Received {
    std::string member;
    std::string client;
    std::uint32_t task = 0;
    std::string command;
    xpc::object request;
  };

  explicit ScriptedPeer(Service service);
  ~ScriptedPeer();

  /// True once the peer owns its name.
  bool ok() const { return owned_; }
  /// How to answer `command` (or "Hello", for the manager).
  void script(const std::string& command, Script script);
  /// The state that Hello answers.
  void setState(xpc::object state);
  /// Emits Event(name, payload) from the manager object.
  void emit(const std::string& name, xpc::object payload);
  /// Waits at most `limit` until `count` calls have arrived; a copy of all.
  std::vector<Received> waitForCalls(std::size_t count, std::chrono::milliseconds limit);

 private:
  static int onCall(sd_bus_message* m, void* userdata, sd_bus_error* error);
  int handle(sd_bus_message* m);
  void run();

  Service service_;
  sd_bus* bus_ = nullptr;  // peer thread only once started
  std::atomic<bool> owned_ = false;
  bool closed_ = false;    // peer thread only
  std::mutex mutex_;
  std::condition_variable changed_;
  bool stop_ = false;
  std::map<std::string, Script> scripts_;
  xpc::object state_;
  std::vector<std::function<void()>> tasks_;
  std::vector<Received> received_;
  std::vector<sd_bus_message*> unanswered_;
  std::thread thread_;
};

}  // namespace vorn::test
