// SPDX-License-Identifier: MIT
#include "platform/logstore/unicode_fold.h"

#include <algorithm>
#include <cstdint>

namespace logstore {
namespace {

struct CodeRange {
  char32_t first;
  char32_t last;
};
struct SingleFold {
  char32_t from;
  char32_t to;
};
struct MultiFold {
  char32_t from;
  char32_t to[3];  // zero-padded
};

#include "platform/logstore/unicode_fold_table.inc"

constexpr char32_t kReplacement = 0xFFFD;

/// Decodes one UTF-8 sequence at `s[i]`, advancing `i`; malformed input
/// (overlong forms, surrogates, values past U+10FFFF, truncation) yields
/// U+FFFD and consumes one byte.
char32_t decode(std::string_view s, std::size_t& i) {
  const auto b0 = static_cast<unsigned char>(s[i]);
  if (b0 < 0x80) {
    ++i;
    return b0;
  }
  int len;
  char32_t cp;
  char32_t min;
  if ((b0 & 0xE0) == 0xC0) {
    len = 2, cp = b0 & 0x1F, min = 0x80;
  } else if ((b0 & 0xF0) == 0xE0) {
    len = 3, cp = b0 & 0x0F, min = 0x800;
  } else if ((b0 & 0xF8) == 0xF0) {
    len = 4, cp = b0 & 0x07, min = 0x10000;
  } else {
    ++i;
    return kReplacement;
  }
  if (i + len > s.size()) {
    ++i;
    return kReplacement;
  }
  for (int k = 1; k < len; ++k) {
    const auto b = static_cast<unsigned char>(s[i + k]);
    if ((b & 0xC0) != 0x80) {
      ++i;
      return kReplacement;
    }
    cp = (cp << 6) | (b & 0x3F);
  }
  if (cp < min || cp > 0x10FFFF || (cp >= 0xD800 && cp < 0xE000)) {
    ++i;
    return kReplacement;
  }
  i += len;
  return cp;
}

void encode(char32_t cp, std::string& out) {
  if (cp < 0x80) {
    out.push_back(static_cast<char>(cp));
  } else if (cp < 0x800) {
    out.push_back(static_cast<char>(0xC0 | (cp >> 6)));
    out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
  } else if (cp < 0x10000) {
    out.push_back(static_cast<char>(0xE0 | (cp >> 12)));
    out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
  } else {
    out.push_back(static_cast<char>(0xF0 | (cp >> 18)));
    out.push_back(static_cast<char>(0x80 | ((cp >> 12) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
  }
}

bool isMark(char32_t cp) {
  auto it = std::upper_bound(std::begin(kMarkRanges), std::end(kMarkRanges), cp,
                             [](char32_t c, const CodeRange& r) { return c < r.first; });
  return it != std::begin(kMarkRanges) && cp <= std::prev(it)->last;
}

void appendFolded(char32_t cp, std::string& out) {
  if (cp < 0x80) {
    out.push_back(static_cast<char>(cp >= 'A' && cp <= 'Z' ? cp + ('a' - 'A') : cp));
    return;
  }
  if (isMark(cp)) return;
  auto single = std::lower_bound(std::begin(kSingleFolds), std::end(kSingleFolds), cp,
                                 [](const SingleFold& f, char32_t c) { return f.from < c; });
  if (single != std::end(kSingleFolds) && single->from == cp) {
    encode(single->to, out);
    return;
  }
  auto multi = std::lower_bound(std::begin(kMultiFolds), std::end(kMultiFolds), cp,
                                [](const MultiFold& f, char32_t c) { return f.from < c; });
  if (multi != std::end(kMultiFolds) && multi->from == cp) {
    for (char32_t to : multi->to)
      if (to != 0) encode(to, out);
    return;
  }
  encode(cp, out);
}

}  // namespace

std::string foldForMatch(std::string_view utf8) {
  std::string out;
  out.reserve(utf8.size());
  for (std::size_t i = 0; i < utf8.size();) appendFolded(decode(utf8, i), out);
  return out;
}

bool containsFolded(std::string_view haystack, std::string_view foldedNeedle) {
  if (foldedNeedle.empty()) return false;
  return foldForMatch(haystack).find(foldedNeedle) != std::string::npos;
}

}  // namespace logstore
