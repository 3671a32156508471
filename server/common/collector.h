// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <cstdint>
#include <ctime>
#include <functional>
#include <string>

#include "server/common/collect_request.h"

/// One log collection into the snapshot folder: a directory
/// `log-bb-<TS><suffix>` with a manifest and copies of the log folders, or
/// with compression the same tree streamed into `log-bb-<TS>.tar.gz` or
/// `.tar`. Sources are walked by descriptor (see source_walk.h) and outputs
/// are never more open than their sources (see output_policy.h).
namespace vorn::server {

/// Directory suffix for `action` with the given radio vendor code.
std::string directorySuffix(CollectAction action, int vendor);

/// True when a name in the snapshot folder belongs to the collection with
/// timestamp `ts`: "log-bb-TS" followed by nothing, a '.', or a '-' that does
/// not start a collision counter ("log-bb-TS-2" belongs to "TS-2").
bool nameUsesTimestamp(const std::string& name, const std::string& ts);

struct CollectOutcome {
  bool ok = false;
  std::string timestamp;
  std::string error;  // why it failed, for the answer's description
};

inline constexpr std::uint64_t kDefaultCollectionBytes = std::uint64_t{1} << 30;

/// Runs collections for one platform root. Not thread-safe: the server runs
/// one collection at a time.
class Collector {
 public:
  struct Options {
    /// Data bytes one collection stores at most; what is beyond is cut and
    /// the manifest says so.
    std::uint64_t maxBytes = kDefaultCollectionBytes;
    std::function<std::time_t()> clock = [] { return std::time(nullptr); };
    /// See SourceWalk::beforeOpen.
    std::function<void(int dirFd, const std::string& name)> beforeOpen;
  };

  explicit Collector(std::string root) : Collector(std::move(root), Options{}) {}
  Collector(std::string root, Options options) : root_(std::move(root)), options_(std::move(options)) {}

  /// Collects. On failure (unreadable source, no space, `cancel`) nothing is
  /// left under a final name and the temporary one is removed.
  CollectOutcome collect(const CollectRequest& request, const std::atomic<bool>& cancel);

  /// Removes what an interrupted earlier run left in the snapshot folder
  /// (`.*.partial`). Collections do it too, before they start.
  void removeLeftovers() const;

 private:
  std::string root_;
  Options options_;
};

}  // namespace vorn::server
