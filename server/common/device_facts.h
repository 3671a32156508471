// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

/// The device facts the daemons need from `<root>/etc/vorn/device.conf`: the
/// radio vendor (it names the collection directories) and the raw entries
/// for the manifest.
namespace vorn::server {

struct DeviceFacts {
  int vendor = 0;
  /// Every well-formed `key=value` entry, in file order, for the manifest.
  std::vector<std::pair<std::string, std::string>> entries;
};

/// Reads device.conf text: `#` starts a comment, blanks around keys and
/// values are ignored, malformed lines are skipped. A missing or non-numeric
/// vendor counts as 0.
DeviceFacts parseDeviceFacts(std::string_view text);

/// Reads `<root>/etc/vorn/device.conf`; a missing file gives the defaults.
DeviceFacts loadDeviceFacts(const std::string& root);

}  // namespace vorn::server
