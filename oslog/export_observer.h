// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>

namespace oslog {

/// Follows an export while it runs, to show how far it has come. Told of the
/// start and the end on the exporting thread, and of the lines written on
/// the stream's thread in between.
class ExportObserver {
 public:
  /// Lines between two reports: the count is handed over rarely enough to
  /// cost nothing next to the lines themselves.
  static constexpr std::uint64_t kLinesPerReport = 256;

  virtual ~ExportObserver() = default;

  /// The stream is about to start.
  virtual void started() = 0;
  /// The lines written so far: every kLinesPerReport lines, and once more
  /// with the total when the stream ends. Keep it cheap.
  virtual void linesWritten(std::uint64_t lines) = 0;
  /// The stream has stopped and the file is closed; nothing follows.
  virtual void finished() = 0;
};

}  // namespace oslog
