// SPDX-License-Identifier: MIT
#pragma once

#include <dirent.h>

#include <string>

/// The names in one open folder, read through its descriptor, without "."
/// and "..". Memory stays constant whatever the folder holds: names come
/// one at a time, in the order the file system keeps them.
namespace vorn::server {

class DirStream {
 public:
  /// Takes ownership of `fd`, an open folder; its descriptor stays usable
  /// for the *at calls through `fd()` while the stream lives.
  explicit DirStream(int fd);
  ~DirStream();
  DirStream(const DirStream&) = delete;
  DirStream& operator=(const DirStream&) = delete;

  bool ok() const { return dir_ != nullptr; }
  int fd() const;
  /// The next name; false at the end or on an error (then `error()` is set).
  bool next(std::string* name);
  /// Starts over, for readers that change the folder while they walk it.
  void rewind();
  const std::string& error() const { return error_; }

 private:
  DIR* dir_ = nullptr;
  std::string error_;
};

}  // namespace vorn::server
