// SPDX-License-Identifier: MIT
#pragma once

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "platform/xpc.h"
#include "server/common/bus_handles.h"

/// What the end-to-end tests need to drive the daemons: child processes, a
/// private dbus-daemon and a small sd-bus client.
namespace harness {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

/// A child process, ended (TERM, then KILL) when the object goes.
class Process {
 public:
  Process() = default;
  Process(const Process&) = delete;
  Process& operator=(const Process&) = delete;
  ~Process() { terminate(); }

  /// Starts `argv` with `extraEnv` ("KEY=VALUE") added to ours. Standard
  /// output goes to `stdoutFd` when given; `fileSizeLimit` caps the size of
  /// any file the child writes (RLIMIT_FSIZE), standing in for a full disk.
  bool start(const std::vector<std::string>& argv, const std::vector<std::string>& extraEnv = {},
             int stdoutFd = -1, std::optional<unsigned long> fileSizeLimit = std::nullopt);
  pid_t pid() const { return pid_; }
  bool running() const { return pid_ > 0; }

  /// The exit status (or 128 + signal) once it ends; empty at the deadline.
  std::optional<int> waitExit(std::chrono::milliseconds limit);
  void signal(int sig) const;
  void terminate();

 private:
  pid_t pid_ = -1;
};

/// A dbus-daemon on a socket of its own, with the project's bus policy.
class PrivateBus {
 public:
  PrivateBus(const std::string& dir, const std::string& config);
  bool ok() const { return !address_.empty(); }
  const std::string& address() const { return address_; }
  std::string env() const { return "DBUS_SYSTEM_BUS_ADDRESS=" + address_; }

 private:
  Process daemon_;
  std::string address_;
};

struct Reply {
  std::string error;  // D-Bus error name; empty on a method return
  int status = 0;
  std::string description;
  xpc::object response;
};

struct Event {
  std::string name;
  std::string state;  // the ServerState entry of the payload
};

/// A client connection that records the server's Event signals.
class Client {
 public:
  bool connect(const std::string& address);
  sd_bus* bus() const { return bus_.get(); }

  Reply hello(std::chrono::milliseconds timeout = 5s);
  Reply perform(const std::string& command, const xpc::object& request, std::chrono::milliseconds timeout = 20s);
  Reply helper(std::uint32_t task, const std::string& command, const xpc::object& request,
               std::chrono::milliseconds timeout = 5s);
  /// Calls PerformCommand without waiting; the reply lands in `*out` and
  /// `*done` becomes true (both must outlive the call).
  bool performAsync(const std::string& command, const xpc::object& request, Reply* out, bool* done);
  /// Any method call whose arguments `append` writes; for malformed requests.
  Reply raw(const char* destination, const char* path, const char* interface, const char* member,
            const std::function<int(sd_bus_message*)>& append, std::chrono::milliseconds timeout = 5s);

  bool hasOwner(const std::string& name);
  /// Processes the bus until `done` holds or the time is up.
  bool waitFor(const std::function<bool()>& done, std::chrono::milliseconds limit);

  const std::vector<Event>& events() const { return events_; }

 private:
  static int onEvent(sd_bus_message* m, void* userdata, sd_bus_error*);

  vorn::server::BusPtr bus_;
  vorn::server::SlotPtr match_;
  std::vector<Event> events_;
};

/// Decodes a reply of signature (isa{sv}) or (a{sv}).
Reply decodeReply(sd_bus_message* m, const sd_bus_error* error);

}  // namespace harness
