// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "platform/linux/fd.h"
#include "server/common/tree_sink.h"

/// Copies the sources into a collection folder (compression 0). The folder
/// is built under a hidden temporary name in the snapshot folder and renamed
/// when complete. Every folder and file is made relative to its parent's
/// descriptor, so depth is no obstacle; holes of sparse files stay holes.
namespace vorn::server {

class FolderSink : public TreeSink {
 public:
  /// Starts `partialName` in the folder `dirFd`, which must outlive the sink.
  static std::unique_ptr<FolderSink> create(int dirFd, const std::string& partialName, std::optional<gid_t> group,
                                            std::string* error);
  ~FolderSink() override;

  bool enterFolder(const std::string& name, const struct stat& st, std::string* error) override;
  bool leaveFolder(std::string* error) override;
  bool addFile(const std::string& name, const SourceFile& file, const std::atomic<bool>& cancel,
               std::string* error) override;
  bool addManifest(int fd, off_t size, std::string* error) override;
  bool commit(const std::string& finalName, std::string* error) override;
  void abandon() override;

 private:
  FolderSink(int dirFd, std::string partialName, std::optional<gid_t> group)
      : dirFd_(dirFd), partialName_(std::move(partialName)), group_(group) {}
  bool makeFolder(int parentFd, const std::string& name, std::string* error);
  bool copyExtent(int in, int out, const Extent& extent, std::string* error);

  int dirFd_;
  std::string partialName_;
  std::optional<gid_t> group_;
  std::vector<Fd> folders_;  // the open path, the collection folder first
  std::vector<char> buffer_;
  bool done_ = false;
};

}  // namespace vorn::server
