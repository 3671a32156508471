// SPDX-License-Identifier: MIT
#pragma once

#include <chrono>
#include <cstdint>
#include <string>

#include "framework/progress.h"

/// The words of the progress line, apart from how it is drawn.
namespace terminal {

/// `n` with a comma between groups of three digits: "1,234,567".
std::string groupedDigits(std::uint64_t n);

/// A rate per second, short: "950/s", "612k/s", "2.5M/s".
std::string rateText(double perSecond);

/// What the line says, without control sequences:
///   "| waiting for the server… 12 s"   (the spinner turns with `frame`)
///   "exporting… 1,234,567 entries, 612k/s, 2 s"
/// Seconds are whole and counted down; the rate is `count` over `elapsed`.
std::string progressText(Progress::Activity activity, std::chrono::nanoseconds elapsed,
                         std::uint64_t count, unsigned frame);

/// `text` cut after `columns` characters, never inside a UTF-8 sequence.
std::string fitColumns(std::string text, std::size_t columns);

}  // namespace terminal
