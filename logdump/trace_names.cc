// SPDX-License-Identifier: MIT
#include "logdump/trace_names.h"

#include "platform/device.h"

namespace vorn::trace {

std::string getBasebandTraceDirSuffix() {
  // Function statics: built once, thread-safe, and asking the vendor only then.
  static const std::string suffix = basebandTraceDirSuffix(TelephonyRadiosGetRadioVendor());
  return suffix;
}

std::string getCoreDumpDirSuffix() {
  static const std::string suffix = coreDumpDirSuffix(TelephonyRadiosGetRadioVendor());
  return suffix;
}

}  // namespace vorn::trace
