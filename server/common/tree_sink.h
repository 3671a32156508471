// SPDX-License-Identifier: MIT
#pragma once

#include <sys/stat.h>

#include <atomic>
#include <string>

#include "server/common/file_extents.h"

/// Where a walk of the sources puts what it finds: an archive, or a folder.
/// Names are single path components, as bytes; folders nest by
/// enter/leave, so no sink ever needs a whole path to reach a file.
namespace vorn::server {

/// One regular file, open and checked, with what of it to store.
struct SourceFile {
  int fd = -1;
  struct stat st {};
  StoredPart part;
};

class TreeSink {
 public:
  virtual ~TreeSink() = default;
  virtual bool enterFolder(const std::string& name, const struct stat& st, std::string* error) = 0;
  virtual bool leaveFolder(std::string* error) = 0;
  /// Stores `file` under `name` in the current folder, reading only its
  /// extents from its descriptor.
  virtual bool addFile(const std::string& name, const SourceFile& file, const std::atomic<bool>& cancel,
                       std::string* error) = 0;
  /// Stores the manifest, `size` bytes read from `fd`, at the collection's top.
  virtual bool addManifest(int fd, off_t size, std::string* error) = 0;
  /// Completes the output and gives it the name `finalName` in its folder.
  virtual bool commit(const std::string& finalName, std::string* error) = 0;
  /// Removes whatever was written; the sink is unusable afterwards.
  virtual void abandon() = 0;
};

}  // namespace vorn::server
