// SPDX-License-Identifier: MIT
#pragma once

#include <list>
#include <string>

class LogdumpCommand;

/// The "bb" handler: synchronous from start to end. Fails only when the
/// enabled check itself fails; when the server turns out to be down it still
/// says where the baseband logs lie.
bool collectBasebandLogs(LogdumpCommand& command, std::list<std::string> args);
