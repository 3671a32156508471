// SPDX-License-Identifier: MIT
#include "toolbase/config.h"

#include <cstdint>

#include "platform/device.h"

namespace config {

bool hw::watch() {
  // Bit n stands for product 58 + n; the unsigned offset puts every code
  // below 58 far out of range.
  constexpr std::uint32_t kWatchProducts = 0x7800180F;
  const std::uint32_t offset = static_cast<std::uint32_t>(TelephonyRadiosGetProduct()) - 58u;
  return offset <= 30 && ((kWatchProducts >> offset) & 1u) != 0;
}

bool build::internal_or_carrier() {
  return TelephonyUtilIsInternalBuild() || TelephonyUtilIsCarrierBuild();
}

}  // namespace config
