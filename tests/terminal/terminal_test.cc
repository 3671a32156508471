// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include "terminal/completion_display.h"
#include "terminal/history_file.h"
#include "terminal/terminal_facts.h"

namespace {

using Words = std::vector<std::string>;

TEST(ColourRule, OnlyANonEmptyNoColorOrADumbTerminalTurnsItOff) {
  struct Case {
    const char* noColor;
    const char* term;
    bool colour;
  };
  const Case cases[] = {
      {nullptr, nullptr, true}, {"", "xterm", true}, {"1", "xterm", false}, {nullptr, "dumb", false},
      {nullptr, "dumber", true},
  };
  for (const auto& c : cases)
    EXPECT_EQ(terminal::colourWanted(c.noColor, c.term), c.colour)
        << (c.noColor ? c.noColor : "(unset)") << " " << (c.term ? c.term : "(unset)");
}

TEST(HistoryFile, TheVariableWinsThenTheStateFolderThenHome) {
  using terminal::HistoryLocation;
  struct Case {
    const char* histfile;
    const char* stateHome;
    const char* home;
    std::optional<HistoryLocation> expected;
  };
  const Case cases[] = {
      {"", "/state", "/home/u", std::nullopt},
      {"/tmp/h", "/state", "/home/u", HistoryLocation{"/tmp/h", false}},
      {"relative/h", nullptr, nullptr, HistoryLocation{"relative/h", false}},
      {nullptr, "/state", "/home/u", HistoryLocation{"/state/vorntool/history", true}},
      {nullptr, nullptr, "/home/u", HistoryLocation{"/home/u/.local/state/vorntool/history", true}},
      {nullptr, "state", "/home/u", HistoryLocation{"/home/u/.local/state/vorntool/history", true}},
      {nullptr, nullptr, "", std::nullopt},
      {nullptr, nullptr, nullptr, std::nullopt},
  };
  for (const auto& c : cases)
    EXPECT_EQ(terminal::historyLocation(c.histfile, c.stateHome, c.home), c.expected)
        << (c.histfile ? c.histfile : "(unset)") << " " << (c.stateHome ? c.stateHome : "(unset)");
}

TEST(HistoryFile, FoldersAreCreatedForTheOwnerOnly) {
  namespace fs = std::filesystem;
  char pattern[] = "/tmp/vorn-history.XXXXXX";
  const fs::path base = mkdtemp(pattern);
  const fs::path folder = base / "state" / "vorntool";
  ASSERT_TRUE(terminal::makePrivateFolder(folder));
  for (const auto& made : {base / "state", folder}) {
    struct stat info {};
    ASSERT_EQ(stat(made.c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 0777, 0700u) << made;
  }
  EXPECT_TRUE(terminal::makePrivateFolder(folder));  // already there
  std::ofstream(base / "file") << "x";
  EXPECT_FALSE(terminal::makePrivateFolder(base / "file" / "vorntool"));
  fs::remove_all(base);
}

TEST(CompletionStep, CompletesAsFarAsTheCandidatesAgreeThenLists) {
  using terminal::CompletionStep;
  struct Case {
    Completions completions;
    CompletionStep step;
  };
  const Case cases[] = {
      {{"x", {}}, {"", false}},
      {{"log", {"logdump"}}, {"dump ", false}},
      {{"logdump", {"logdump"}}, {" ", false}},
      {{"n", {"nocompress", "nonui"}}, {"o", false}},
      {{"no", {"nocompress", "nonui"}}, {"", true}},
      {{"tar", {"tar", "tar.gz"}}, {"", true}},
      {{"cd", {"cda", "cdab"}}, {"a", false}},
  };
  for (const auto& c : cases)
    EXPECT_EQ(terminal::planCompletion(c.completions), c.step) << "'" << c.completions.word << "'";
}

TEST(CompletionListing, PathsShowTheirLastPart) {
  EXPECT_EQ(terminal::listedNames({"t", {"tar", "tel"}}), (Words{"tar", "tel"}));
  EXPECT_EQ(terminal::listedNames({"logdump/", {"logdump/..", "logdump/deep"}}), (Words{"..", "deep"}));
}

TEST(CompletionListing, ColumnsFillTopToBottomWithinTheWidth) {
  const Words six{"bb", "cd", "core", "help", "oslog", "tel"};
  struct Case {
    Words names;
    std::size_t width;
    std::string text;
  };
  const Case cases[] = {
      {{}, 80, ""},
      {six, 80, "bb     cd     core   help   oslog  tel\n"},
      // Six columns of seven need 40 characters, the last without its gap,
      // and one more so that the cursor never waits at the margin.
      {six, 41, "bb     cd     core   help   oslog  tel\n"},
      {six, 40, "bb     core   oslog\ncd     help   tel\n"},
      {six, 18, "bb     help\ncd     oslog\ncore   tel\n"},
      {{"averyverylongname", "x"}, 10, "averyverylongname\nx\n"},
  };
  for (const auto& c : cases) EXPECT_EQ(terminal::formatColumns(c.names, c.width), c.text) << c.width;
}

}  // namespace
