// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "framework/command_base.h"

/// The words one node of the tree accepts: what completion offers there and
/// what completion scripts outside the program must agree with.
struct CommandWords {
  struct Handler {
    std::string name;
    OptionWords options;

    bool operator==(const Handler&) const = default;
  };
  std::string hierarchy;
  std::vector<std::string> subCommands;
  std::vector<Handler> handlers;

  bool operator==(const CommandWords&) const = default;
};

/// Every node from `root` down, each before its sub-commands, in key order;
/// nodes the help does not list are left out as well.
std::vector<CommandWords> collectCommandWords(const std::shared_ptr<CommandBase>& root);
