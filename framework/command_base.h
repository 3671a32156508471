// SPDX-License-Identifier: MIT
#pragma once

#include <list>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "platform/dispatch.h"

/// A handler gets the execution's group and its own copy of the words that
/// followed its name (first word last); true means success.
using CommandHandler = dispatch::block<bool(dispatch::group, std::list<std::string>)>;

/// The fixed words a handler's arguments may use, kept in the tree so that
/// completion (and anything else that lists the command words) reads them
/// from one place.
struct OptionWords {
  /// Arguments that come first and take any text (oslog's history and path);
  /// the words are offered only after them.
  std::size_t positionals = 0;
  std::vector<std::string> words;
  /// The options end at the first argument that is not one of `words` (the
  /// reason of "tel" and "bb"); otherwise they may appear anywhere.
  bool leadingOnly = false;

  bool operator==(const OptionWords&) const = default;
};

/// A node of the command tree: handlers with their help texts, and named
/// sub-commands. Subclasses fill the node in `registerCommands`, which `init`
/// calls once the node is owned by a shared pointer.
class CommandBase : public std::enable_shared_from_this<CommandBase> {
 public:
  virtual ~CommandBase() = default;

  /// Builds the hierarchy path from the parent's, then registers the node's
  /// entries. Call once, right after the node is put under a shared pointer.
  virtual void init();
  virtual void displayHelp();
  /// Whether the handler or sub-command `name` may be used now.
  virtual bool isAllowed(std::string name);
  virtual void registerCommands() = 0;

  /// An empty handler is ignored; an empty help text keeps an earlier one.
  void addCommandHandler(std::string name, CommandHandler handler, std::string help);
  /// As above, and records the option words of the handler's arguments.
  void addCommandHandler(std::string name, CommandHandler handler, std::string help,
                         OptionWords options);
  void addSubCommand(std::string name, std::shared_ptr<CommandBase> command);
  std::shared_ptr<CommandBase> getSubCommandObj(std::string name);
  bool isValidSubCommand(std::string name);
  bool isValidCommand(std::string name);
  std::string getHierarchy();
  std::weak_ptr<CommandBase> getParent();

  /// Handler names and listed sub-command names, in key order.
  std::vector<std::string> getHandlerNames() const;
  std::vector<std::string> getSubCommandNames() const;
  /// The option words registered with a handler; none for an unknown name.
  OptionWords getOptionWords(const std::string& handler) const;

  /// Runs the handler and returns its result once every membership of the
  /// execution's group has been left. Unknown names fail.
  bool execCommand(std::string name, std::list<std::string> args);

 protected:
  CommandBase(std::string name, std::weak_ptr<CommandBase> parent);

  /// A sub-command that the shell accepts but the help never lists.
  void addUnlistedSubCommand(std::string name, std::shared_ptr<CommandBase> command);

 private:
  friend void printCommandUsage(std::shared_ptr<CommandBase> command, int depth);

  std::weak_ptr<CommandBase> parent;
  std::string name;
  std::string hierarchy;
  std::map<std::string, CommandHandler> handlers;
  std::map<std::string, std::string> helpTexts;
  std::map<std::string, std::shared_ptr<CommandBase>> subCommands;
  std::map<std::string, std::shared_ptr<CommandBase>> unlistedSubCommands;
  std::map<std::string, OptionWords> optionWords;
};

/// Prints the usage line of `command`, indented by `depth` levels, then those
/// of its sub-commands one level deeper.
void printCommandUsage(std::shared_ptr<CommandBase> command, int depth);
