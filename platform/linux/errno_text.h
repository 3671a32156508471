// SPDX-License-Identifier: MIT
#pragma once

#include <string>

namespace vorn {

/// The system's text for `err` ("No space left on device"). Unlike strerror
/// it is safe on any thread: the client, the collector and the export all
/// report errors from threads of their own.
std::string errnoText(int err);

/// "`what`: " followed by the text for `err`.
std::string errnoText(const std::string& what, int err);

}  // namespace vorn
