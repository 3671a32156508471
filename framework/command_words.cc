// SPDX-License-Identifier: MIT
#include "framework/command_words.h"

namespace {

void collect(const std::shared_ptr<CommandBase>& node, std::vector<CommandWords>& into) {
  CommandWords words;
  words.hierarchy = node->getHierarchy();
  words.subCommands = node->getSubCommandNames();
  for (auto& name : node->getHandlerNames()) {
    OptionWords options = node->getOptionWords(name);
    words.handlers.push_back({std::move(name), std::move(options)});
  }
  into.push_back(std::move(words));
  for (const auto& child : node->getSubCommandNames()) collect(node->getSubCommandObj(child), into);
}

}  // namespace

std::vector<CommandWords> collectCommandWords(const std::shared_ptr<CommandBase>& root) {
  std::vector<CommandWords> all;
  if (root) collect(root, all);
  return all;
}
