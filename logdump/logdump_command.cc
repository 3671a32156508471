// SPDX-License-Identifier: MIT
#include "logdump/logdump_command.h"

#include <iostream>

#include "logdump/baseband_collection.h"
#include "logdump/export_progress.h"
#include "logdump/logdump_options.h"
#include "logdump/oslog_command.h"
#include "logdump/telephony_collection.h"
#include "logdump/trace_names.h"
#include "toolbase/server_state.h"

std::shared_ptr<LogdumpCommand> LogdumpCommand::create(std::string name,
                                                       std::weak_ptr<CommandBase> parent,
                                                       std::shared_ptr<vorn::client::Manager> manager,
                                                       dispatch::queue queue) {
  return create(std::move(name), std::move(parent),
                ToolContext::onThisDevice(std::move(manager), std::move(queue)));
}

std::shared_ptr<LogdumpCommand> LogdumpCommand::create(std::string name,
                                                       std::weak_ptr<CommandBase> parent,
                                                       ToolContext context) {
  std::shared_ptr<LogdumpCommand> command(
      new LogdumpCommand(std::move(name), std::move(parent), std::move(context)));
  command->init();
  return command;
}

bool LogdumpCommand::isAllowed(std::string commandName) {
  // Baseband logs can still be located while the server is down.
  if (commandName == "bb") return true;
  if (IsServerRunning()) return true;
  std::cerr << kServerDownErrorPrint << std::endl;
  // The server may well be running: the bus would not let the tool ask it.
  if (getManager() && getManager()->accessDenied())
    std::cerr << kAccessDeniedErrorPrint << std::endl;
  return false;
}

void LogdumpCommand::registerCommands() {
  const OptionWords telephonyWords{
      .words = {"nocompress", "tar.gz", "tar", "nonui"}, .leadingOnly = true};
  const OptionWords basebandWords{.words = {"nocompress", "tar.gz", "tar"}, .leadingOnly = true};
  // History and path come first; then "-p" and "-i" switch what the words mean.
  const OptionWords oslogWords{.positionals = 2, .words = {"-p", "-i"}};

  // The handlers are stored in this node's own table, so the node outlives them.
  addCommandHandler(
      "tel",
      [this](dispatch::group group, std::list<std::string> args) {
        return collectTelephonyLogs(*this, std::move(group), std::move(args), TelephonyDump::logs);
      },
      "[nocompress|tar.gz|tar] [nonui] <reason> collect telephony logs", telephonyWords);
  addCommandHandler(
      "core",
      [this](dispatch::group group, std::list<std::string> args) {
        return collectTelephonyLogs(*this, std::move(group), std::move(args),
                                    TelephonyDump::logsWithCoredump);
      },
      "[nocompress|tar.gz|tar] [nonui] <reason> collect telephony logs with coredump",
      telephonyWords);
  addCommandHandler(
      "bb",
      [this](dispatch::group, std::list<std::string> args) {
        return collectBasebandLogs(*this, std::move(args));
      },
      "[nocompress|tar.gz|tar] <reason> collect baseband logs only", basebandWords);
  addCommandHandler(
      "oslog",
      [this](dispatch::group group, std::list<std::string> args) {
        GroupMembership membership(std::move(group));
        logdump::ExportProgress progress(context.progress);
        return logdump::runOsLogCommand(std::move(args), &progress);
      },
      "[history size] [output txt file path] -p <process1 process2..> -i <imagePath1 imagePath2..> "
      "collect oslog to txt",
      oslogWords);
}

bool isSystemLogsTraceMode3(LogdumpCommand& command) {
  xpc::dict request;
  request.set(vorn::kKeyTraceName, xpc::object::string(vorn::kTraceSystemLogs));
  request.set(vorn::kKeyTracePropertyName, xpc::object::string(vorn::kKeyTraceMode));
  xpc::object response;
  vorn::client::PerformCommand(command.getManager(), vorn::kCommandGetTraceProperty, request.obj(),
                               response);
  const std::string text =
      xpc::dyn_cast_or_default(xpc::dict(response).get(vorn::kKeyTracePropertyValue), "");
  bool valid = false;
  const int mode = parseTraceMode(text, valid);
  return valid && mode == 3;
}
