// SPDX-License-Identifier: MIT
#include "server/common/device_facts.h"

#include "platform/linux/text_lines.h"
#include "platform/protocol/protocol.h"
#include "server/common/text_util.h"

namespace vorn::server {

DeviceFacts parseDeviceFacts(std::string_view text) {
  // The same reading of device.conf as the client library's.
  DeviceFacts facts;
  bus::forEachSetting(text, [&](std::string_view key, std::string_view value) {
    facts.entries.emplace_back(std::string(key), std::string(value));
    if (key == "vendor") {
      long v = 0;
      facts.vendor = parseCount(value, &v) ? static_cast<int>(v) : 0;
    }
  });
  return facts;
}

DeviceFacts loadDeviceFacts(const std::string& root) {
  return parseDeviceFacts(bus::readSmallFile(protocol::underRoot(root, protocol::kDeviceConfPath)));
}

}  // namespace vorn::server
