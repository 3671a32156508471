// SPDX-License-Identifier: MIT
#pragma once

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "framework/command_base.h"
#include "framework/command_shell.h"
#include "stdio_capture.h"

/// A handler that does nothing and succeeds.
inline const CommandHandler kSucceed = [](dispatch::group, std::list<std::string>) { return true; };

/// A node whose handlers and children are given as data, for driving the
/// framework without the tool.
class TestCommand : public CommandBase {
 public:
  struct Layout {
    std::string name;
    std::vector<std::pair<std::string, std::string>> handlers = {};  // name, help
    std::vector<Layout> children = {};
    std::vector<std::string> refused = {};  // names isAllowed refuses
  };

  static std::shared_ptr<TestCommand> create(Layout layout, std::weak_ptr<CommandBase> parent = {},
                                             std::vector<std::string>* calls = nullptr) {
    auto node = std::shared_ptr<TestCommand>(new TestCommand(std::move(layout), parent, calls));
    node->init();
    return node;
  }

  bool isAllowed(std::string commandName) override {
    return std::find(layout_.refused.begin(), layout_.refused.end(), commandName) == layout_.refused.end();
  }

  void registerCommands() override {
    for (auto& [handler, help] : layout_.handlers) {
      std::string label = layout_.name + ":" + handler;
      addCommandHandler(
          handler,
          [label, calls = calls_](dispatch::group, std::list<std::string> args) {
            std::string call = label;
            for (auto it = args.rbegin(); it != args.rend(); ++it) call += " " + *it;
            if (calls) calls->push_back(call);
            // A handler named "fail..." reports failure.
            return label.find(":fail") == std::string::npos;
          },
          help);
    }
    for (auto& child : layout_.children) addSubCommand(child.name, create(child, weak_from_this(), calls_));
  }

 private:
  TestCommand(Layout layout, std::weak_ptr<CommandBase> parentCommand, std::vector<std::string>* calls)
      : CommandBase(layout.name, std::move(parentCommand)), layout_(std::move(layout)), calls_(calls) {}
  Layout layout_;
  std::vector<std::string>* calls_;
};

/// A shell over a tree made from a layout; none for a layout without a name.
class TestShell : public CommandShell {
 public:
  explicit TestShell(TestCommand::Layout layout, std::vector<std::string>* calls = nullptr)
      : layout_(std::move(layout)), calls_(calls) {}
  std::shared_ptr<CommandBase> createRootCommand() override {
    if (layout_.name.empty()) return nullptr;
    return TestCommand::create(layout_, {}, calls_);
  }

 private:
  TestCommand::Layout layout_;
  std::vector<std::string>* calls_;
};

/// What displayHelp prints for `node`.
inline std::string helpOf(CommandBase& node) {
  StdioCapture io;
  node.displayHelp();
  return io.out();
}
