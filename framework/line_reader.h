// SPDX-License-Identifier: MIT
#pragma once

#include <functional>
#include <string>
#include <string_view>
#include <vector>

/// What may complete the text before the cursor: the word being typed there
/// (empty after white space) and the whole words that may replace it.
struct Completions {
  std::string word;
  std::vector<std::string> candidates;  ///< sorted, unique, each begins with `word`

  bool operator==(const Completions&) const = default;
};

/// Where the interactive shell gets its lines. The shell never learns which
/// kind it has: a plain reader for pipes and files, an editing one for a
/// person at a terminal.
class LineReader {
 public:
  using Completer = std::function<Completions(std::string_view beforeCursor)>;

  virtual ~LineReader() = default;

  /// Shows `prompt` and reads one line into `line`, without its line end.
  /// False at the end of input or on a read error.
  virtual bool readLine(const std::string& prompt, std::string& line) = 0;

  /// Where completions come from; readers that cannot complete ignore it.
  virtual void setCompleter(Completer) {}
};

/// The prompt on standard output, flushed, then one line of standard input
/// as std::getline reads it: a last line without a line end still counts.
class PlainLineReader : public LineReader {
 public:
  bool readLine(const std::string& prompt, std::string& line) override;
};
