// SPDX-License-Identifier: MIT
#include "logdump/trace_names.h"

#include "platform/device.h"

namespace vorn::trace {

namespace {
constexpr int kVendorWithTraceNames = 2;
}

std::string getBasebandTraceDirSuffix() {
  // Function statics: built once, thread-safe, and asking the vendor only then.
  static const std::string suffix =
      TelephonyRadiosGetRadioVendor() == kVendorWithTraceNames ? "-bb-trace" : "-diag";
  return suffix;
}

std::string getCoreDumpDirSuffix() {
  static const std::string suffix =
      TelephonyRadiosGetRadioVendor() == kVendorWithTraceNames ? "-coredump" : "-cd";
  return suffix;
}

}  // namespace vorn::trace
