// SPDX-License-Identifier: MIT
#pragma once

#include <string>

#include "platform/xpc.h"
#include "platform/linux/bus_handles.h"
#include "server/common/daemon_loop.h"
#include "server/common/daemon_options.h"

/// The helper service's bus object: org.vorn.Helper1 at /org/vorn/Helper.
namespace vorn::server {

struct HelperAnswer {
  int status = 0;
  std::string description;
  xpc::object response;
};

/// Answers one Perform request against the platform root: DiagsnapStatus
/// (task 4) names the newest baseband snapshot directory.
HelperAnswer performHelperTask(const std::string& root, std::uint32_t task, const std::string& command,
                               const xpc::object& request);

class HelperService {
 public:
  HelperService(const HelperOptions& options, DaemonLoop& loop);
  bool start(std::string* error);
  void stopping();

 private:
  static int onPerform(sd_bus_message* m, void* userdata, sd_bus_error* err);
  int perform(sd_bus_message* m);

  const HelperOptions& options_;
  DaemonLoop& loop_;
  bus::SlotPtr slot_;
};

}  // namespace vorn::server
