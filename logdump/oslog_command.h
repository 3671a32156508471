// SPDX-License-Identifier: MIT
#pragma once

#include <list>
#include <optional>
#include <string>
#include <vector>

#include "oslog/export_observer.h"

namespace logdump {

/// What `logdump oslog <history> <path> [-p <process>...] [-i <fragment>...]`
/// asks the export for.
struct OsLogRequest {
  double history = 0;  ///< seconds
  std::string path;
  std::vector<std::string> processes;
  std::vector<std::string> imagePaths;
};

/// Processes exported when the command line names only history and path.
const std::vector<std::string>& defaultOsLogProcesses();
/// Image path fragments exported in that case.
const std::vector<std::string>& defaultOsLogImagePaths();

/// Reads the handler's argument words (a word list: the first word is
/// args.back()). History and path are taken by position; after them "-p"
/// collects process names, "-i" image fragments, and any other word starting
/// with "-" drops the words that follow until the next mode word. Without
/// further words the default lists apply. Empty when fewer than two words.
std::optional<OsLogRequest> parseOsLogArguments(std::list<std::string> args);

/// The "oslog" handler: parses `args` and runs the export, returning its
/// result; prints "os log collection: Failed" when fewer than two words were
/// given. `observer`, when given, follows the export.
bool runOsLogCommand(std::list<std::string> args, oslog::ExportObserver* observer = nullptr);

}  // namespace logdump
