// SPDX-License-Identifier: MIT
#include "server/common/device_facts.h"

#include <filesystem>

#include "platform/linux/text_lines.h"
#include "server/common/text_util.h"

namespace vorn::server {

namespace {
constexpr int kVendorWithTraceSuffix = 2;
}

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
  return parseDeviceFacts(bus::readSmallFile((std::filesystem::path(root) / "etc/vorn/device.conf").string()));
}

std::string basebandTraceSuffix(int vendor) {
  return vendor == kVendorWithTraceSuffix ? "-bb-trace" : "-diag";
}

std::string coreDumpSuffix(int vendor) {
  return vendor == kVendorWithTraceSuffix ? "-coredump" : "-cd";
}

}  // namespace vorn::server
