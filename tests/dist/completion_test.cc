// SPDX-License-Identifier: MIT
// The shell completions offer what the tool's own prompt offers: the tree is
// built as the tool builds it, every place worth completing is taken from
// its words, and each script must answer there as the prompt's completion
// does, but for what only a command line has: no "back", which only moves the
// prompt; "--version" as the first word; a file name for an output path.
#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "framework/command_words.h"
#include "framework/completion.h"
#include "tests/support/private_bus.h"
#include "tool/vorn_command.h"

namespace {

namespace fs = std::filesystem;
using Words = std::set<std::string>;

/// A place to complete: the words typed before the cursor and the start of
/// the word under it.
struct Place {
  std::vector<std::string> typed;
  std::string current;
  /// A positional value goes here: any text, so a shell may offer files.
  bool anyText = false;

  std::string line() const {
    std::string text;
    for (const auto& word : typed) text += word + " ";
    return text + current;
  }
};

/// `words` with `more` after them.
std::vector<std::string> plus(std::vector<std::string> words, std::initializer_list<std::string> more) {
  words.insert(words.end(), more);
  return words;
}

// $1: the completions folder, $2: the working folder, then the words.
constexpr const char* kBashDriver = R"sh(
  source "$1/vorntool.bash" || exit 1
  cd "$2" || exit 1
  shift 2
  COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1))
  function=$(complete -p vorntool | sed -n 's/.* -F \([^ ]*\) .*/\1/p')
  "$function"
  printf '%s\n' "${COMPREPLY[@]}")sh";
// Real zsh brings compadd and _files; these print what they are given,
// compadd only what begins with the word under the cursor, as zsh shows.
constexpr const char* kZshDriver = R"sh(
  fpath=("$1" $fpath)
  cd "$2" || exit 1
  shift 2
  compadd() { [[ $1 == -- ]] && shift; local w; for w in "$@"; do [[ $w == "$PREFIX"* ]] && print -r -- $w; done; }
  _files() { compadd -- *(N); }
  words=("$@"); CURRENT=$#; PREFIX=$words[CURRENT]
  autoload -Uz _vorntool && _vorntool
  exit 0)sh";

class CompletionScripts : public testing::TestWithParam<std::string> {
 protected:
  void SetUp() override {
    if (GetParam() == "zsh" && std::system("command -v zsh >/dev/null") != 0)
      GTEST_SKIP() << "zsh is not installed (scripts/install-deps installs it)";
    char pattern[] = "/tmp/vorn-completion.XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir = pattern;
    fs::create_directory(dir / "files");
    std::ofstream(dir / "files" / kFile) << "";
    root = VornCommand::create("vorntool", {}, /* manager= */ nullptr, dispatch::queue());
    ASSERT_TRUE(root);
  }
  void TearDown() override {
    if (!dir.empty()) fs::remove_all(dir);
  }

  /// What the script offers at `place`, run in a folder that holds one file.
  Words offered(const Place& place) {
    const std::string& shell = GetParam();
    std::vector<std::string> argv{"/usr/bin/env", shell, shell == "bash" ? "--norc" : "-f", "-c",
                                  shell == "bash" ? kBashDriver : kZshDriver, shell, VORN_COMPLETION_DIR,
                                  (dir / "files").string(), "vorntool"};
    argv.insert(argv.end(), place.typed.begin(), place.typed.end());
    argv.push_back(place.current);
    vorn::test::ChildProcess script({argv, {}, -1, (dir / "offered").string()});
    EXPECT_EQ(script.wait(std::chrono::seconds(30)), 0) << place.line();
    Words words;
    std::ifstream lines(dir / "offered");
    for (std::string word; std::getline(lines, word);)
      if (!word.empty()) words.insert(word);
    return words;
  }

  /// What the tool's prompt offers at `place`, made a command line's.
  Words expected(const Place& place) {
    Words words;
    for (auto& word : completeLine(root, place.line()).candidates) words.insert(word);
    words.erase("back");
    if (place.typed.empty() && std::string("--version").starts_with(place.current)) words.insert("--version");
    return words;
  }

  /// The places worth completing, from the tree's words: after each
  /// sub-command path, and for each handler before, between and after its
  /// positional values and option words, and after something else.
  std::vector<Place> places() {
    std::vector<Place> all{{{}, ""},        {{"cd"}, ""}, {{"help"}, ""},      {{"quit"}, ""}, {{"--version"}, ""},
                           {{}, "--"},        {{}, "q"},    {{"logdump"}, "t"}, {{"cd"}, "l"}};
    for (const auto& node : collectCommandWords(root)) {
      std::vector<std::string> path;
      std::istringstream components(node.hierarchy);
      for (std::string component; std::getline(components, component, '/');)
        if (!component.empty()) path.push_back(component);
      path.erase(path.begin());  // the root itself
      all.push_back({path, ""});
      if (!path.empty()) {
        all.push_back({plus(path, {"help", "--"}), ""});
        all.push_back({plus(path, {"cd"}), ""});
      }
      for (const auto& handler : node.handlers) {
        auto typed = plus(path, {handler.name});
        for (std::size_t i = 0; i < handler.options.positionals; ++i, typed.push_back("60"))
          all.push_back({typed, "", /* anyText= */ true});
        all.push_back({typed, ""});
        all.push_back({plus(typed, {"value"}), ""});
        for (const auto& word : handler.options.words) {
          all.push_back({plus(typed, {word}), ""});
          all.push_back({plus(typed, {word, "value"}), ""});
          all.push_back({typed, word.substr(0, 2)});
        }
      }
    }
    return all;
  }

  static constexpr const char* kFile = "out.txt";
  fs::path dir;
  std::shared_ptr<CommandBase> root;
};

TEST_P(CompletionScripts, OfferWhatThePromptOffers) {
  const auto all = places();
  ASSERT_GT(all.size(), 20u) << "the tree has hardly any words";
  for (const auto& place : all) {
    Words words = offered(place);
    if (place.anyText) words.erase(kFile);
    EXPECT_EQ(words, expected(place)) << "at \"" << place.line() << "\"";
  }
}

TEST_P(CompletionScripts, OfferWhatOnlyACommandLineHas) {
  // The export's output path is a file name, and only that.
  EXPECT_EQ(offered({{"logdump", "oslog", "60"}, ""}), Words{kFile});
  EXPECT_EQ(offered({{"logdump", "oslog", "60"}, "o"}), Words{kFile});
  EXPECT_EQ(offered({{"logdump", "oslog"}, ""}), Words{});
}

INSTANTIATE_TEST_SUITE_P(Shells, CompletionScripts, testing::Values("bash", "zsh"),
                         [](const auto& paramInfo) { return paramInfo.param; });

}  // namespace
