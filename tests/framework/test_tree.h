// SPDX-License-Identifier: MIT
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "framework/command_base.h"
#include "framework/command_shell.h"

/// A node whose handlers and children are given as data, for driving the
/// framework without the tool.
class TestCommand : public CommandBase {
 public:
  struct Spec {
    std::string name;
    std::vector<std::pair<std::string, std::string>> handlers;  // name, help
    std::vector<Spec> children;
    std::vector<std::string> refused;  // names isAllowed refuses
  };

  static std::shared_ptr<TestCommand> create(Spec spec, std::weak_ptr<CommandBase> parent,
                                             std::vector<std::string>* calls) {
    auto node = std::shared_ptr<TestCommand>(new TestCommand(std::move(spec), parent, calls));
    node->init();
    return node;
  }

  bool isAllowed(std::string name) override {
    for (auto& r : spec_.refused)
      if (r == name) return false;
    return true;
  }

  void registerCommands() override {
    for (auto& [handler, help] : spec_.handlers) {
      std::string label = spec_.name + ":" + handler;
      auto* calls = calls_;
      addCommandHandler(
          handler,
          [label, calls](dispatch::group, std::list<std::string> args) {
            std::string call = label;
            for (auto it = args.rbegin(); it != args.rend(); ++it) call += " " + *it;
            if (calls) calls->push_back(call);
            // A handler named "fail..." reports failure.
            return label.find(":fail") == std::string::npos;
          },
          help);
    }
    for (auto& child : spec_.children)
      addSubCommand(child.name, create(child, weak_from_this(), calls_));
  }

 private:
  TestCommand(Spec spec, std::weak_ptr<CommandBase> parent, std::vector<std::string>* calls)
      : CommandBase(spec.name, std::move(parent)), spec_(std::move(spec)), calls_(calls) {}
  Spec spec_;
  std::vector<std::string>* calls_;
};

/// A shell over a tree made from a spec.
class TestShell : public CommandShell {
 public:
  explicit TestShell(TestCommand::Spec spec, std::vector<std::string>* calls = nullptr)
      : spec_(std::move(spec)), calls_(calls) {}
  std::shared_ptr<CommandBase> createRootCommand() override {
    if (spec_.name.empty()) return nullptr;
    return TestCommand::create(spec_, {}, calls_);
  }

 private:
  TestCommand::Spec spec_;
  std::vector<std::string>* calls_;
};
