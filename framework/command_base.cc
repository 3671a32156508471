// SPDX-License-Identifier: MIT
#include "framework/command_base.h"

#include <utility>

CommandBase::CommandBase(std::string commandName, std::weak_ptr<CommandBase> parentCommand)
    : parent(std::move(parentCommand)), name(std::move(commandName)) {}

void CommandBase::init() {
  // The parent stays locked until registration is over, so children created
  // there find its path complete.
  auto lockedParent = parent.lock();
  if (lockedParent) hierarchy = lockedParent->hierarchy;
  hierarchy += "/";
  hierarchy += name;
  registerCommands();
}

bool CommandBase::isAllowed(std::string) { return true; }

void CommandBase::addCommandHandler(std::string handlerName, CommandHandler handler, std::string help) {
  if (!handler) return;
  handlers.insert_or_assign(handlerName, std::move(handler));
  if (!help.empty()) helpTexts.insert_or_assign(std::move(handlerName), std::move(help));
}

void CommandBase::addCommandHandler(std::string handlerName, CommandHandler handler, std::string help,
                                    OptionWords options) {
  if (!handler) return;
  optionWords.insert_or_assign(handlerName, std::move(options));
  addCommandHandler(std::move(handlerName), std::move(handler), std::move(help));
}

void CommandBase::addSubCommand(std::string commandName, std::shared_ptr<CommandBase> command) {
  if (command) subCommands.insert_or_assign(std::move(commandName), std::move(command));
}

void CommandBase::addUnlistedSubCommand(std::string commandName, std::shared_ptr<CommandBase> command) {
  if (command) unlistedSubCommands.insert_or_assign(std::move(commandName), std::move(command));
}

std::shared_ptr<CommandBase> CommandBase::getSubCommandObj(std::string commandName) {
  if (auto found = subCommands.find(commandName); found != subCommands.end()) return found->second;
  if (auto found = unlistedSubCommands.find(commandName); found != unlistedSubCommands.end())
    return found->second;
  return nullptr;
}

bool CommandBase::isValidSubCommand(std::string commandName) {
  return subCommands.contains(commandName) || unlistedSubCommands.contains(commandName);
}

bool CommandBase::isValidCommand(std::string commandName) { return handlers.contains(commandName); }

std::string CommandBase::getHierarchy() { return hierarchy; }

std::weak_ptr<CommandBase> CommandBase::getParent() { return parent; }

namespace {
template <typename Map>
std::vector<std::string> keysOf(const Map& table) {
  std::vector<std::string> keys;
  keys.reserve(table.size());
  for (const auto& entry : table) keys.push_back(entry.first);
  return keys;
}
}  // namespace

std::vector<std::string> CommandBase::getHandlerNames() const { return keysOf(handlers); }

std::vector<std::string> CommandBase::getSubCommandNames() const { return keysOf(subCommands); }

OptionWords CommandBase::getOptionWords(const std::string& handler) const {
  auto found = optionWords.find(handler);
  return found == optionWords.end() ? OptionWords{} : found->second;
}

bool CommandBase::execCommand(std::string commandName, std::list<std::string> args) {
  auto found = handlers.find(commandName);
  if (found == handlers.end()) return false;
  dispatch::group group;
  // The handler is copied so that it lives through the call even if it
  // re-registers itself.
  CommandHandler handler = found->second;
  bool result = handler(group, std::move(args));
  group.wait();
  return result;
}
