// SPDX-License-Identifier: MIT
#pragma once

#include <chrono>
#include <string>
#include <vector>

#include "oslog/export_observer.h"
#include "platform/logstore/log_store.h"

/// Copies recent entries of the log store into a text file, one line per log
/// message (see LineFormatter for the line). Problems go to the system log
/// at error level only; the caller learns of them through the result.
class OsLogStream {
 public:
  /// The longest the export waits for the store to deliver everything.
  static constexpr std::chrono::seconds kStreamTimeout{180};

  /// Exports the messages of the last `history` seconds of the machine's log
  /// store that match the filter (any of `processes` by exact name, or any
  /// image path containing one of `imagePaths` ignoring case and diacritics;
  /// both empty: everything) into `path`, replacing it. True when the store
  /// finished within kStreamTimeout.
  static bool putOsLogStreamToFile(const std::string& path, const std::vector<std::string>& processes,
                                   const std::vector<std::string>& imagePaths, double history);
  /// The same, telling `observer` how far it has come.
  static bool putOsLogStreamToFile(const std::string& path, const std::vector<std::string>& processes,
                                   const std::vector<std::string>& imagePaths, double history,
                                   oslog::ExportObserver& observer);

  /// The same over a given store, with a wait bound that tests may shorten
  /// and an optional observer.
  static bool putOsLogStreamToFile(logstore::Store& store, const std::string& path,
                                   const std::vector<std::string>& processes,
                                   const std::vector<std::string>& imagePaths, double history,
                                   std::chrono::nanoseconds timeout = kStreamTimeout,
                                   oslog::ExportObserver* observer = nullptr);
};
