// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "stdio_capture.h"
#include "test_tree.h"

namespace {

using namespace std::chrono_literals;

/// A node whose registration is done by the test body.
class OpenCommand : public CommandBase {
 public:
  static std::shared_ptr<OpenCommand> create(std::string name, std::weak_ptr<CommandBase> parent = {}) {
    auto node = std::shared_ptr<OpenCommand>(new OpenCommand(std::move(name), std::move(parent)));
    node->init();
    return node;
  }
  void registerCommands() override {}

 private:
  OpenCommand(std::string commandName, std::weak_ptr<CommandBase> parentCommand)
      : CommandBase(std::move(commandName), std::move(parentCommand)) {}
};

std::string help(CommandBase& node) {
  StdioCapture io;
  node.displayHelp();
  return io.out();
}

TEST(CommandTree, RegistrationReplacesBlocksAndKeepsHelpUnlessGivenAnew) {
  auto node = OpenCommand::create("n");
  std::string ran;
  node->addCommandHandler("h", [&](dispatch::group, std::list<std::string>) { ran = "first"; return true; }, "old help");
  node->addCommandHandler("h", [&](dispatch::group, std::list<std::string>) { ran = "second"; return true; }, "");
  EXPECT_TRUE(node->execCommand("h", {}));
  EXPECT_EQ(ran, "second");
  EXPECT_NE(help(*node).find("h  -  old help\n"), std::string::npos);

  node->addCommandHandler("h", [](dispatch::group, std::list<std::string>) { return true; }, "new help");
  EXPECT_NE(help(*node).find("h  -  new help\n"), std::string::npos);

  std::string before = help(*node);
  node->addCommandHandler("empty", CommandHandler(), "text");
  EXPECT_FALSE(node->isValidCommand("empty"));
  EXPECT_EQ(help(*node), before);
}

TEST(CommandTree, HandlersAndSubCommandsAreSeparateExactNamespaces) {
  auto root = OpenCommand::create("root");
  auto child = OpenCommand::create("both", root);
  root->addSubCommand("both", child);
  root->addCommandHandler("both", [](dispatch::group, std::list<std::string>) { return true; }, "");
  root->addCommandHandler("tel", [](dispatch::group, std::list<std::string>) { return true; }, "");
  EXPECT_TRUE(root->isValidCommand("both"));
  EXPECT_TRUE(root->isValidSubCommand("both"));
  EXPECT_TRUE(root->isValidCommand("tel"));
  EXPECT_FALSE(root->isValidCommand("Tel"));
  EXPECT_FALSE(root->isValidSubCommand("tel"));

  std::string before = help(*root);
  EXPECT_EQ(root->getSubCommandObj("unknown"), nullptr);
  EXPECT_FALSE(root->execCommand("unknown", {}));
  EXPECT_EQ(help(*root), before);
}

TEST(ExecCommand, WaitsForWorkHeldThroughTheGroupAndKeepsTheHandlersResult) {
  dispatch::queue worker("test.worker");
  for (bool handlerResult : {true, false}) {
    auto node = OpenCommand::create("n");
    std::atomic<bool> workDone{false};
    node->addCommandHandler(
        "async",
        [&](dispatch::group group, std::list<std::string>) {
          GroupMembership membership(group);
          worker.async([membership, &workDone] {
            std::this_thread::sleep_for(300ms);
            workDone = true;
          });
          return handlerResult;
        },
        "");
    EXPECT_EQ(node->execCommand("async", {}), handlerResult);
    EXPECT_TRUE(workDone.load());
  }
}

}  // namespace
