// SPDX-License-Identifier: MIT
#include "logdump/telephony_collection.h"

#include <iostream>

#include "logdump/logdump_command.h"
#include "logdump/logdump_options.h"
#include "logdump/trace_names.h"

namespace {

xpc::dict buildRequest(TelephonyDump kind, const std::string& reason, CompressionMode compression,
                       bool noUserConfirmation) {
  xpc::dict request;
  if (kind == TelephonyDump::logs) {
    request.set(vorn::kKeyTraceAction, xpc::object::string(vorn::kCollectTelephonyLogs));
    request.set(vorn::kKeyTraceDumpStateReason, xpc::object::string(reason));
  } else {
    request.set(vorn::kKeyBasebandResetType, xpc::object::string(vorn::kBasebandResetTypeHard));
    request.set(vorn::kKeyBasebandResetSubType,
                xpc::object::string(vorn::kBasebandResetSubTypeOtherErrors));
    request.set(vorn::kKeyTraceAction, xpc::object::string(vorn::kCollectTelephonyLogsWithCoredump));
    request.set(vorn::kKeyBasebandResetReason, xpc::object::string(reason));
  }
  request.set(vorn::kKeyTraceDumpStatePerformCompression, xpc::object::int64(compression));
  if (noUserConfirmation) request.set(vorn::kKeyTraceUserConfirmation, xpc::object::boolean(false));
  return request;
}

/// Runs on the tool's queue. Its membership keeps the handler's group busy
/// until the library has called and destroyed it.
struct TelephonyCompletion {
  GroupMembership membership;
  CompressionMode compression;
  TelephonyDump kind;
  std::shared_ptr<DeviceProfile> device;
  /// Declared after the membership, so that it is gone before the group
  /// lets the worker go on.
  std::shared_ptr<ProgressScope> waiting;

  void operator()(TelephonyXPC::Result result, xpc::object response) const {
    // The progress line goes before the result comes, never after it.
    waiting->end();
    const bool core = kind == TelephonyDump::logsWithCoredump;
    std::cout << (core ? "Telephony log collection with Coredump: " : "Telephony log collection: ")
              << (result.status == 0 ? "Success" : "Failed") << std::endl;
    if (result.status != 0 || !response.isDictionary()) return;
    std::cout << "Path = ";
    const std::string timestamp =
        xpc::dyn_cast_or_default(response.get(vorn::kKeyTimestampString), "");
    std::cout << getLogArchivePath(timestamp, compression,
                                   core ? device->coreDumpDirSuffix() : "-*")
              << std::endl;
  }
};

}  // namespace

bool collectTelephonyLogs(LogdumpCommand& command, dispatch::group group,
                          std::list<std::string> args, TelephonyDump kind) {
  // From the trace mode query until the completion prints.
  auto waiting = std::make_shared<ProgressScope>(command.getContext().progress,
                                                 Progress::Activity::waitingForServer);
  CompressionMode compression = TarGz;
  bool noUserConfirmation = false;
  std::string reason;
  std::list<std::string> options = args;
  parseLogdumpOptions(options, compression, reason, noUserConfirmation);
  if (kind == TelephonyDump::logs && isSystemLogsTraceMode3(command)) compression = None;

  xpc::dict request = buildRequest(kind, reason, compression, noUserConfirmation);
  GroupMembership handlerMembership(group);
  vorn::client::Completion completion =
      TelephonyCompletion{GroupMembership(group), compression, kind, command.getContext().device,
                          std::move(waiting)};
  vorn::client::PerformCommand(command.getManager(), vorn::kCommandTraceDumpState,
                               std::move(completion), request.obj());
  return true;
}
