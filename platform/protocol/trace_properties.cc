// SPDX-License-Identifier: MIT
#include "platform/protocol/trace_properties.h"

namespace vorn::protocol {

namespace {

std::string_view trimmed(std::string_view s) {
  constexpr std::string_view kBlanks = " \t\r\f\v";
  auto first = s.find_first_not_of(kBlanks);
  if (first == std::string_view::npos) return {};
  return s.substr(first, s.find_last_not_of(kBlanks) - first + 1);
}

std::string keyOf(std::string_view trace, std::string_view property) {
  std::string key(trace);
  key += '.';
  key += property;
  return key;
}

}  // namespace

TraceProperties TraceProperties::parse(std::string_view text) {
  TraceProperties properties;
  while (!text.empty()) {
    auto end = text.find('\n');
    std::string_view line = trimmed(text.substr(0, end));
    text = end == std::string_view::npos ? std::string_view() : text.substr(end + 1);
    if (line.empty() || line.front() == '#') continue;
    auto eq = line.find('=');
    if (eq == std::string_view::npos) continue;
    std::string_view key = trimmed(line.substr(0, eq));
    auto dot = key.find('.');
    if (dot == 0 || dot == std::string_view::npos || dot + 1 == key.size()) continue;
    properties.entries_[std::string(key)] = std::string(trimmed(line.substr(eq + 1)));
  }
  return properties;
}

std::string TraceProperties::serialize() const {
  std::string out;
  for (const auto& [key, value] : entries_) {
    if (value.find('\n') != std::string::npos) continue;
    out += key;
    out += '=';
    out += value;
    out += '\n';
  }
  return out;
}

std::optional<std::string> TraceProperties::get(std::string_view trace, std::string_view property) const {
  auto it = entries_.find(keyOf(trace, property));
  if (it == entries_.end()) return std::nullopt;
  return it->second;
}

void TraceProperties::set(std::string_view trace, std::string_view property, std::string value) {
  entries_[keyOf(trace, property)] = std::move(value);
}

void TraceProperties::overlay(const TraceProperties& other) {
  for (const auto& [key, value] : other.entries_) entries_[key] = value;
}

}  // namespace vorn::protocol
