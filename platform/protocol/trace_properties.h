// SPDX-License-Identifier: MIT
#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>

/// The server's trace properties as it keeps them in
/// `<root>/var/lib/vorn/trace.properties`, and as the client library reads
/// them while the server is down. Both sides use this one reader, so they
/// always agree on a value.
///
/// The file's syntax, line by line ('\n' ends a line; a last line without
/// one counts):
///   - blanks (space, tab, CR, FF, VT) around a line are ignored;
///   - an empty line, or one whose first non-blank character is '#', is a
///     comment; '#' anywhere else is part of the text, so in
///     `Baseband.Enabled=1 # note` the value is "1 # note";
///   - otherwise the key is the text before the first '=' and the value the
///     rest of the line after it, both without surrounding blanks;
///   - the key is `TraceName.PropertyName`, split at its first '.', both
///     parts non-empty; a line without '=' or with another key is ignored;
///   - a later line for the same key wins.
namespace vorn::protocol {

class TraceProperties {
 public:
  static TraceProperties parse(std::string_view text);

  /// One `key=value` line per property, sorted by key. Values that hold a
  /// line break cannot be written and are left out.
  std::string serialize() const;

  std::optional<std::string> get(std::string_view trace, std::string_view property) const;
  void set(std::string_view trace, std::string_view property, std::string value);

  /// Entries of `other` replace or add to ours.
  void overlay(const TraceProperties& other);

  const std::map<std::string, std::string>& entries() const { return entries_; }

 private:
  std::map<std::string, std::string> entries_;
};

}  // namespace vorn::protocol
