// SPDX-License-Identifier: MIT
#include "server/common/device_facts.h"

#include <filesystem>
#include <fstream>
#include <sstream>

#include "server/common/text_util.h"

namespace vorn::server {

namespace {
constexpr int kVendorWithTraceSuffix = 2;
}

DeviceFacts parseDeviceFacts(std::string_view text) {
  DeviceFacts facts;
  for (std::string_view line : splitLines(text)) {
    auto hash = line.find('#');
    if (hash != std::string_view::npos) line = line.substr(0, hash);
    auto eq = line.find('=');
    if (eq == std::string_view::npos) continue;
    std::string_view key = trim(line.substr(0, eq));
    std::string_view value = trim(line.substr(eq + 1));
    if (key.empty()) continue;
    facts.entries.emplace_back(std::string(key), std::string(value));
    if (key == "vendor") {
      long v = 0;
      facts.vendor = parseCount(value, &v) ? static_cast<int>(v) : 0;
    }
  }
  return facts;
}

DeviceFacts loadDeviceFacts(const std::string& root) {
  std::ifstream in(std::filesystem::path(root) / "etc/vorn/device.conf", std::ios::binary);
  if (!in) return {};
  std::ostringstream text;
  text << in.rdbuf();
  return parseDeviceFacts(text.str());
}

std::string basebandTraceSuffix(int vendor) {
  return vendor == kVendorWithTraceSuffix ? "-bb-trace" : "-diag";
}

std::string coreDumpSuffix(int vendor) {
  return vendor == kVendorWithTraceSuffix ? "-coredump" : "-cd";
}

}  // namespace vorn::server
