// SPDX-License-Identifier: MIT
#include "platform/logstore/unicode_fold.h"

#include <utf8proc.h>

#include <algorithm>
#include <vector>

namespace logstore {
namespace {

using CodePoint = utf8proc_int32_t;

constexpr CodePoint kReplacement = 0xFFFD;
constexpr auto kFoldOptions = static_cast<utf8proc_option_t>(UTF8PROC_DECOMPOSE | UTF8PROC_CASEFOLD);

// Hangul syllable arithmetic: a syllable is L + V (+ T) conjoining letters.
constexpr CodePoint kSyllableBase = 0xAC00, kLeadBase = 0x1100, kVowelBase = 0x1161, kTrailBase = 0x11A7;
constexpr CodePoint kLeadCount = 19, kVowelCount = 21, kTrailCount = 28;
constexpr CodePoint kSyllableCount = kLeadCount * kVowelCount * kTrailCount;

int combiningClass(CodePoint cp) { return utf8proc_get_property(cp)->combining_class; }

/// Appends the case-folded canonical decomposition of `cp` to `out`, without
/// its nonspacing marks. Other marks (spacing, enclosing) stay: they change
/// the letter rather than decorate it.
void appendFolded(CodePoint cp, std::vector<CodePoint>& out) {
  constexpr utf8proc_ssize_t kRoom = 8;  // more than any decomposition needs
  const std::size_t at = out.size();
  out.resize(at + kRoom);
  int boundClass = 0;
  utf8proc_ssize_t n = utf8proc_decompose_char(cp, out.data() + at, kRoom, kFoldOptions, &boundClass);
  if (n > kRoom) {
    out.resize(at + static_cast<std::size_t>(n));
    n = utf8proc_decompose_char(cp, out.data() + at, n, kFoldOptions, &boundClass);
  }
  out.resize(at + static_cast<std::size_t>(std::max<utf8proc_ssize_t>(n, 0)));
  out.erase(std::remove_if(out.begin() + static_cast<std::ptrdiff_t>(at), out.end(),
                           [](CodePoint c) { return utf8proc_category(c) == UTF8PROC_CATEGORY_MN; }),
            out.end());
}

/// Puts each run of combining marks in canonical order. Done after the
/// nonspacing marks are gone, because their removal can join two runs.
void orderMarks(std::vector<CodePoint>& cps) {
  auto starter = [](CodePoint c) { return combiningClass(c) == 0; };
  for (auto it = std::find_if_not(cps.begin(), cps.end(), starter); it != cps.end();
       it = std::find_if_not(it, cps.end(), starter)) {
    auto end = std::find_if(it, cps.end(), starter);
    std::stable_sort(it, end, [](CodePoint a, CodePoint b) { return combiningClass(a) < combiningClass(b); });
    it = end;
  }
}

/// Joins conjoining Hangul letters back into syllables, so that a fragment
/// never matches part of a syllable, and a syllable typed as letters matches
/// the precomposed one.
void composeSyllables(std::vector<CodePoint>& cps) {
  std::size_t w = 0;
  for (CodePoint cp : cps) {
    if (w > 0) {
      CodePoint& last = cps[w - 1];
      const CodePoint lead = last - kLeadBase, vowel = cp - kVowelBase;
      if (lead >= 0 && lead < kLeadCount && vowel >= 0 && vowel < kVowelCount) {
        last = kSyllableBase + (lead * kVowelCount + vowel) * kTrailCount;
        continue;
      }
      const CodePoint syllable = last - kSyllableBase, trail = cp - kTrailBase;
      if (syllable >= 0 && syllable < kSyllableCount && syllable % kTrailCount == 0 && trail > 0 &&
          trail < kTrailCount) {
        last += trail;
        continue;
      }
    }
    cps[w++] = cp;
  }
  cps.resize(w);
}

}  // namespace

std::string foldForMatch(std::string_view utf8) {
  std::vector<CodePoint> cps;
  cps.reserve(utf8.size());
  const auto* bytes = reinterpret_cast<const utf8proc_uint8_t*>(utf8.data());
  for (std::size_t i = 0; i < utf8.size();) {
    CodePoint cp = 0;
    utf8proc_ssize_t n = utf8proc_iterate(bytes + i, static_cast<utf8proc_ssize_t>(utf8.size() - i), &cp);
    if (n <= 0) cp = kReplacement, n = 1;  // one byte of a malformed sequence
    i += static_cast<std::size_t>(n);
    appendFolded(cp, cps);
  }
  orderMarks(cps);
  composeSyllables(cps);

  std::string out;
  out.reserve(cps.size());
  utf8proc_uint8_t encoded[4];
  for (CodePoint cp : cps)
    out.append(reinterpret_cast<const char*>(encoded), static_cast<std::size_t>(utf8proc_encode_char(cp, encoded)));
  return out;
}

bool containsFolded(std::string_view haystack, std::string_view foldedNeedle) {
  if (foldedNeedle.empty()) return false;
  return foldForMatch(haystack).find(foldedNeedle) != std::string::npos;
}

}  // namespace logstore
