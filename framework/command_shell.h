// SPDX-License-Identifier: MIT
#pragma once

#include <list>
#include <memory>
#include <string>
#include <vector>

#include "framework/command_base.h"
#include "framework/line_reader.h"

/// Drives a command tree: once over the command line's words, or as an
/// interactive prompt when no words were given. The prompt's lines come from
/// a line reader, by default the plain one on standard input and output.
///
/// Word lists hold their words last-first: the next word is `back()`.
class CommandShell {
 public:
  CommandShell() = default;
  virtual ~CommandShell() = default;

  /// The root of a fully built tree, or empty when it cannot be built.
  virtual std::shared_ptr<CommandBase> createRootCommand() = 0;

  /// `words` is the whole argument list, program name included (last).
  /// True when the session succeeded.
  bool run(std::list<std::string> words);

  /// Replaces the reader of the interactive prompt; call before `run`.
  void setLineReader(std::unique_ptr<LineReader> reader);

  static std::list<std::string> convertCmdArgsToList(int count, char* const* vector);
  static std::list<std::string> convertLineToList(const std::string& line);
  /// Cuts at "--" into non-empty groups, in typed order; empties `list`.
  static std::vector<std::list<std::string>> splitCmdList(std::list<std::string> list);

 private:
  enum class Outcome { failure, success, quit };

  Outcome runGroup(std::list<std::string> words);
  Outcome changeDirectory(std::list<std::string>& rest);
  void reportInvalid(const std::string& word);

  std::shared_ptr<CommandBase> rootCommand;
  std::shared_ptr<CommandBase> workingCommand;
  std::shared_ptr<CommandBase> currentCommand;
  std::unique_ptr<LineReader> lineReader = std::make_unique<PlainLineReader>();
};
