// SPDX-License-Identifier: MIT
#pragma once

#include <optional>
#include <string>

#include "platform/xpc.h"

/// What a TraceDumpState request asks for, checked.
namespace vorn::server {

enum class CollectAction { telephonyLogs, telephonyLogsWithCoredump, basebandLogs };

/// 0 = leave the directory, 1 = tar.gz, 2 = tar.
enum class Compression { none = 0, tarGz = 1, tar = 2 };

struct CollectRequest {
  CollectAction action = CollectAction::telephonyLogs;
  Compression compression = Compression::tarGz;
  std::string reason;
};

/// Reads a TraceDumpState request. Empty (a bad request) when the action is
/// missing, not a string or not one of the three collect actions, when the
/// compression is present but not an integer 0, 1 or 2, or when the reason
/// is present but not a string. The reason comes from TraceDumpStateReason,
/// or for the core dump from BasebandResetReason; missing, it reads "Unknown".
std::optional<CollectRequest> parseCollectRequest(const xpc::object& request);

/// The protocol's name of the action ("CollectTelephonyLogs" ...).
const char* actionName(CollectAction action);

}  // namespace vorn::server
