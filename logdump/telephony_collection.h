// SPDX-License-Identifier: MIT
#pragma once

#include <list>
#include <string>

#include "platform/dispatch.h"

class LogdumpCommand;

enum class TelephonyDump { logs, logsWithCoredump };

/// The "tel" and "core" handlers: sends the dump request and returns at once;
/// the completion, holding the group, prints the result line and the path.
bool collectTelephonyLogs(LogdumpCommand& command, dispatch::group group,
                          std::list<std::string> args, TelephonyDump kind);
