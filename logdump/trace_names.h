// SPDX-License-Identifier: MIT
#pragma once

#include <string>

/// Folders, names and messages of collected logs.
namespace vorn::trace {
inline constexpr const char* kScratchFolder = "/var/wireless/Library/Logs/ZelmarBasebandManager/";
inline constexpr const char* kSnapshotFolder = "/var/wireless/Library/Logs/CrashReporter/Baseband/";
inline constexpr const char* kLogDirPrefix = "log-bb-";
inline constexpr const char* kLogTarExtension = "tar";
inline constexpr const char* kLogTarGzExtension = "tar.gz";

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
