// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <string_view>

namespace logstore {

/// Folds UTF-8 text for comparisons that ignore case and diacritics: each
/// character becomes the case fold of its canonical decomposition without
/// nonspacing marks, for all of Unicode (tables generated from the Unicode
/// data by tools/gen_fold_table.py). Invalid bytes become U+FFFD.
std::string foldForMatch(std::string_view utf8);

/// True when `haystack` contains `needle` ignoring case and diacritics.
/// `foldedNeedle` must come from foldForMatch; an empty needle matches
/// nothing, as a search for an empty string finds no range.
bool containsFolded(std::string_view haystack, std::string_view foldedNeedle);

}  // namespace logstore
