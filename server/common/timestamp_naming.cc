// SPDX-License-Identifier: MIT
#include "server/common/timestamp_naming.h"

#include <cctype>
#include <charconv>

namespace vorn::server {

std::string formatTimestamp(std::time_t when) {
  std::tm local{};
  localtime_r(&when, &local);
  char buf[32];
  std::strftime(buf, sizeof buf, "%Y-%m-%d-%H%M%S", &local);
  return buf;
}

std::string uniqueTimestamp(const std::string& base, const std::function<bool(const std::string&)>& taken) {
  if (!taken(base)) return base;
  for (unsigned long n = 2;; ++n) {
    std::string candidate = base + "-" + std::to_string(n);
    if (!taken(candidate)) return candidate;
  }
}

std::optional<TimestampKey> parseTimestamp(std::string_view ts) {
  // "YYYY-MM-DD-HHMMSS": digits everywhere except the three hyphens.
  constexpr std::string_view kShape = "0000-00-00-000000";
  if (ts.size() < kShape.size()) return std::nullopt;
  for (size_t i = 0; i < kShape.size(); ++i) {
    bool fits = kShape[i] == '0' ? std::isdigit(static_cast<unsigned char>(ts[i])) != 0 : ts[i] == kShape[i];
    if (!fits) return std::nullopt;
  }
  TimestampKey key{std::string(ts.substr(0, kShape.size())), 1};
  std::string_view rest = ts.substr(kShape.size());
  if (rest.empty()) return key;
  if (rest.size() < 2 || rest.front() != '-' || rest[1] == '0') return std::nullopt;
  rest.remove_prefix(1);
  auto [ptr, ec] = std::from_chars(rest.data(), rest.data() + rest.size(), key.counter);
  if (ec != std::errc() || ptr != rest.data() + rest.size() || key.counter < 2) return std::nullopt;
  return key;
}

}  // namespace vorn::server
