// SPDX-License-Identifier: MIT
#pragma once

#include <string>

#include "platform/protocol/trace_properties.h"

/// The server's side of its persisted trace properties: what it starts with,
/// and loading and saving the file (its syntax is the protocol's).
namespace vorn::server {

using protocol::TraceProperties;

/// `Baseband.Enabled=1` and `SystemLogs.Mode=1`.
TraceProperties defaultTraceProperties();

/// Loads the properties for a starting server: the defaults overlaid by the
/// file. When the file is missing the defaults are written to it (creating
/// its folder). `error` receives a message when the file exists but cannot be
/// read, or cannot be written back; the defaults are used then.
TraceProperties loadTraceProperties(const std::string& root, std::string* error);

/// Writes `props` atomically (temporary file, then rename). False on failure.
bool saveTraceProperties(const std::string& path, const TraceProperties& props, std::string* error);

}  // namespace vorn::server
