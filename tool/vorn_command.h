// SPDX-License-Identifier: MIT
#pragma once

#include "toolbase/vorn_command_base.h"

/// The root of the tool's tree, named after the program; its only child is
/// "logdump".
class VornCommand : public VornCommandBase {
 public:
  /// With this machine's device and helper service.
  static std::shared_ptr<CommandBase> create(std::string name, std::weak_ptr<CommandBase> parent,
                                             std::shared_ptr<vorn::client::Manager> manager,
                                             dispatch::queue queue);
  static std::shared_ptr<CommandBase> create(std::string name, std::weak_ptr<CommandBase> parent,
                                             ToolContext context);
  void registerCommands() override;

 private:
  using VornCommandBase::VornCommandBase;
};
