// SPDX-License-Identifier: MIT
#include <algorithm>

#include "logdump/logdump_options.h"
#include "logdump/oslog_command.h"
#include "logdump_fixture.h"

namespace {

const std::string kServerDown = "Server is not running. Please try after server starts.\n";

using LogdumpCommandTest = LogdumpTest;

TEST_F(LogdumpCommandTest, OnlyBbRunsWhileTheServerIsDownAndARefusalSaysWhenTheBusDenied) {
  for (bool running : {false, true}) {
    gServerRunning = running;
    for (const std::string name : {"bb", "tel", "core", "oslog", "BB"}) {
      StdioCapture io;
      EXPECT_EQ(command->isAllowed(name), running || name == "bb") << name;
      EXPECT_EQ(io.err(), running || name == "bb" ? "" : kServerDown) << name;
      EXPECT_EQ(io.out(), "");
    }
  }
  gServerRunning = false;  // as the process starts
  manager->denied = true;
  StdioCapture io;
  EXPECT_FALSE(command->isAllowed("tel"));
  EXPECT_EQ(io.err(), kServerDown +
                          "vorntool: the server refused access; run as root or as a member of group \"vorn\"\n");
}

TEST_F(LogdumpCommandTest, HelpListsTheFourHandlers) {
  StdioCapture io;
  command->displayHelp();
  EXPECT_EQ(io.out(),
            "\nOptions for command '\x1b[32mlogdump\x1b[39m':\n\n"
            "\t              bb  -  [nocompress|tar.gz|tar] <reason> collect baseband logs only\n\n"
            "\t            core  -  [nocompress|tar.gz|tar] [nonui] <reason> collect telephony logs with coredump\n\n"
            "\t           oslog  -  [history size] [output txt file path] -p <process1 process2..> -i "
            "<imagePath1 imagePath2..> collect oslog to txt\n\n"
            "\t             tel  -  [nocompress|tar.gz|tar] [nonui] <reason> collect telephony logs\n\n"
            "\t              cd  -  <sub-command>\n\t            help\n\t            back\n\t            quit\n\n");
}

TEST_F(LogdumpCommandTest, CollectionWordsAreLeadingOptionsTheParserTakes) {
  for (const std::string handler : {"tel", "core", "bb"}) {
    const OptionWords options = command->getOptionWords(handler);
    EXPECT_EQ(options.positionals, 0u) << handler;
    EXPECT_TRUE(options.leadingOnly) << handler;
    // Only the telephony collections ask the user to confirm.
    EXPECT_EQ(std::ranges::count(options.words, "nonui"), handler == "bb" ? 0 : 1) << handler;
    ASSERT_GE(options.words.size(), 3u) << handler;
    for (const auto& word : options.words) {
      std::list<std::string> args{"why", word};
      CompressionMode compression = TarGz;
      std::string reason;
      bool noUserConfirmation = false;
      parseLogdumpOptions(args, compression, reason, noUserConfirmation);
      EXPECT_EQ(reason, "[vorntool] why") << handler << " " << word;
    }
  }
  EXPECT_EQ(command->getOptionWords("core").words, command->getOptionWords("tel").words);
}

TEST_F(LogdumpCommandTest, OslogWordsSwitchTheListsAfterHistoryAndPath) {
  const OptionWords options = command->getOptionWords("oslog");
  EXPECT_EQ(options.positionals, 2u);
  EXPECT_FALSE(options.leadingOnly);
  std::set<std::string> lists;
  for (const auto& word : options.words) {
    auto request = logdump::parseOsLogArguments({"X", word, "out.txt", "60"});
    ASSERT_TRUE(request) << word;
    if (request->processes == std::vector<std::string>{"X"}) lists.insert("processes");
    if (request->imagePaths == std::vector<std::string>{"X"}) lists.insert("images");
  }
  EXPECT_EQ(lists, (std::set<std::string>{"images", "processes"}));
}

}  // namespace
