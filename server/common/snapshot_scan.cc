// SPDX-License-Identifier: MIT
#include "server/common/snapshot_scan.h"

#include <filesystem>

#include "platform/protocol/protocol.h"
#include "server/common/timestamp_naming.h"

namespace vorn::server {

std::string snapshotFolder(const std::string& root) {
  return protocol::underRoot(root, trace::kSnapshotFolder);
}

namespace fs = std::filesystem;

std::optional<std::string> newestTimestamp(const std::vector<std::string>& names, const std::string& suffix) {
  const std::string kPrefix = trace::kLogDirPrefix;
  std::optional<std::string> best;
  std::optional<TimestampKey> bestKey;
  for (const auto& name : names) {
    if (name.size() <= kPrefix.size() + suffix.size()) continue;
    if (name.compare(0, kPrefix.size(), kPrefix) != 0) continue;
    if (name.compare(name.size() - suffix.size(), suffix.size(), suffix) != 0) continue;
    std::string ts = name.substr(kPrefix.size(), name.size() - kPrefix.size() - suffix.size());
    auto key = parseTimestamp(ts);
    if (!key) continue;
    if (!bestKey || *bestKey < *key) {
      bestKey = key;
      best = ts;
    }
  }
  return best;
}

std::optional<std::string> newestSnapshotTimestamp(const std::string& folder, const std::string& suffix) {
  std::vector<std::string> names;
  std::error_code ec;
  for (fs::directory_iterator it(folder, ec); !ec && it != fs::directory_iterator(); it.increment(ec)) {
    std::error_code typeError;
    if (it->is_directory(typeError)) names.push_back(it->path().filename().string());
  }
  return newestTimestamp(names, suffix);
}

}  // namespace vorn::server
