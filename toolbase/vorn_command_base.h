// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string>

#include "framework/command_base.h"
#include "platform/dispatch.h"
#include "platform/vorn_client.h"
#include "toolbase/tool_context.h"

/// A command of the tool: a command node that also holds the tool's context
/// (the server connection, the tool's queue, the device, the helper service),
/// shared by the whole tree.
class VornCommandBase : public CommandBase {
 public:
  const std::shared_ptr<vorn::client::Manager>& getManager() const { return context.manager; }
  const dispatch::queue& getQueue() const { return context.queue; }
  const ToolContext& getContext() const { return context; }

 protected:
  /// With this machine's device and helper service.
  VornCommandBase(std::string commandName, std::weak_ptr<CommandBase> parentCommand,
                  std::shared_ptr<vorn::client::Manager> manager, dispatch::queue queue)
      : VornCommandBase(std::move(commandName), std::move(parentCommand),
                        ToolContext::onThisDevice(std::move(manager), std::move(queue))) {}
  VornCommandBase(std::string commandName, std::weak_ptr<CommandBase> parentCommand,
                  ToolContext toolContext)
      : CommandBase(std::move(commandName), std::move(parentCommand)),
        context(std::move(toolContext)) {}

  ToolContext context;
};
