// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "framework/command_words.h"
#include "framework/completion.h"
#include "test_tree.h"

namespace {

using Words = std::vector<std::string>;

const TestCommand::Layout kTree{
    "vorntool",
    {{"twice", ""}},
    {{"logdump", {{"tel", ""}, {"bb", ""}, {"oslog", ""}}, {{"deep", {{"x", ""}}}}},
     {"twice"}}};

const OptionWords kTelephony{.words = {"nocompress", "tar.gz", "tar", "nonui"}, .leadingOnly = true};
const OptionWords kOslog{.positionals = 2, .words = {"-p", "-i"}};

/// The test tree with option words on the logdump handlers, as the tool has them.
std::shared_ptr<CommandBase> tree() {
  std::shared_ptr<CommandBase> root = TestCommand::create(kTree);
  root->getSubCommandObj("logdump")->addCommandHandler("tel", kSucceed, "", kTelephony);
  root->getSubCommandObj("logdump")->addCommandHandler("oslog", kSucceed, "", kOslog);
  return root;
}

struct Case {
  const char* at;  // the working command below the root, or "" for the root
  const char* line;
  std::string word;
  Words candidates;
};

TEST(Completion, OffersWhatTheShellAcceptsAtTheCursor) {
  const Case cases[] = {
      // First word of a group: names of the node and every shell word.
      {"", "", "", {"back", "cd", "exit", "help", "logdump", "quit", "twice"}},
      {"", "log", "log", {"logdump"}},
      {"", "tw", "tw", {"twice"}},  // a handler and a sub-command of one name, once
      {"", "q", "q", {"quit"}},
      {"", "nothing", "nothing", {}},
      {"logdump", "", "", {"back", "bb", "cd", "deep", "exit", "help", "oslog", "quit", "tel"}},
      // After sub-command words "back", "quit" and "exit" are not accepted.
      {"", "logdump ", "", {"bb", "cd", "deep", "help", "oslog", "tel"}},
      {"", "  logdump \t ", "", {"bb", "cd", "deep", "help", "oslog", "tel"}},
      {"", "logdump q", "q", {}},
      {"", "logdump deep ", "", {"cd", "help", "x"}},
      // Words that end the group or that the shell rejects.
      {"", "help ", "", {}},
      {"", "bogus ", "", {}},
      {"", "logdump deep x ", "", {}},  // a handler without option words
      // Only the group after the last separator counts.
      {"", "help -- log", "log", {"logdump"}},
      {"", "logdump tel -- ", "", {"back", "cd", "exit", "help", "logdump", "quit", "twice"}},
      // Leading option words: offered until the first other word, each once.
      {"", "logdump tel ", "", {"nocompress", "nonui", "tar", "tar.gz"}},
      {"", "logdump tel tar", "tar", {"tar", "tar.gz"}},
      {"", "logdump tel tar ", "", {"nocompress", "nonui", "tar.gz"}},
      {"", "logdump tel crash ", "", {}},
      // Option words after positional arguments.
      {"", "logdump oslog 3600 ", "", {}},
      {"", "logdump oslog 3600 out.txt ", "", {"-i", "-p"}},
      {"", "logdump oslog 3600 out.txt -p Telhub -", "-", {"-i"}},
      // "cd" takes one path: sub-command names and ".." at each level.
      {"", "cd ", "", {"..", "logdump", "twice"}},
      {"", "cd logdump/", "logdump/", {"logdump/..", "logdump/deep"}},
      {"", "cd logdump//d", "logdump//d", {"logdump//deep"}},
      {"", "cd logdump/../lo", "logdump/../lo", {"logdump/../logdump"}},
      {"", "cd ../", "../", {"../..", "../logdump", "../twice"}},  // ".." at the root stays there
      {"logdump", "cd ../", "../", {"../..", "../logdump", "../twice"}},
      {"", "cd nowhere/", "nowhere/", {}},
      {"", "cd logdump ", "", {}},
      {"", "logdump cd .", ".", {".."}},
  };
  auto root = tree();
  for (const auto& c : cases) {
    auto start = *c.at ? root->getSubCommandObj(c.at) : root;
    EXPECT_EQ(completeLine(start, c.line), (Completions{c.word, c.candidates}))
        << "at '" << c.at << "', line '" << c.line << "'";
  }
  // Without a tree only the word is known.
  EXPECT_EQ(completeLine(nullptr, "logdump t"), (Completions{"t", {}}));
}


TEST(CommandWords, ListEveryListedNodeWithItsHandlersAndOptionWords) {
  auto root = tree();
  const std::vector<CommandWords> expected = {
      {"/vorntool", {"logdump", "twice"}, {{"twice", {}}}},
      {"/vorntool/logdump", {"deep"}, {{"bb", {}}, {"oslog", kOslog}, {"tel", kTelephony}}},
      {"/vorntool/logdump/deep", {}, {{"x", {}}}},
      {"/vorntool/twice", {}, {}},
  };
  EXPECT_EQ(collectCommandWords(root), expected);
  EXPECT_TRUE(collectCommandWords(nullptr).empty());
}

}  // namespace
