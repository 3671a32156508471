// SPDX-License-Identifier: MIT
#pragma once

#include <cstdio>
#include <memory>
#include <optional>
#include <string>

#include "framework/line_reader.h"
#include "terminal/history_file.h"

struct editline;
struct history;

namespace terminal {

/// Lines from a person at a terminal: Emacs-style editing, Tab completion and
/// a history that outlives the session. The editor starts at the first line
/// read, so a one-shot session never touches the terminal's modes.
class EditLineReader : public LineReader {
 public:
  struct Options {
    std::string programName;
    FILE* input = stdin;
    /// Where the prompt, the echo and completion listings go.
    FILE* output = stdout;
    bool closeOutput = false;
    std::optional<HistoryLocation> history;
    int historySize = 1000;
  };

  explicit EditLineReader(Options options);
  ~EditLineReader() override;

  bool readLine(const std::string& prompt, std::string& line) override;
  void setCompleter(Completer completer) override { completer_ = std::move(completer); }

 private:
  struct EditorDeleter {
    void operator()(editline* editor) const;
  };
  struct HistoryDeleter {
    void operator()(struct history* list) const;
  };

  void start();
  void remember(const std::string& line);
  void saveHistory();
  unsigned char complete();
  std::size_t width() const;

  static char* promptOf(editline* editor);
  static unsigned char completeKey(editline* editor, int key);

  Options options_;
  Completer completer_;
  std::string prompt_;
  bool started_ = false;
  std::unique_ptr<editline, EditorDeleter> editor_;
  std::unique_ptr<struct history, HistoryDeleter> history_;
  PlainLineReader fallback_;
};

}  // namespace terminal
