// SPDX-License-Identifier: MIT
#include "server/common/timestamp_naming.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstdio>

namespace vorn::server {

std::string formatTimestamp(std::time_t when) {
  std::tm local{};
  if (localtime_r(&when, &local) == nullptr) return std::string(kEarliestTimestamp);
  // strftime's %Y does not pad a year before 1000.
  const long long year = local.tm_year + 1900LL;
  if (year < 0) return std::string(kEarliestTimestamp);
  char buf[48];
  std::snprintf(buf, sizeof buf, "%04lld-%02d-%02d-%02d%02d%02d", year, local.tm_mon + 1, local.tm_mday,
                local.tm_hour, local.tm_min, local.tm_sec);
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
  // A year of four digits, or more without a leading zero, then
  // "-MM-DD-HHMMSS": digits everywhere except the hyphens.
  const std::size_t yearDigits = std::min(ts.find_first_not_of("0123456789"), ts.size());
  if (yearDigits < 4 || (yearDigits > 4 && ts.front() == '0')) return std::nullopt;
  constexpr std::string_view kShape = "-00-00-000000";
  if (ts.size() < yearDigits + kShape.size()) return std::nullopt;
  for (size_t i = 0; i < kShape.size(); ++i) {
    const char c = ts[yearDigits + i];
    bool fits = kShape[i] == '0' ? std::isdigit(static_cast<unsigned char>(c)) != 0 : c == kShape[i];
    if (!fits) return std::nullopt;
  }
  TimestampKey key{std::string(ts.substr(0, yearDigits + kShape.size())), 1};
  std::string_view rest = ts.substr(yearDigits + kShape.size());
  if (rest.empty()) return key;
  if (rest.size() < 2 || rest.front() != '-' || rest[1] == '0') return std::nullopt;
  rest.remove_prefix(1);
  auto [ptr, ec] = std::from_chars(rest.data(), rest.data() + rest.size(), key.counter);
  if (ec != std::errc() || ptr != rest.data() + rest.size() || key.counter < 2) return std::nullopt;
  return key;
}

}  // namespace vorn::server
