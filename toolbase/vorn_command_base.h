// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string>

#include "framework/command_base.h"
#include "platform/dispatch.h"
#include "platform/vorn_client.h"

/// A command of the tool: a command node that also holds the server
/// connection and the tool's queue, both shared by the whole tree.
class VornCommandBase : public CommandBase {
 public:
  const std::shared_ptr<vorn::client::Manager>& getManager() const { return manager; }
  const dispatch::queue& getQueue() const { return queue; }

 protected:
  VornCommandBase(std::string name, std::weak_ptr<CommandBase> parent,
                  std::shared_ptr<vorn::client::Manager> manager, dispatch::queue queue)
      : CommandBase(std::move(name), std::move(parent)),
        manager(std::move(manager)),
        queue(std::move(queue)) {}

  std::shared_ptr<vorn::client::Manager> manager;
  dispatch::queue queue;
};
