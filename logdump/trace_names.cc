// SPDX-License-Identifier: MIT
#include "logdump/trace_names.h"

#include "toolbase/device_profile.h"

namespace vorn::trace {

// This device's profile fixes each suffix on first use, once per process.
std::string getBasebandTraceDirSuffix() {
  return DeviceProfile::ofThisDevice()->basebandTraceDirSuffix();
}

std::string getCoreDumpDirSuffix() { return DeviceProfile::ofThisDevice()->coreDumpDirSuffix(); }

}  // namespace vorn::trace
