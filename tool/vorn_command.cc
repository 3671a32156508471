// SPDX-License-Identifier: MIT
#include "tool/vorn_command.h"

#include "logdump/logdump_command.h"

std::shared_ptr<CommandBase> VornCommand::create(std::string name, std::weak_ptr<CommandBase> parent,
                                                 std::shared_ptr<vorn::client::Manager> manager,
                                                 dispatch::queue queue) {
  return create(std::move(name), std::move(parent),
                ToolContext::onThisDevice(std::move(manager), std::move(queue)));
}

std::shared_ptr<CommandBase> VornCommand::create(std::string name, std::weak_ptr<CommandBase> parent,
                                                 ToolContext context) {
  std::shared_ptr<VornCommand> command(
      new VornCommand(std::move(name), std::move(parent), std::move(context)));
  command->init();
  return command;
}

void VornCommand::registerCommands() {
  std::weak_ptr<CommandBase> self = shared_from_this();
  addSubCommand("logdump", LogdumpCommand::create("logdump", self, context));
}
