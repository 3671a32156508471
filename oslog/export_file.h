// SPDX-License-Identifier: MIT
#pragma once

#include <string>

namespace oslog {

/// The export's output file. Lines are built straight into its buffer and
/// written in blocks as they arrive, so one write call serves many lines;
/// flush() hands everything buffered to the file.
class ExportFile {
 public:
  ExportFile() = default;
  ~ExportFile() { close(); }
  ExportFile(const ExportFile&) = delete;
  ExportFile& operator=(const ExportFile&) = delete;

  /// Creates `path` empty, replacing an existing file, and opens it for
  /// writing. False when it cannot be created.
  bool create(const std::string& path);
  /// Where the next line goes; call lineAdded() after appending to it.
  std::string& buffer() { return buffer_; }
  void lineAdded() {
    if (buffer_.size() >= kBlockBytes) flush();
  }
  void flush();
  /// Flushes and closes; false when any write so far, or the close, failed.
  bool close();
  /// The error of the first failed write (0 while every write succeeded).
  int writeError() const { return writeError_; }

 private:
  static constexpr std::size_t kBlockBytes = 64 * 1024;

  int fd_ = -1;
  int writeError_ = 0;
  std::string buffer_;
};

}  // namespace oslog
