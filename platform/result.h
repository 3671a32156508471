// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <string>

namespace TelephonyXPC {

/// Outcome of one request to the server or its helper service.
struct Result {
  std::int32_t status = 0;  // 0 = success
  std::string description;
};

}  // namespace TelephonyXPC

/// The server's name has no owner, or no bus can be reached.
inline constexpr std::int32_t kResultServerNotRunning = static_cast<std::int32_t>(0xE020E001);
