// SPDX-License-Identifier: MIT
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <ctime>
#include <string>

#include "platform/linux/fd.h"
#include "server/common/collect_request.h"
#include "server/common/device_facts.h"

/// The collection's `manifest.txt`: what was asked, when, on which device,
/// and one line per file stored, skipped or cut. It grows with the trees it
/// describes, so it is written to an unnamed file on disk as the walk goes,
/// not kept in memory, and stored in the collection once the walk is done.
namespace vorn::server {

class Manifest {
 public:
  /// Opens the unnamed file in the folder `dirFd`; `fallbackName` is used
  /// (and unlinked at once) where the file system has no unnamed files.
  bool open(int dirFd, const std::string& fallbackName, std::string* error);

  void header(const CollectRequest& request, const std::string& timestamp, std::time_t when,
              const DeviceFacts& facts);
  /// `path` is relative to the collection, its names as bytes.
  void stored(const std::string& path);
  void skipped(const std::string& path, const std::string& why);
  void cut(const std::string& path, std::uint64_t storedBytes, std::uint64_t totalBytes);

  /// Writes out what is buffered; false (with `error`) when a write failed.
  bool finish(std::string* error);
  int fd() const { return fd_.get(); }
  off_t size() const { return size_; }

 private:
  void line(const std::string& text);
  bool flush();

  Fd fd_;
  std::string buffer_;
  off_t size_ = 0;
  std::string error_;
};

}  // namespace vorn::server
