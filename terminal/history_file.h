// SPDX-License-Identifier: MIT
#pragma once

#include <filesystem>
#include <optional>

namespace terminal {

/// Where the prompt's history lives, and whether its folder is ours to create.
struct HistoryLocation {
  std::filesystem::path file;
  bool createFolder = false;

  bool operator==(const HistoryLocation&) const = default;
};

/// VORNTOOL_HISTFILE names the file (empty: keep no history); otherwise
/// "vorntool/history" under XDG_STATE_HOME, or under ~/.local/state when that
/// is unset, empty or relative. Nothing when no home is known. Arguments are
/// the variables' values, null when unset.
std::optional<HistoryLocation> historyLocation(const char* histfile, const char* stateHome,
                                               const char* home);

/// Creates the folder and its missing parents, each readable by the owner
/// only. True when the folder exists afterwards.
bool makePrivateFolder(const std::filesystem::path& folder);

}  // namespace terminal
