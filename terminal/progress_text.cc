// SPDX-License-Identifier: MIT
#include "terminal/progress_text.h"

#include <algorithm>
#include <cstdio>

namespace terminal {

namespace {
constexpr const char kSpinner[] = {'|', '/', '-', '\\'};
constexpr const char* kEllipsis = "\u2026";
}  // namespace

std::string groupedDigits(std::uint64_t n) {
  const std::string digits = std::to_string(n);
  std::string grouped;
  for (std::size_t i = 0; i < digits.size(); ++i) {
    if (i > 0 && (digits.size() - i) % 3 == 0) grouped += ',';
    grouped += digits[i];
  }
  return grouped;
}

std::string rateText(double perSecond) {
  // Rounded down, so that the figure never claims more than was done.
  // Clamped: a count over a tiny time would not fit the integer.
  const auto whole =
      static_cast<unsigned long long>(perSecond > 0 ? std::min(perSecond, 1e18) : 0.0);
  char text[32];
  if (whole < 1000)
    std::snprintf(text, sizeof text, "%llu/s", whole);
  else if (whole < 1000000)
    std::snprintf(text, sizeof text, "%lluk/s", whole / 1000);
  else
    std::snprintf(text, sizeof text, "%llu.%lluM/s", whole / 1000000, whole / 100000 % 10);
  return text;
}

std::string progressText(Progress::Activity activity, std::chrono::nanoseconds elapsed,
                         std::uint64_t count, unsigned frame) {
  const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(elapsed).count();
  const std::string time = std::to_string(seconds < 0 ? 0 : seconds) + " s";
  if (activity == Progress::Activity::waitingForServer)
    return std::string(1, kSpinner[frame % sizeof kSpinner]) + " waiting for the server" + kEllipsis +
           " " + time;
  const double elapsedSeconds = std::chrono::duration<double>(elapsed).count();
  const double rate = elapsedSeconds > 0 ? static_cast<double>(count) / elapsedSeconds : 0;
  return std::string("exporting") + kEllipsis + " " + groupedDigits(count) +
         (count == 1 ? " entry, " : " entries, ") + rateText(rate) + ", " + time;
}

std::string fitColumns(std::string text, std::size_t columns) {
  std::size_t seen = 0;
  for (std::size_t i = 0; i < text.size(); ++i) {
    // Continuation bytes belong to the character before them.
    if ((static_cast<unsigned char>(text[i]) & 0xC0) == 0x80) continue;
    if (seen++ == columns) {
      text.resize(i);
      break;
    }
  }
  return text;
}

}  // namespace terminal
