// SPDX-License-Identifier: MIT
#pragma once

#include <cstddef>
#include <optional>
#include <string>

#include "platform/xpc.h"

/// What a TraceDumpState request asks for, checked.
namespace vorn::server {

enum class CollectAction { telephonyLogs, telephonyLogsWithCoredump, basebandLogs };

/// 0 = leave the directory, 1 = tar.gz, 2 = tar.
enum class Compression { none = 0, tarGz = 1, tar = 2 };

/// The longest reason a request may carry, in bytes.
inline constexpr size_t kReasonLimit = 4096;
/// The most a whole request may carry (its strings and values, roughly in
/// bytes): a waiting request holds its message until it is answered.
inline constexpr size_t kRequestLimit = 64 * 1024;

struct CollectRequest {
  CollectAction action = CollectAction::telephonyLogs;
  Compression compression = Compression::tarGz;
  std::string reason;
};

/// Reads a TraceDumpState request. Empty (a bad request) when the action is
/// missing, not a string or not one of the three collect actions, when the
/// compression is present but not an integer 0, 1 or 2, or when the reason
/// is present but not a string or longer than kReasonLimit, or when the
/// request as a whole is larger than kRequestLimit. The reason comes from
/// TraceDumpStateReason, or for the core dump from BasebandResetReason;
/// missing, it reads "Unknown".
std::optional<CollectRequest> parseCollectRequest(const xpc::object& request);

/// The protocol's name of the action ("CollectTelephonyLogs" ...).
const char* actionName(CollectAction action);

}  // namespace vorn::server
