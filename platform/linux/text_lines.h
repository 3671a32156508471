// SPDX-License-Identifier: MIT
#pragma once

#include <functional>
#include <string>
#include <string_view>

namespace vorn::bus {

/// Without leading and trailing blanks (space, tab, CR, FF, VT).
std::string_view trim(std::string_view s);

/// Calls `setting` for each `key=value` line of `text`: '#' starts a comment,
/// blanks around keys and values are dropped, and lines without '=' or with
/// an empty key are skipped.
void forEachSetting(std::string_view text,
                    const std::function<void(std::string_view key, std::string_view value)>& setting);

/// The content of a small regular file, at most `limit` bytes; empty when it
/// cannot be read or is not a regular file. The open never waits (a FIFO
/// with no writer would block it for ever), and nothing else is read.
std::string readSmallFile(const std::string& path, std::size_t limit = 1 << 20);

}  // namespace vorn::bus
