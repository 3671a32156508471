// SPDX-License-Identifier: MIT
#include "terminal/completion_display.h"

#include <algorithm>

namespace terminal {

CompletionStep planCompletion(const Completions& completions) {
  const auto& candidates = completions.candidates;
  if (candidates.empty()) return {};
  if (candidates.size() == 1) {
    const std::string& only = candidates.front();
    if (!only.starts_with(completions.word)) return {};
    return {only.substr(completions.word.size()) + " ", false};
  }
  std::size_t common = candidates.front().size();
  for (const auto& candidate : candidates) {
    auto mismatch = std::mismatch(candidates.front().begin(),
                                  candidates.front().begin() + static_cast<std::ptrdiff_t>(common),
                                  candidate.begin(), candidate.end());
    common = static_cast<std::size_t>(mismatch.first - candidates.front().begin());
  }
  if (common > completions.word.size() && candidates.front().starts_with(completions.word))
    return {candidates.front().substr(completions.word.size(), common - completions.word.size()),
            false};
  return {"", true};
}

std::vector<std::string> listedNames(const Completions& completions) {
  const auto slash = completions.word.rfind('/');
  if (slash == std::string::npos) return completions.candidates;
  std::vector<std::string> names;
  for (const auto& candidate : completions.candidates) names.push_back(candidate.substr(slash + 1));
  return names;
}

std::string formatColumns(const std::vector<std::string>& names, std::size_t width) {
  if (names.empty()) return "";
  std::size_t longest = 0;
  for (const auto& name : names) longest = std::max(longest, name.size());
  const std::size_t cell = longest + 2;
  // The last column needs no gap, and a line one short of the width never
  // leaves the cursor waiting at the margin.
  const std::size_t columns = std::max<std::size_t>(1, (width + 1) / cell);
  const std::size_t rows = (names.size() + columns - 1) / columns;
  std::string text;
  for (std::size_t row = 0; row < rows; ++row) {
    std::string line;
    for (std::size_t column = 0; column < columns; ++column) {
      const std::size_t index = column * rows + row;
      if (index >= names.size()) break;
      line.resize(column * cell, ' ');
      line += names[index];
    }
    text += line + "\n";
  }
  return text;
}

}  // namespace terminal
