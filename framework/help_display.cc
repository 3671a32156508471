// SPDX-License-Identifier: MIT
#include <iomanip>
#include <iostream>

#include "framework/colour.h"
#include "framework/command_base.h"

namespace {
constexpr int kColumn = 16;
}  // namespace

void CommandBase::displayHelp() {
  auto& out = std::cout;
  out << std::endl;
  out << "Options for command '" << colour::green() << name << colour::defaultColour()
      << "':" << std::endl;
  out << std::endl;
  for (const auto& [handlerName, handler] : handlers) {
    auto help = helpTexts.find(handlerName);
    out << "\t" << std::setw(kColumn) << handlerName << "  -  "
        << (help == helpTexts.end() ? std::string("...") : help->second) << std::endl;
    out << std::endl;
  }
  for (const auto& [childName, child] : subCommands) {
    printCommandUsage(child, 0);
    out << std::endl;
  }
  out << "\t" << std::setw(kColumn) << "cd" << "  -  " << "<sub-command>" << std::endl;
  out << "\t" << std::setw(kColumn) << "help" << std::endl;
  out << "\t" << std::setw(kColumn) << "back" << std::endl;
  out << "\t" << std::setw(kColumn) << "quit" << std::endl;
  out << std::endl;
}

void printCommandUsage(std::shared_ptr<CommandBase> command, int depth) {
  if (!command) return;
  auto& out = std::cout;
  auto handlers = command->handlers;
  auto subCommands = command->subCommands;
  if (!handlers.empty()) {
    std::string options = "[";
    for (const auto& entry : handlers) options += entry.first + "|";
    options.back() = ']';
    out << "\t";
    for (int i = 0; i < depth; ++i) out << std::setw(kColumn) << "";
    if (depth == 0)
      out << std::setw(kColumn) << command->name;
    else
      out << "     " << "<" << command->name << ">";
    out << "  -  " << options << std::endl;
  }
  for (const auto& entry : subCommands) printCommandUsage(entry.second, depth + 1);
}
