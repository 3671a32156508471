// SPDX-License-Identifier: MIT
#pragma once

#include <utf8proc.h>

#include <cstddef>
#include <string_view>

namespace fuzz {

/// Calls `accept` with each code point of `utf8` until it returns false.
/// False when it did, or when `utf8` is not well-formed UTF-8 (checked by
/// utf8proc, not by the code under test).
template <class Accept>
bool everyCodePoint(std::string_view utf8, Accept accept) {
  const auto* p = reinterpret_cast<const utf8proc_uint8_t*>(utf8.data());
  for (std::size_t i = 0; i < utf8.size();) {
    utf8proc_int32_t cp = 0;
    const auto n = utf8proc_iterate(p + i, static_cast<utf8proc_ssize_t>(utf8.size() - i), &cp);
    if (n <= 0 || !accept(cp)) return false;
    i += static_cast<std::size_t>(n);
  }
  return true;
}

inline bool validUtf8(std::string_view text) {
  return everyCodePoint(text, [](utf8proc_int32_t) { return true; });
}

}  // namespace fuzz
