// SPDX-License-Identifier: MIT
#pragma once

#include <optional>
#include <string>
#include <string_view>

/// The server's persisted trace properties, `TraceName.PropertyName=value`
/// per line, which the client library reads while the server is down.
namespace vorn::bus {

/// The value of `traceName.propertyName` in the text of a trace.properties
/// file; blanks around keys and values are ignored, other lines are skipped.
std::optional<std::string> findTraceProperty(std::string_view text, std::string_view traceName,
                                             std::string_view propertyName);

/// <root>/var/lib/vorn/trace.properties for a platform root such as "/".
std::string tracePropertiesPath(const std::string& root);

}  // namespace vorn::bus
