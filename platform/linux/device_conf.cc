// SPDX-License-Identifier: MIT
#include "platform/linux/device_conf.h"

#include <charconv>

#include "platform/linux/text_lines.h"

namespace platform {
namespace {

std::optional<int> parseInt(std::string_view text) {
  if (!text.empty() && text.front() == '+') text.remove_prefix(1);
  int value = 0;
  auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), value);
  if (ec != std::errc() || end != text.data() + text.size() || text.empty()) return std::nullopt;
  return value;
}

std::string_view baseName(std::string_view path) {
  auto slash = path.rfind('/');
  return slash == std::string_view::npos ? path : path.substr(slash + 1);
}

// TASK_COMM_LEN is 16 with the terminating NUL.
constexpr std::size_t kCommLength = 15;

}  // namespace

DeviceFacts parseDeviceConf(std::string_view text) {
  DeviceFacts facts;
  vorn::bus::forEachSetting(text, [&](std::string_view key, std::string_view value) {
    if (key == "radio") {
      if (auto v = parseInt(value)) facts.radio = *v;
    } else if (key == "product") {
      if (auto v = parseInt(value)) facts.product = *v;
    } else if (key == "vendor") {
      if (auto v = parseInt(value)) facts.vendor = *v;
    } else if (key == "build") {
      if (value == "internal") facts.build = BuildKind::internal;
      else if (value == "carrier") facts.build = BuildKind::carrier;
      else if (value == "customer") facts.build = BuildKind::customer;
    }
  });
  return facts;
}

std::string processName(std::string_view comm, std::string_view exe, std::string_view argv0) {
  if (comm.size() < kCommLength) return std::string(comm);
  // A deleted executable's link reads "/path (deleted)".
  constexpr std::string_view kDeleted = " (deleted)";
  if (exe.size() > kDeleted.size() && exe.substr(exe.size() - kDeleted.size()) == kDeleted)
    exe.remove_suffix(kDeleted.size());
  for (auto candidate : {baseName(exe), baseName(argv0)}) {
    if (candidate.size() >= comm.size() && candidate.substr(0, comm.size()) == comm)
      return std::string(candidate);
  }
  return std::string(comm);
}

}  // namespace platform
