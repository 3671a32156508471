// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "framework/colour.h"
#include "stdio_capture.h"
#include "test_tree.h"

namespace {

const TestCommand::Layout kTree{"vorntool", {}, {{"logdump", {{"tel", ""}}}}};

/// Plays typed lines and records each prompt together with what completion
/// offered for an empty line at that prompt.
class ScriptedReader : public LineReader {
 public:
  ScriptedReader(std::vector<std::string> lines, std::vector<std::string>* seen)
      : lines_(std::move(lines)), seen_(seen) {}
  bool readLine(const std::string& prompt, std::string& line) override {
    std::string offered;
    if (completer_)
      for (const auto& word : completer_("").candidates) offered += " " + word;
    seen_->push_back(prompt + offered);
    if (next_ == lines_.size()) return false;
    line = lines_[next_++];
    return true;
  }
  void setCompleter(Completer completer) override { completer_ = std::move(completer); }

 private:
  std::vector<std::string> lines_;
  std::size_t next_ = 0;
  std::vector<std::string>* seen_;
  Completer completer_;
};

TEST(ShellLineReader, PromptsThroughTheReaderAndCompletesAtTheWorkingCommand) {
  std::vector<std::string> seen;
  std::vector<std::string> calls;
  TestShell shell(kTree, &calls);
  shell.setLineReader(std::make_unique<ScriptedReader>(
      std::vector<std::string>{"cd logdump", "tel now", "back"}, &seen));
  StdioCapture io;
  EXPECT_FALSE(shell.run({"vorntool"}));
  // The reader writes the prompts; the shell prints nothing of its own here.
  EXPECT_EQ(io.out(), "");
  EXPECT_EQ(calls, std::vector<std::string>{"logdump:tel now"});
  const std::string atRoot = "(/vorntool)>>  back cd exit help logdump quit";
  const std::string atLogdump = "(/vorntool/logdump)>>  back cd exit help quit tel";
  EXPECT_EQ(seen, (std::vector<std::string>{atRoot, atLogdump, atLogdump, atRoot}));
}

TEST(ColourOff, HelpAndTheInvalidWordReportKeepTheirTextWithoutEscapes) {
  TestShell shell(kTree);
  colour::setEnabled(false);
  StdioCapture io;
  EXPECT_FALSE(shell.run({"bogus", "vorntool"}));
  colour::setEnabled(true);
  EXPECT_EQ(io.out(),
            "\nInvalid command option 'bogus'\n"
            "Options for command 'vorntool':\n\n"
            "\t         logdump  -  [tel]\n\n"
            "\t              cd  -  <sub-command>\n\t            help\n\t            back\n\t            quit\n\n");
}

}  // namespace
