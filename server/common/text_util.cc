// SPDX-License-Identifier: MIT
#include "server/common/text_util.h"

#include <charconv>
#include <cstdint>

namespace vorn::server {

std::vector<std::string_view> splitLines(std::string_view text) {
  std::vector<std::string_view> lines;
  while (!text.empty()) {
    auto nl = text.find('\n');
    if (nl == std::string_view::npos) {
      lines.push_back(text);
      break;
    }
    lines.push_back(text.substr(0, nl));
    text.remove_prefix(nl + 1);
  }
  return lines;
}

bool parseStatus(std::string_view text, int* out) {
  bool negative = false;
  if (!text.empty() && text.front() == '-') {
    negative = true;
    text.remove_prefix(1);
  }
  int base = 10;
  if (text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) {
    if (negative) return false;
    base = 16;
    text.remove_prefix(2);
  }
  if (text.empty()) return false;
  std::uint64_t value = 0;
  auto [ptr, ec] = std::from_chars(text.data(), text.data() + text.size(), value, base);
  if (ec != std::errc() || ptr != text.data() + text.size()) return false;
  if (negative) {
    if (value > 0x80000000ULL) return false;
    *out = static_cast<int>(-static_cast<std::int64_t>(value));
    return true;
  }
  if (value > 0xFFFFFFFFULL) return false;
  *out = static_cast<int>(static_cast<std::uint32_t>(value));
  return true;
}

bool parseCount(std::string_view text, long* out) {
  if (text.empty()) return false;
  long value = 0;
  auto [ptr, ec] = std::from_chars(text.data(), text.data() + text.size(), value, 10);
  if (ec != std::errc() || ptr != text.data() + text.size() || value < 0 || value > 0x7FFFFFFFL) return false;
  *out = value;
  return true;
}

std::string oneLine(std::string_view text, size_t limit) {
  std::string out(text.substr(0, limit));
  for (char& c : out) {
    if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F) c = '?';
  }
  return out;
}

}  // namespace vorn::server
