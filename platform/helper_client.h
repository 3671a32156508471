// SPDX-License-Identifier: MIT
#pragma once

#include <functional>
#include <memory>

#include "platform/result.h"
#include "platform/protocol/protocol.h"
#include "platform/xpc.h"

namespace rilx {
class LogServer;
}

namespace vorn {

/// Client of the server's helper service.
class HelperClient {
 public:
  virtual ~HelperClient() = default;

  /// A client of the helper service over D-Bus for `clientName`, or an empty
  /// pointer when none can be made.
  static std::shared_ptr<HelperClient> create(const char* clientName,
                                              std::shared_ptr<rilx::LogServer> logServer);

  /// Whatever makes a client as `create` does: `create` itself, or a test's.
  using Factory = std::function<std::shared_ptr<HelperClient>(
      const char* clientName, std::shared_ptr<rilx::LogServer> logServer)>;

  /// Synchronous; may replace `response`.
  virtual TelephonyXPC::Result perform(helper::TaskID task, const char* command,
                                       xpc::dict request, xpc::dict& response) = 0;
};

}  // namespace vorn
