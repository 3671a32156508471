// SPDX-License-Identifier: MIT
#include <sstream>

#include "framework/command_shell.h"

std::list<std::string> CommandShell::convertCmdArgsToList(int count, char* const* vector) {
  std::list<std::string> words;
  for (int i = 0; i < count; ++i) words.emplace_front(vector[i]);
  return words;
}

std::list<std::string> CommandShell::convertLineToList(const std::string& line) {
  std::list<std::string> words;
  std::istringstream stream(line);
  std::string word;
  while (stream >> word) words.push_front(std::move(word));
  return words;
}

std::vector<std::list<std::string>> CommandShell::splitCmdList(std::list<std::string> list) {
  std::vector<std::list<std::string>> groups;
  std::list<std::string> group;
  while (!list.empty()) {
    std::string word = std::move(list.back());
    list.pop_back();
    if (word == "--") {
      if (!group.empty()) groups.push_back(std::exchange(group, {}));
    } else {
      group.push_front(std::move(word));
    }
  }
  if (!group.empty()) groups.push_back(std::move(group));
  return groups;
}
