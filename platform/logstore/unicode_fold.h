// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <string_view>

namespace logstore {

/// Folds UTF-8 text for comparisons that ignore case and diacritics: each
/// character becomes the case fold of its canonical decomposition without
/// nonspacing marks (general category Mn), for all of Unicode, with the
/// Unicode data of utf8proc. Hangul syllables stay whole. Each byte of a
/// malformed sequence becomes U+FFFD. Folding a fold changes nothing.
std::string foldForMatch(std::string_view utf8);

/// True when `haystack` contains `needle` ignoring case and diacritics.
/// `foldedNeedle` must come from foldForMatch; an empty needle matches
/// nothing, as a search for an empty string finds no range.
bool containsFolded(std::string_view haystack, std::string_view foldedNeedle);

}  // namespace logstore
