// SPDX-License-Identifier: MIT
#pragma once

#include <compare>
#include <ctime>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

/// Timestamps that name collections: local time "YYYY-MM-DD-HHMMSS", with
/// "-2", "-3" ... appended when the plain one is already taken. A year past
/// 9999 takes as many digits as it needs.
namespace vorn::server {

/// "YYYY-MM-DD-HHMMSS" of `when` in the local time zone. A time before the
/// year 0, or one the calendar functions cannot reach, is named
/// kEarliestTimestamp.
std::string formatTimestamp(std::time_t when);
inline constexpr std::string_view kEarliestTimestamp = "0000-01-01-000000";

/// The first of `base`, `base-2`, `base-3` ... for which `taken` is false.
std::string uniqueTimestamp(const std::string& base, const std::function<bool(const std::string&)>& taken);

/// Sort key of a collection timestamp: the base text and the collision
/// counter (1 for none). Empty when `ts` is not of the form above, so that
/// "-10" orders after "-9" and foreign names are left out.
struct TimestampKey {
  std::string base;
  unsigned long counter = 1;
  friend bool operator==(const TimestampKey&, const TimestampKey&) = default;
  /// A longer base has a year of more digits, which is the later year.
  friend std::strong_ordering operator<=>(const TimestampKey& a, const TimestampKey& b) {
    if (auto bySize = a.base.size() <=> b.base.size(); bySize != 0) return bySize;
    if (auto byText = a.base <=> b.base; byText != 0) return byText;
    return a.counter <=> b.counter;
  }
};
std::optional<TimestampKey> parseTimestamp(std::string_view ts);

}  // namespace vorn::server
