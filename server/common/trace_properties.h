// SPDX-License-Identifier: MIT
#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>

/// The server's persisted trace properties: `<root>/var/lib/vorn/trace.properties`,
/// one `TraceName.PropertyName=value` line each. The client library reads the
/// same file while the server is down, so the format is part of the protocol.
namespace vorn::server {

class TraceProperties {
 public:
  /// The values the server starts with when the file does not say otherwise.
  static TraceProperties defaults();

  /// Parses the file's text. Blank lines and lines starting with '#' are
  /// skipped; blanks around key and value are trimmed; a line without '=' or
  /// without a "Trace.Property" key is ignored. A later line wins.
  static TraceProperties parse(std::string_view text);

  /// One line per property, sorted by key, each ending in '\n'.
  std::string serialize() const;

  std::optional<std::string> get(std::string_view trace, std::string_view property) const;
  void set(std::string_view trace, std::string_view property, std::string value);

  /// Entries of `other` replace or add to ours.
  void overlay(const TraceProperties& other);

  const std::map<std::string, std::string>& entries() const { return entries_; }

 private:
  std::map<std::string, std::string> entries_;
};

/// Where the file lies under the platform root.
std::string tracePropertiesPath(const std::string& root);

/// Loads the properties for a starting server: the defaults overlaid by the
/// file. When the file is missing the defaults are written to it (creating
/// its folder). `error` receives a message when the file exists but cannot be
/// read, or cannot be written back; the defaults are used then.
TraceProperties loadTraceProperties(const std::string& root, std::string* error);

/// Writes `props` atomically (temporary file, then rename). False on failure.
bool saveTraceProperties(const std::string& path, const TraceProperties& props, std::string* error);

}  // namespace vorn::server
