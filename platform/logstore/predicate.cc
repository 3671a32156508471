// SPDX-License-Identifier: MIT
#include "platform/logstore/predicate.h"

#include <algorithm>

#include "platform/logstore/unicode_fold.h"

namespace logstore {

Predicate::Predicate(std::vector<std::string> processes, std::vector<std::string> imageFragments)
    : processes_(std::move(processes)), fragments_(std::move(imageFragments)) {
  foldedFragments_.reserve(fragments_.size());
  for (const auto& f : fragments_) foldedFragments_.push_back(foldForMatch(f));
}

bool Predicate::matchesProcess(std::string_view process) const {
  return std::find(processes_.begin(), processes_.end(), process) != processes_.end();
}

bool Predicate::matchesImagePath(std::string_view imagePath) const {
  return std::any_of(foldedFragments_.begin(), foldedFragments_.end(),
                     [&](const std::string& f) { return containsFolded(imagePath, f); });
}

bool Predicate::matches(const Event& event) const {
  if (empty()) return true;
  if (event.process.has() && matchesProcess(event.process.view())) return true;
  return event.senderImagePath.has() && matchesImagePath(event.senderImagePath.view());
}

}  // namespace logstore
