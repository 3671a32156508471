// SPDX-License-Identifier: MIT
#pragma once

#include <ctime>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

/// Timestamps that name collections: local time "YYYY-MM-DD-HHMMSS", with
/// "-2", "-3" ... appended when the plain one is already taken.
namespace vorn::server {

/// "YYYY-MM-DD-HHMMSS" of `when` in the local time zone.
std::string formatTimestamp(std::time_t when);

/// The first of `base`, `base-2`, `base-3` ... for which `taken` is false.
std::string uniqueTimestamp(const std::string& base, const std::function<bool(const std::string&)>& taken);

/// Sort key of a collection timestamp: the base text and the collision
/// counter (1 for none). Empty when `ts` is not of the form above, so that
/// "-10" orders after "-9" and foreign names are left out.
struct TimestampKey {
  std::string base;
  unsigned long counter = 1;
  friend auto operator<=>(const TimestampKey&, const TimestampKey&) = default;
};
std::optional<TimestampKey> parseTimestamp(std::string_view ts);

}  // namespace vorn::server
