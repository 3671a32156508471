// SPDX-License-Identifier: MIT
#include "logdump_fixture.h"
#include "logdump/logdump_options.h"
#include "logdump/oslog_command.h"

namespace {

class LogdumpPermission : public LogdumpTest {};

TEST_F(LogdumpPermission, OnlyBbRunsWhileTheServerIsDown) {
  gServerRunning = false;
  struct Case {
    std::string name;
    bool allowed;
  };
  for (const auto& c : {Case{"bb", true}, Case{"tel", false}, Case{"core", false}, Case{"oslog", false},
                        Case{"BB", false}}) {
    StdioCapture io;
    EXPECT_EQ(command->isAllowed(c.name), c.allowed) << c.name;
    EXPECT_EQ(io.err(), c.allowed ? "" : "Server is not running. Please try after server starts.\n") << c.name;
    EXPECT_EQ(io.out(), "");
  }
  gServerRunning = true;
  StdioCapture io;
  for (const std::string name : {"bb", "tel", "core", "oslog", "BB"}) EXPECT_TRUE(command->isAllowed(name));
  EXPECT_EQ(io.err(), "");
  gServerRunning = false;  // as the process starts
}

TEST_F(LogdumpPermission, ARefusalSaysWhenTheBusDeniedAccess) {
  manager->denied = true;
  StdioCapture io;
  EXPECT_TRUE(command->isAllowed("bb"));
  EXPECT_FALSE(command->isAllowed("tel"));
  EXPECT_EQ(io.err(),
            "Server is not running. Please try after server starts.\n"
            "vorntool: the server refused access; run as root or as a member of group \"vorn\"\n");
  EXPECT_EQ(io.out(), "");
}

TEST_F(LogdumpPermission, HelpListsTheFourHandlers) {
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

class LogdumpOptionWords : public LogdumpTest {};

TEST_F(LogdumpOptionWords, CollectionWordsAreOptionsTheParserTakes) {
  for (const std::string handler : {"tel", "core", "bb"}) {
    const OptionWords options = command->getOptionWords(handler);
    EXPECT_EQ(options.positionals, 0u) << handler;
    EXPECT_TRUE(options.leadingOnly) << handler;
    ASSERT_FALSE(options.words.empty()) << handler;
    for (const auto& word : options.words) {
      std::list<std::string> args{"why", word};
      CompressionMode compression = TarGz;
      std::string reason;
      bool noUserConfirmation = false;
      parseLogdumpOptions(args, compression, reason, noUserConfirmation);
      EXPECT_EQ(reason, "[vorntool] why") << handler << " " << word;
    }
  }
  const auto telephony = command->getOptionWords("tel").words;
  EXPECT_EQ(command->getOptionWords("core").words, telephony);
  // Only the telephony collections ask the user to confirm.
  EXPECT_NE(std::find(telephony.begin(), telephony.end(), "nonui"), telephony.end());
  const auto baseband = command->getOptionWords("bb").words;
  EXPECT_EQ(std::find(baseband.begin(), baseband.end(), "nonui"), baseband.end());
}

TEST_F(LogdumpOptionWords, OslogWordsSwitchTheListsAfterHistoryAndPath) {
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
