// SPDX-License-Identifier: MIT
#pragma once

#include "framework/command_shell.h"
#include "platform/vorn_client.h"
#include "toolbase/tool_context.h"

/// The tool's shell: connects to the server, learns within 500 ms whether it
/// has started, and builds the tool's command tree.
class VornShell : public CommandShell {
 public:
  /// Over the D-Bus server link, this machine's device and helper service.
  VornShell();
  /// Connects with `connect`; the commands get everything else from `base`,
  /// whose manager and queue the shell fills in.
  VornShell(vorn::client::ManagerFactory connect, ToolContext base);

  std::shared_ptr<CommandBase> createRootCommand() override;

 private:
  vorn::client::ManagerFactory connectServer;
  ToolContext baseContext;
};
