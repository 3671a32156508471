// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "test_tree.h"

namespace {

using namespace std::chrono_literals;

TEST(CommandTree, RegistrationReplacesBlocksAndKeepsHelpAndWordsUnlessGivenAnew) {
  auto node = TestCommand::create({"n"});
  std::string ran;
  auto says = [&ran](std::string word) -> CommandHandler {
    return [&ran, word](dispatch::group, std::list<std::string>) { return ran = word, true; };
  };
  const OptionWords words{.words = {"tar"}};
  node->addCommandHandler("h", says("first"), "old help", words);
  node->addCommandHandler("h", says("second"), "");
  EXPECT_TRUE(node->execCommand("h", {}));
  EXPECT_EQ(ran, "second");
  EXPECT_NE(helpOf(*node).find("h  -  old help\n"), std::string::npos);
  EXPECT_EQ(node->getOptionWords("h"), words);

  node->addCommandHandler("h", kSucceed, "new help", OptionWords{.words = {"only"}});
  EXPECT_NE(helpOf(*node).find("h  -  new help\n"), std::string::npos);
  EXPECT_EQ(node->getOptionWords("h").words, std::vector<std::string>{"only"});

  // An empty handler is ignored with its help and words.
  const std::string before = helpOf(*node);
  node->addCommandHandler("empty", CommandHandler(), "text", words);
  EXPECT_FALSE(node->isValidCommand("empty"));
  EXPECT_EQ(node->getOptionWords("empty"), OptionWords{});
  EXPECT_EQ(helpOf(*node), before);
}

TEST(CommandTree, HandlersAndSubCommandsAreSeparateExactNamespaces) {
  auto root = TestCommand::create({"root", {{"both", ""}, {"tel", ""}}, {{"both"}}});
  EXPECT_TRUE(root->isValidCommand("both"));
  EXPECT_TRUE(root->isValidSubCommand("both"));
  EXPECT_TRUE(root->isValidCommand("tel"));
  EXPECT_FALSE(root->isValidCommand("Tel"));
  EXPECT_FALSE(root->isValidSubCommand("tel"));

  const std::string before = helpOf(*root);
  EXPECT_EQ(root->getSubCommandObj("unknown"), nullptr);
  EXPECT_FALSE(root->execCommand("unknown", {}));
  EXPECT_EQ(helpOf(*root), before);
}

TEST(ExecCommand, WaitsForWorkHeldThroughTheGroupAndKeepsTheHandlersResult) {
  dispatch::queue worker("test.worker");
  for (bool handlerResult : {true, false}) {
    auto node = TestCommand::create({"n"});
    std::atomic<bool> workDone{false};
    node->addCommandHandler(
        "async",
        [&](dispatch::group group, std::list<std::string>) {
          worker.async([membership = GroupMembership(group), &workDone] {
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
