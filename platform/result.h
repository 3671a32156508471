// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <string>

#include "platform/protocol/protocol.h"

namespace TelephonyXPC {

/// Outcome of one request to the server or its helper service.
struct Result {
  std::int32_t status = 0;  // 0 = success
  std::string description;
};

}  // namespace TelephonyXPC
