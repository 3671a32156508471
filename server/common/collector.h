// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <ctime>
#include <functional>
#include <string>

#include "server/common/collect_request.h"

/// One log collection into the snapshot folder: a directory
/// `log-bb-<TS><suffix>` with a manifest and copies of the log folders,
/// optionally packed into `log-bb-<TS>.tar.gz` or `.tar`.
namespace vorn::server {

/// The snapshot folder under the platform root.
std::string snapshotFolder(const std::string& root);

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

/// Runs collections for one platform root. Not thread-safe: the server runs
/// one collection at a time.
class Collector {
 public:
  explicit Collector(std::string root, std::function<std::time_t()> clock = [] { return std::time(nullptr); });

  /// Collects. On failure (unreadable source, no space, `cancel`) nothing is
  /// left under a final name and the working directory is removed.
  CollectOutcome collect(const CollectRequest& request, const std::atomic<bool>& cancel);

 private:
  std::string root_;
  std::function<std::time_t()> clock_;
};

}  // namespace vorn::server
