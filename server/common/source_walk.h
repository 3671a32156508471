// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "server/common/manifest.h"
#include "server/common/tree_sink.h"

/// Walks the log folders by descriptor. Every folder is opened relative to
/// its parent and every file relative to its folder, never following a link
/// (O_NOFOLLOW), and what was opened is checked on its descriptor (fstat)
/// before it is read: a log folder's owner who swaps a file for a link or a
/// FIFO between the listing and the copy gets a manifest line, not root's
/// secrets or a stuck daemon. The walk joins no paths, so a tree deeper than
/// PATH_MAX is no obstacle; subtrees below kMaxDepth folders are skipped.
namespace vorn::server {

inline constexpr int kMaxDepth = 64;

class SourceWalk {
 public:
  SourceWalk(TreeSink& sink, Manifest& manifest, std::uint64_t budget, const std::atomic<bool>& cancel)
      : sink_(sink), manifest_(manifest), budget_(budget), cancel_(cancel) {}

  /// Walks the folder `relPath` under the folder `baseFd` into the sink's
  /// folder `into`. A missing folder is no error (nothing was logged yet);
  /// one that is not a folder, or cannot be read, is.
  bool walkSource(int baseFd, const std::string& relPath, const std::string& into, std::string* error);

  /// Runs after a folder entry is listed and before it is opened: a seam
  /// through which tests change the tree at the worst moment.
  std::function<void(int dirFd, const std::string& name)> beforeOpen;

 private:
  bool walkFolder(int fd, const std::string& name, const struct stat& st, int depth, std::string* error);
  bool visit(int dirFd, const std::string& name, int depth, std::string* error);
  bool visitFile(int dirFd, const std::string& name, std::string* error);
  std::string pathOf(const std::string& name) const;

  TreeSink& sink_;
  Manifest& manifest_;
  std::uint64_t budget_;
  const std::atomic<bool>& cancel_;
  std::vector<std::string> path_;  // folders entered, for the manifest
};

}  // namespace vorn::server
