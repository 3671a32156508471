// SPDX-License-Identifier: MIT
#pragma once

#include <optional>
#include <string>
#include <vector>

/// Where collections go, and the newest baseband snapshot directory there,
/// for the helper service.
namespace vorn::server {

/// The snapshot folder under the platform root.
std::string snapshotFolder(const std::string& root);

/// Among `names` (directory names), the timestamp of the newest
/// "log-bb-<TS><suffix>". Newest by timestamp order, not by modification
/// time: the timestamp is what names the collection, and copying a folder
/// around would change its mtime. The collision counter counts numerically,
/// so "TS-10" is newer than "TS-9". Names whose middle is not a collection
/// timestamp are ignored.
std::optional<std::string> newestTimestamp(const std::vector<std::string>& names, const std::string& suffix);

/// The same over the directories (not files) in `folder`.
std::optional<std::string> newestSnapshotTimestamp(const std::string& folder, const std::string& suffix);

}  // namespace vorn::server
