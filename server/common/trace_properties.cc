// SPDX-License-Identifier: MIT
#include "server/common/trace_properties.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <system_error>

#include "platform/protocol/protocol.h"
#include "platform/linux/errno_text.h"

namespace vorn::server {

namespace fs = std::filesystem;

TraceProperties defaultTraceProperties() {
  TraceProperties p;
  p.set(kTraceBaseband, kKeyTraceEnabled, "1");
  p.set(kTraceSystemLogs, kKeyTraceMode, "1");
  return p;
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
  TraceProperties props = defaultTraceProperties();
  std::string path = protocol::underRoot(root, protocol::kTracePropertiesPath);
  std::ifstream in(path, std::ios::binary);
  if (!in) {
    int err = errno;
    if (err == ENOENT) {
      saveTraceProperties(path, props, error);
    } else {
      *error = "cannot read " + path + ": " + errnoText(err);
    }
    return props;
  }
  std::ostringstream text;
  text << in.rdbuf();
  props.overlay(TraceProperties::parse(text.str()));
  return props;
}

}  // namespace vorn::server
