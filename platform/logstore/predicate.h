// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/logstore/log_event.h"

namespace logstore {

/// The export's filter: "process == name" for each process name (exact,
/// case-sensitive) OR "senderImagePath CONTAINS[cd] fragment" for each image
/// fragment (ignoring case and diacritics). No terms at all means no filter.
class Predicate {
 public:
  Predicate() = default;
  Predicate(std::vector<std::string> processes, std::vector<std::string> imageFragments);

  bool empty() const { return processes_.empty() && fragments_.empty(); }
  const std::vector<std::string>& processes() const { return processes_; }
  const std::vector<std::string>& imageFragments() const { return fragments_; }

  bool matchesProcess(std::string_view process) const;
  bool matchesImagePath(std::string_view imagePath) const;
  /// True for every event when empty; otherwise true when any term holds.
  bool matches(const Event& event) const;

 private:
  std::vector<std::string> processes_;
  std::vector<std::string> fragments_;
  std::vector<std::string> foldedFragments_;
};

}  // namespace logstore
