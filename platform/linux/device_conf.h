// SPDX-License-Identifier: MIT
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/device.h"

namespace platform {

/// The facts that <root>/etc/vorn/device.conf sets. Every key is optional;
/// `radio` stays unset when missing because its default depends on the
/// hardware (see DeviceInfo).
struct DeviceFacts {
  std::optional<int> radio;
  int product = 0;
  int vendor = 0;
  BuildKind build = BuildKind::customer;
};

/// Parses device.conf text. Unknown keys, malformed lines and values that are
/// not numbers (or not a known build kind) leave the default in place.
DeviceFacts parseDeviceConf(std::string_view text);

/// The name a process runs under: its `comm`, unless the kernel cut that to 15
/// bytes, in which case the first of the executable's base name and argv[0]'s
/// base name that `comm` is a prefix of. Empty `exe`/`argv0` are skipped.
std::string processName(std::string_view comm, std::string_view exe, std::string_view argv0);

}  // namespace platform
