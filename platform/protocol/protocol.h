// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

/// The contract between the tool, its client libraries and the daemons, in
/// one place: bus names, object paths, interfaces and members; the string
/// values of the server's and the helper's interface; status codes; the
/// device paths of the platform root; and the names of collections. Both
/// sides include this header, so a change here is a change of protocol.

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
/// Milliseconds.
inline constexpr const char* kKeyTimeout = "Timeout";
inline constexpr const char* kKeyTimestampString = "TimestampString";

enum TaskID : std::uint32_t {
  kTaskDiagsnapStatus = 4,
};
}  // namespace helper

/// Status codes of requests, as the `i status` of a reply (0 = success).
namespace status {
/// The server's name has no owner, or no bus can be reached.
inline constexpr std::int32_t kServerNotRunning = static_cast<std::int32_t>(0xE020E001);
/// No answer: the call timed out, or the peer went away while it was pending.
inline constexpr std::int32_t kNoReply = static_cast<std::int32_t>(0xE020E002);
/// The bus policy refused the call.
inline constexpr std::int32_t kAccessDenied = static_cast<std::int32_t>(0xE020E003);
/// A reply whose signature is not `(isa{sv})`.
inline constexpr std::int32_t kMalformedReply = static_cast<std::int32_t>(0xE020E004);
/// Any other D-Bus error.
inline constexpr std::int32_t kBusError = static_cast<std::int32_t>(0xE020E005);
/// Unknown command, missing or mistyped entry.
inline constexpr std::int32_t kBadRequest = static_cast<std::int32_t>(0xE0200001);
/// The collection itself failed (I/O error, no space).
inline constexpr std::int32_t kCollectionFailed = static_cast<std::int32_t>(0xE0200002);
/// A collection is running and the waiting line is full.
inline constexpr std::int32_t kBusy = static_cast<std::int32_t>(0xE0200003);
}  // namespace status

}  // namespace vorn

/// The status that tells a caller the server is not running.
inline constexpr std::int32_t kResultServerNotRunning = vorn::status::kServerNotRunning;

/// Where the two services live on the bus, and the error name the daemons
/// answer an internal failure with.
namespace vorn::protocol {

inline constexpr const char* kManagerBusName = "org.vorn.Manager";
inline constexpr const char* kManagerObjectPath = "/org/vorn/Manager";
inline constexpr const char* kManagerInterface = "org.vorn.Manager1";
inline constexpr const char* kHelloMethod = "Hello";
inline constexpr const char* kPerformCommandMethod = "PerformCommand";
inline constexpr const char* kEventSignal = "Event";

inline constexpr const char* kHelperBusName = "org.vorn.Helper";
inline constexpr const char* kHelperObjectPath = "/org/vorn/Helper";
inline constexpr const char* kHelperInterface = "org.vorn.Helper1";
inline constexpr const char* kPerformMethod = "Perform";

inline constexpr const char* kInternalError = "org.vorn.Error.Internal";

/// Device paths of the platform's files, resolved under the platform root
/// with `underRoot`.
inline constexpr const char* kDeviceConfPath = "/etc/vorn/device.conf";
inline constexpr const char* kTracePropertiesPath = "/var/lib/vorn/trace.properties";
/// The sources of a collection besides the scratch folder.
inline constexpr const char* kTelephonyLogFolder = "/var/log/vorn/";
inline constexpr const char* kModemDumpFolder = "/var/lib/vorn/modem/";

/// `devicePath` (absolute) under the platform `root`; a root of "" or "/"
/// leaves it as it is.
std::string underRoot(std::string_view root, std::string_view devicePath);

/// The platform root of this process: VORN_ROOT, or "/" when unset or empty.
std::string platformRoot();

}  // namespace vorn::protocol

/// Folders and names of collected logs.
namespace vorn::trace {

inline constexpr const char* kScratchFolder = "/var/wireless/Library/Logs/ZelmarBasebandManager/";
inline constexpr const char* kSnapshotFolder = "/var/wireless/Library/Logs/CrashReporter/Baseband/";
inline constexpr const char* kLogDirPrefix = "log-bb-";
inline constexpr const char* kLogTarExtension = "tar";
inline constexpr const char* kLogTarGzExtension = "tar.gz";
/// Directory suffix of a telephony log collection, the same for every vendor.
inline constexpr const char* kTelephonyDirSuffix = "-tel";

/// Directory suffix of baseband traces: "-bb-trace" for radio vendor 2,
/// "-diag" for any other.
std::string basebandTraceDirSuffix(int vendor);
/// Directory suffix of core dumps: "-coredump" for radio vendor 2, "-cd" for
/// any other.
std::string coreDumpDirSuffix(int vendor);

}  // namespace vorn::trace
