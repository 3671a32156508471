// SPDX-License-Identifier: MIT
#include "logdump/oslog_command.h"

#include <climits>
#include <cstdlib>
#include <iostream>

#include "oslog/os_log_stream.h"

namespace logdump {
namespace {

/// atoi's reading (leading blanks, a sign, digits up to the first other
/// character, none at all giving 0), clamped instead of undefined on overflow.
int historyFromWord(const std::string& word) {
  long value = std::strtol(word.c_str(), nullptr, 10);
  if (value > INT_MAX) return INT_MAX;
  if (value < INT_MIN) return INT_MIN;
  return static_cast<int>(value);
}

}  // namespace

const std::vector<std::string>& defaultOsLogProcesses() {
  static const std::vector<std::string> processes = {
      "Telhub", "TelhubMobileHelper", "TelhubRootHelper", "vorn-helper",
      "Wavelockd", "org.vorn.CellularDiagnostics", "pwrkeepd",
  };
  return processes;
}

const std::vector<std::string>& defaultOsLogImagePaths() {
  static const std::vector<std::string> fragments = {"ZelmarBaseband"};
  return fragments;
}

std::optional<OsLogRequest> parseOsLogArguments(std::list<std::string> args) {
  if (args.size() < 2) return std::nullopt;
  OsLogRequest request;
  request.history = historyFromWord(args.back());
  args.pop_back();
  request.path = std::move(args.back());
  args.pop_back();

  if (args.empty()) {
    request.processes = defaultOsLogProcesses();
    request.imagePaths = defaultOsLogImagePaths();
    return request;
  }

  std::vector<std::string>* into = nullptr;  // ignore mode
  for (; !args.empty(); args.pop_back()) {
    std::string& word = args.back();
    if (word.starts_with("-")) {
      into = word == "-p" ? &request.processes : word == "-i" ? &request.imagePaths : nullptr;
    } else if (into != nullptr) {
      into->push_back(std::move(word));
    }
  }
  return request;
}

bool runOsLogCommand(std::list<std::string> args, oslog::ExportObserver* observer) {
  auto request = parseOsLogArguments(std::move(args));
  if (!request) {
    std::cout << "os log collection: Failed" << std::endl;
    return false;
  }
  if (observer)
    return OsLogStream::putOsLogStreamToFile(request->path, request->processes, request->imagePaths,
                                             request->history, *observer);
  return OsLogStream::putOsLogStreamToFile(request->path, request->processes, request->imagePaths,
                                           request->history);
}

}  // namespace logdump
