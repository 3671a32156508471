// SPDX-License-Identifier: MIT
#pragma once

#include <string>

#include "platform/xpc.h"
#include "platform/linux/bus_handles.h"
#include "server/common/daemon_loop.h"
#include "server/common/daemon_options.h"
#include "server/common/trace_properties.h"
#include "server/vornd/collection_line.h"

/// The server's bus object: org.vorn.Manager1 at /org/vorn/Manager.
namespace vorn::server {

class ManagerService {
 public:
  ManagerService(const ManagerOptions& options, DaemonLoop& loop, TraceProperties properties,
                 CollectionLine& line);

  /// Publishes the object and takes the name; the state is "Starting" until
  /// `announce` runs (now, or after --start-delay-ms).
  bool start(std::string* error);

  /// Emits the "Stopping" state and gives the name up.
  void stopping();

 private:
  struct Answer {
    int status = 0;
    std::string description;
    xpc::object response;
  };

  static int onHello(sd_bus_message* m, void* userdata, sd_bus_error* err);
  static int onPerformCommand(sd_bus_message* m, void* userdata, sd_bus_error* err);

  int hello(sd_bus_message* m, sd_bus_error* err);
  int performCommand(sd_bus_message* m, sd_bus_error* err);
  Answer getTraceProperty(const xpc::object& request) const;
  void traceDumpState(sd_bus_message* call, const xpc::object& request);

  void announce(const std::string& state);
  void reply(sd_bus_message* call, const Answer& answer);
  /// True when the test switches (testing builds only) took this command
  /// over: answered it, dropped it or ended the process.
  bool misbehave(sd_bus_message* call, const std::string& command);

  const ManagerOptions& options_;
  DaemonLoop& loop_;
  TraceProperties properties_;
  CollectionLine& line_;
  bus::SlotPtr slot_;
  std::string state_ = "Starting";
};

}  // namespace vorn::server
