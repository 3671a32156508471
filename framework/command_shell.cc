// SPDX-License-Identifier: MIT
#include "framework/command_shell.h"

#include <iostream>

#include "framework/colour.h"
#include "framework/completion.h"

bool CommandShell::run(std::list<std::string> words) {
  rootCommand = createRootCommand();
  if (!rootCommand) return false;
  currentCommand = rootCommand;
  if (!words.empty()) words.pop_back();  // the program's name
  if (words.empty()) {
    workingCommand = rootCommand;
    // The reader completes between lines, when the working command is where
    // the next line starts.
    lineReader->setCompleter(
        [this](std::string_view beforeCursor) { return completeLine(workingCommand, beforeCursor); });
  }
  auto groups = splitCmdList(words);

  bool success = true;
  for (;;) {
    for (auto& group : groups) {
      Outcome outcome = runGroup(std::move(group));
      if (outcome == Outcome::quit) return true;
      currentCommand = workingCommand ? workingCommand : rootCommand;
      // Once false, the flag stays false: later lines run their first group only.
      success = success && outcome == Outcome::success;
      if (!success) break;
    }
    if (!workingCommand) return success;

    currentCommand = workingCommand;
    std::string line;
    if (!lineReader->readLine("(" + currentCommand->getHierarchy() + ")>> ", line)) return false;
    groups = splitCmdList(convertLineToList(line));
  }
}

void CommandShell::setLineReader(std::unique_ptr<LineReader> reader) {
  if (reader) lineReader = std::move(reader);
}

CommandShell::Outcome CommandShell::runGroup(std::list<std::string> words) {
  const std::size_t count = words.size();
  while (!words.empty()) {
    std::string word = std::move(words.back());
    words.pop_back();

    if (word == "cd") return changeDirectory(words);
    if (currentCommand->isValidCommand(word)) {
      if (!currentCommand->isAllowed(word)) return Outcome::failure;
      return currentCommand->execCommand(word, std::move(words)) ? Outcome::success
                                                                 : Outcome::failure;
    }
    if (currentCommand->isValidSubCommand(word)) {
      if (!currentCommand->isAllowed(word)) return Outcome::failure;
      currentCommand = currentCommand->getSubCommandObj(word);
      if (words.empty()) {
        currentCommand->displayHelp();
        return Outcome::failure;
      }
      continue;
    }
    if (word == "help" && words.empty()) {
      currentCommand->displayHelp();
      return Outcome::success;
    }
    // Navigation words count only when they stand alone in their group.
    if (count != 1) {
      reportInvalid(word);
      return Outcome::failure;
    }
    if (word == "back") {
      if (workingCommand) {
        if (auto parent = workingCommand->getParent().lock()) workingCommand = parent;
      }
      return Outcome::success;
    }
    if (word == "quit" || word == "exit") return Outcome::quit;
    reportInvalid(word);
    return Outcome::failure;
  }
  return Outcome::success;
}

CommandShell::Outcome CommandShell::changeDirectory(std::list<std::string>& rest) {
  if (rest.size() != 1) {
    currentCommand->displayHelp();
    return Outcome::failure;
  }
  std::string path = rest.back();
  for (char& c : path)
    if (c == '/') c = ' ';
  // Components in typed order: the word list holds them last-first.
  auto components = convertLineToList(path);
  while (!components.empty()) {
    std::string component = std::move(components.back());
    components.pop_back();
    if (currentCommand->isValidSubCommand(component)) {
      currentCommand = currentCommand->getSubCommandObj(component);
    } else if (component == "..") {
      if (auto parent = currentCommand->getParent().lock()) currentCommand = parent;
    } else {
      currentCommand->displayHelp();
      return Outcome::failure;
    }
  }
  if (workingCommand) workingCommand = currentCommand;
  return Outcome::success;
}

void CommandShell::reportInvalid(const std::string& word) {
  std::cout << std::endl;
  std::cout << "Invalid command option '" << colour::red() << word << colour::defaultColour() << "'";
  currentCommand->displayHelp();
}
