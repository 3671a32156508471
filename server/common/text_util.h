// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "platform/linux/text_lines.h"

/// Small text helpers shared by the daemons' file readers.
namespace vorn::server {

using bus::trim;

/// The lines of `text`, without their '\n'; a final line without one counts.
std::vector<std::string_view> splitLines(std::string_view text);

/// Parses a whole decimal or "0x" hexadecimal number that fits in 32 bits
/// (signed, or unsigned read as its two's-complement bit pattern, so that
/// "0xE0200001" gives the protocol's status). False for anything else.
bool parseStatus(std::string_view text, int* out);

/// Parses a whole non-negative decimal number below 2^31.
bool parseCount(std::string_view text, long* out);

/// `text` cut to `limit` bytes with control characters replaced by '?', fit
/// for one line of a text file.
std::string oneLine(std::string_view text, size_t limit);

}  // namespace vorn::server
