// SPDX-License-Identifier: MIT
#include "logdump/baseband_collection.h"

#include <iostream>

#include "logdump/logdump_command.h"
#include "logdump/logdump_options.h"
#include "logdump/trace_names.h"

namespace {

constexpr std::int64_t kHelperTimeoutMs = 1500;

/// The timestamp of the newest baseband snapshot, from the helper service;
/// empty when it cannot tell.
std::string askHelperForSnapshot(const ToolContext& context) {
  auto helper = context.helpers ? context.helpers("logdump.helper", nullptr) : nullptr;
  if (!helper) return {};
  xpc::dict response;
  xpc::dict request;
  request.set(vorn::helper::kKeyTimeout, xpc::object::int64(kHelperTimeoutMs));
  auto result = helper->perform(vorn::helper::kTaskDiagsnapStatus,
                                vorn::helper::kCommandDiagsnapStatus, request, response);
  if (result.status != 0 || !response.valid()) return {};
  return xpc::dyn_cast_or_default(response.get(vorn::helper::kKeyTimestampString), "");
}

void reportWithoutServer(const ToolContext& context, ProgressScope& waiting) {
  std::string timestamp;
  if (context.device->internalOrCarrier()) timestamp = askHelperForSnapshot(context);
  waiting.end();
  std::cout << "Baseband log collection: Success (Vorn not running)" << std::endl;
  if (!timestamp.empty())
    std::cout << "Path = " << vorn::trace::kSnapshotFolder << vorn::trace::kLogDirPrefix
              << timestamp << context.device->basebandTraceDirSuffix() << std::endl;
  else
    std::cout << "Path = " << vorn::trace::kScratchFolder << diag::config::kDIAGScratchDir
              << std::endl;
}

}  // namespace

bool collectBasebandLogs(LogdumpCommand& command, std::list<std::string> args) {
  // Every request below blocks until its answer; the line goes before any
  // result is printed.
  ProgressScope waiting(command.getContext().progress, Progress::Activity::waitingForServer);
  xpc::dict query;
  query.set(vorn::kKeyTraceName, xpc::object::string(vorn::kTraceBaseband));
  query.set(vorn::kKeyTracePropertyName, xpc::object::string(vorn::kKeyTraceEnabled));
  xpc::object enabledResponse;
  const auto enabled = vorn::client::PerformCommand(
      command.getManager(), vorn::kCommandGetTraceProperty, query.obj(), enabledResponse);
  const bool succeeded = enabled.status == 0;
  if (!succeeded || !enabledResponse.isDictionary()) {
    waiting.end();
    std::cout << "Baseband log collection: Failed" << std::endl;
    return succeeded;
  }
  const std::string value =
      xpc::dyn_cast_or_default(enabledResponse.get(vorn::kKeyTracePropertyValue), vorn::kUnknown);
  if (value != "1" && value != "true") {
    waiting.end();
    std::cout << "Baseband logs are not enabled" << std::endl;
    return true;
  }

  CompressionMode compression = TarGz;
  bool noUserConfirmation = false;
  std::string reason;
  std::list<std::string> options = args;
  parseLogdumpOptions(options, compression, reason, noUserConfirmation);
  if (isSystemLogsTraceMode3(command)) compression = None;

  xpc::dict request;
  request.set(vorn::kKeyTraceDumpStateReason, xpc::object::string(reason));
  request.set(vorn::kKeyTraceAction, xpc::object::string(vorn::kCollectBasebandLogs));
  request.set(vorn::kKeyTraceDumpStatePerformCompression, xpc::object::int64(compression));
  xpc::object response;
  const auto dump = vorn::client::PerformCommand(command.getManager(), vorn::kCommandTraceDumpState,
                                                 request.obj(), response);
  if (dump.status == kResultServerNotRunning) {
    reportWithoutServer(command.getContext(), waiting);
    return true;
  }
  waiting.end();
  if (dump.status != 0) {
    std::cout << "Baseband log collection: Failed" << std::endl;
  } else {
    std::cout << "Baseband log collection: Success (Vorn running)" << std::endl;
    std::cout << "Path = ";
    const std::string timestamp = xpc::dyn_cast_or_default(response.get(vorn::kKeyTimestampString), "");
    std::cout << getLogArchivePath(timestamp, compression,
                                   command.getContext().device->basebandTraceDirSuffix())
              << std::endl;
  }
  return true;
}
