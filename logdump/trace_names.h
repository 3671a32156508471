// SPDX-License-Identifier: MIT
#pragma once

#include <string>

#include "platform/protocol/protocol.h"

/// Names of collected logs as the tool reports them. The folders, the
/// prefix and the extensions are the protocol's (vorn::trace in
/// platform/protocol/protocol.h); the suffixes here follow this device's
/// radio vendor.
namespace vorn::trace {
/// "-bb-trace" for radio vendor 2, else "-diag"; fixed on first use.
std::string getBasebandTraceDirSuffix();
/// "-coredump" for radio vendor 2, else "-cd"; fixed on first use.
std::string getCoreDumpDirSuffix();
}  // namespace vorn::trace

namespace diag::config {
inline constexpr const char* kDIAGScratchDir = "DIAG.scratch";
}  // namespace diag::config

inline constexpr const char* kServerDownErrorPrint =
    "Server is not running. Please try after server starts.";

/// Follows kServerDownErrorPrint when the bus refused the tool access.
inline constexpr const char* kAccessDeniedErrorPrint =
    "vorntool: the server refused access; run as root or as a member of group \"vorn\"";
