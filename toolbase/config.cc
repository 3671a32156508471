// SPDX-License-Identifier: MIT
#include "toolbase/config.h"

#include "toolbase/device_profile.h"

namespace config {

bool hw::watch() { return DeviceProfile::ofThisDevice()->watch(); }

bool build::internal_or_carrier() { return DeviceProfile::ofThisDevice()->internalOrCarrier(); }

}  // namespace config
