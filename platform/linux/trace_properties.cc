// SPDX-License-Identifier: MIT
#include "platform/linux/trace_properties.h"

#include "platform/linux/text_lines.h"

namespace vorn::bus {

std::optional<std::string> findTraceProperty(std::string_view text, std::string_view traceName,
                                             std::string_view propertyName) {
  if (traceName.empty() || propertyName.empty()) return std::nullopt;
  std::optional<std::string> found;
  forEachSetting(text, [&](std::string_view key, std::string_view value) {
    auto dot = key.find('.');
    if (dot == std::string_view::npos) return;
    if (key.substr(0, dot) == traceName && key.substr(dot + 1) == propertyName)
      found = std::string(value);  // the last line for a key wins, as when it is rewritten
  });
  return found;
}

std::string tracePropertiesPath(const std::string& root) {
  std::string base = root.empty() ? "/" : root;
  while (base.size() > 1 && base.back() == '/') base.pop_back();
  if (base == "/") base.clear();
  return base + "/var/lib/vorn/trace.properties";
}

}  // namespace vorn::bus
