// SPDX-License-Identifier: MIT
#include "server/common/trace_properties.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <system_error>

#include "platform/vorn_constants.h"
#include "server/common/text_util.h"

namespace vorn::server {

namespace fs = std::filesystem;

TraceProperties TraceProperties::defaults() {
  TraceProperties p;
  p.set(kTraceBaseband, kKeyTraceEnabled, "1");
  p.set(kTraceSystemLogs, kKeyTraceMode, "1");
  return p;
}

TraceProperties TraceProperties::parse(std::string_view text) {
  TraceProperties p;
  for (std::string_view line : splitLines(text)) {
    line = trim(line);
    if (line.empty() || line.front() == '#') continue;
    auto eq = line.find('=');
    if (eq == std::string_view::npos) continue;
    std::string_view key = trim(line.substr(0, eq));
    auto dot = key.find('.');
    if (dot == 0 || dot == std::string_view::npos || dot + 1 == key.size()) continue;
    p.entries_[std::string(key)] = std::string(trim(line.substr(eq + 1)));
  }
  return p;
}

std::string TraceProperties::serialize() const {
  std::string out;
  for (const auto& [key, value] : entries_) {
    out += key;
    out += '=';
    out += value;
    out += '\n';
  }
  return out;
}

std::optional<std::string> TraceProperties::get(std::string_view trace, std::string_view property) const {
  std::string key(trace);
  key += '.';
  key += property;
  auto it = entries_.find(key);
  if (it == entries_.end()) return std::nullopt;
  return it->second;
}

void TraceProperties::set(std::string_view trace, std::string_view property, std::string value) {
  std::string key(trace);
  key += '.';
  key += property;
  entries_[std::move(key)] = std::move(value);
}

void TraceProperties::overlay(const TraceProperties& other) {
  for (const auto& [key, value] : other.entries_) entries_[key] = value;
}

std::string tracePropertiesPath(const std::string& root) {
  return (fs::path(root) / "var/lib/vorn/trace.properties").string();
}

bool saveTraceProperties(const std::string& path, const TraceProperties& props, std::string* error) {
  std::error_code ec;
  fs::create_directories(fs::path(path).parent_path(), ec);
  if (ec) {
    *error = "cannot create the folder of " + path + ": " + ec.message();
    return false;
  }
  std::string tmp = path + ".tmp";
  {
    std::ofstream out(tmp, std::ios::binary | std::ios::trunc);
    out << props.serialize();
    out.flush();
    if (!out) {
      *error = "cannot write " + tmp;
      fs::remove(tmp, ec);
      return false;
    }
  }
  fs::rename(tmp, path, ec);
  if (ec) {
    *error = "cannot rename " + tmp + ": " + ec.message();
    fs::remove(tmp, ec);
    return false;
  }
  return true;
}

TraceProperties loadTraceProperties(const std::string& root, std::string* error) {
  TraceProperties props = TraceProperties::defaults();
  std::string path = tracePropertiesPath(root);
  std::ifstream in(path, std::ios::binary);
  if (!in) {
    int err = errno;
    if (err == ENOENT) {
      saveTraceProperties(path, props, error);
    } else {
      *error = "cannot read " + path + ": " + std::strerror(err);
    }
    return props;
  }
  std::ostringstream text;
  text << in.rdbuf();
  props.overlay(TraceProperties::parse(text.str()));
  return props;
}

}  // namespace vorn::server
