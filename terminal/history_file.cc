// SPDX-License-Identifier: MIT
#include "terminal/history_file.h"

#include <sys/stat.h>

#include <cerrno>

namespace terminal {

std::optional<HistoryLocation> historyLocation(const char* histfile, const char* stateHome,
                                               const char* home) {
  if (histfile) {
    if (!*histfile) return std::nullopt;
    return HistoryLocation{histfile, /* createFolder= */ false};
  }
  std::filesystem::path state;
  if (stateHome && *stateHome == '/') {
    state = stateHome;
  } else if (home && *home) {
    state = std::filesystem::path(home) / ".local" / "state";
  } else {
    return std::nullopt;
  }
  return HistoryLocation{state / "vorntool" / "history", /* createFolder= */ true};
}

bool makePrivateFolder(const std::filesystem::path& folder) {
  std::filesystem::path partial;
  for (const auto& part : folder) {
    partial /= part;
    if (mkdir(partial.c_str(), 0700) != 0 && errno != EEXIST) return false;
  }
  std::error_code error;
  return std::filesystem::is_directory(folder, error);
}

}  // namespace terminal
