// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "platform/logstore/log_event.h"

namespace oslog {

/// Builds the export's text lines:
///   "<local date> +0000 0x<thread, 5+ hex digits> 0x<activity hex> <pid>
///    <process>(<sender>):<subsystem> [<category>] <message>\n"
/// with "(null)" for a missing text field, U+FFFD for each invalid UTF-8
/// byte and "\n" (backslash, n) for a line break inside a field. Keeps the
/// date text of the last second it printed, since a log holds many entries
/// per second.
class LineFormatter {
 public:
  /// Appends the line for `event` to `out`.
  void append(const logstore::Event& event, std::string& out);

 private:
  std::int64_t cachedSecond_ = INT64_MIN;
  char cachedDate_[32] = {};
  std::size_t cachedDateLength_ = 0;
};

/// Appends `text` to `out`, replacing each byte that is not part of a
/// well-formed UTF-8 sequence with U+FFFD.
void appendUtf8(std::string_view text, std::string& out);

/// "YYYY-MM-DD HH:MM:SS +0000" for `unixSeconds` read as GMT; returns the
/// length written to `buffer` (at least 32 bytes).
std::size_t formatDate(std::int64_t unixSeconds, char* buffer);

}  // namespace oslog
