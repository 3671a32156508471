// SPDX-License-Identifier: MIT
#pragma once

#include "framework/command_shell.h"

/// The tool's shell: connects to the server, learns within 500 ms whether it
/// has started, and builds the tool's command tree.
class VornShell : public CommandShell {
 public:
  std::shared_ptr<CommandBase> createRootCommand() override;
};
