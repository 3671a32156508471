// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string>

#include "toolbase/vorn_command_base.h"

/// The "logdump" node: the "tel", "core", "bb" and "oslog" collections.
/// Everything but "bb" needs a running server.
class LogdumpCommand : public VornCommandBase {
 public:
  /// With this machine's device and helper service.
  static std::shared_ptr<LogdumpCommand> create(std::string name, std::weak_ptr<CommandBase> parent,
                                                std::shared_ptr<vorn::client::Manager> manager,
                                                dispatch::queue queue);
  static std::shared_ptr<LogdumpCommand> create(std::string name, std::weak_ptr<CommandBase> parent,
                                                ToolContext context);

  bool isAllowed(std::string name) override;
  void registerCommands() override;

 private:
  using VornCommandBase::VornCommandBase;
};

/// Asks the server for the system-logs trace mode; true only for a valid 3.
/// Any failure counts as another mode.
bool isSystemLogsTraceMode3(LogdumpCommand& command);
