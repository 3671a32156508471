// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>

/// String values of the server's and the helper service's interface.
namespace vorn {

inline constexpr const char* kEventServerStateChange = "ServerStateChange";
inline constexpr const char* kKeyServerState = "ServerState";
inline constexpr const char* kServerStateStarted = "Started";
inline constexpr const char* kCommandGetTraceProperty = "GetTraceProperty";
inline constexpr const char* kCommandTraceDumpState = "TraceDumpState";
inline constexpr const char* kKeyTraceName = "TraceName";
inline constexpr const char* kKeyTracePropertyName = "TracePropertyName";
inline constexpr const char* kKeyTracePropertyValue = "TracePropertyValue";
inline constexpr const char* kKeyTraceMode = "Mode";
inline constexpr const char* kKeyTraceEnabled = "Enabled";
inline constexpr const char* kTraceSystemLogs = "SystemLogs";
inline constexpr const char* kTraceBaseband = "Baseband";
inline constexpr const char* kUnknown = "Unknown";
inline constexpr const char* kKeyTraceAction = "TraceAction";
inline constexpr const char* kCollectTelephonyLogs = "CollectTelephonyLogs";
inline constexpr const char* kCollectTelephonyLogsWithCoredump = "CollectTelephonyLogsWithCoredump";
inline constexpr const char* kCollectBasebandLogs = "CollectBasebandLogs";
inline constexpr const char* kKeyTraceDumpStateReason = "TraceDumpStateReason";
inline constexpr const char* kKeyTraceDumpStatePerformCompression = "TraceDumpStatePerformCompression";
inline constexpr const char* kKeyTraceUserConfirmation = "TraceUserConfirmation";
inline constexpr const char* kKeyTimestampString = "TimestampString";
inline constexpr const char* kKeyBasebandResetType = "BasebandResetType";
inline constexpr const char* kBasebandResetTypeHard = "Hard";
inline constexpr const char* kKeyBasebandResetSubType = "BasebandResetSubType";
inline constexpr const char* kBasebandResetSubTypeOtherErrors = "OtherErrors";
inline constexpr const char* kKeyBasebandResetReason = "BasebandResetReason";

namespace helper {
inline constexpr const char* kCommandDiagsnapStatus = "DiagsnapStatus";
inline constexpr const char* kKeyTimeout = "Timeout";
inline constexpr const char* kKeyTimestampString = "TimestampString";

enum TaskID : std::uint32_t {
  kTaskDiagsnapStatus = 4,
};
}  // namespace helper

/// Status codes of the protocol beyond success and kResultServerNotRunning.
namespace status {
inline constexpr std::int32_t kNoReply = static_cast<std::int32_t>(0xE020E002);
inline constexpr std::int32_t kAccessDenied = static_cast<std::int32_t>(0xE020E003);
inline constexpr std::int32_t kMalformedReply = static_cast<std::int32_t>(0xE020E004);
inline constexpr std::int32_t kBusError = static_cast<std::int32_t>(0xE020E005);
inline constexpr std::int32_t kBadRequest = static_cast<std::int32_t>(0xE0200001);
inline constexpr std::int32_t kCollectionFailed = static_cast<std::int32_t>(0xE0200002);
inline constexpr std::int32_t kBusy = static_cast<std::int32_t>(0xE0200003);
}  // namespace status

}  // namespace vorn
