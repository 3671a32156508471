// SPDX-License-Identifier: MIT
#include "logdump/logdump_options.h"

#include <cerrno>
#include <cstdlib>
#include <limits>

#include "logdump/trace_names.h"
#include "platform/xpc.h"

void parseLogdumpOptions(std::list<std::string>& args, CompressionMode& compression,
                         std::string& reason, bool& noUserConfirmation) {
  reason = "[vorntool] User triggered";
  while (!args.empty()) {
    std::string word = std::move(args.back());
    args.pop_back();
    if (util::equal_nocase(word, "nocompress")) {
      compression = None;
    } else if (util::equal_nocase(word, "tar.gz")) {
      compression = TarGz;
    } else if (util::equal_nocase(word, "tar")) {
      compression = Tar;
    } else if (util::equal_nocase(word, "nonui")) {
      noUserConfirmation = true;
    } else {
      reason = "[vorntool] " + word;
      return;
    }
  }
}

int parseTraceMode(const std::string& text, bool& valid) {
  valid = true;
  for (const char* off : {"false", "off", "no"})
    if (util::equal_nocase(text, off)) return 0;
  for (const char* on : {"true", "on", "yes", "full"})
    if (util::equal_nocase(text, on)) return 1;
  if (util::equal_nocase(text, "lite")) return 2;

  const char* begin = text.c_str();
  char* end = nullptr;
  errno = 0;
  const long long value = std::strtoll(begin, &end, /* base= */ 0);
  // The whole text must be the number: an embedded NUL stops strtoll early
  // and is caught by the length check.
  valid = end != begin && errno == 0 && static_cast<std::size_t>(end - begin) == text.size() &&
          value >= std::numeric_limits<std::int32_t>::min() &&
          value <= std::numeric_limits<std::int32_t>::max();
  return valid ? static_cast<int>(value) : 0;
}

std::string getLogArchivePath(const std::string& timestamp, CompressionMode compression,
                              const std::string& directorySuffix) {
  std::string ending;
  switch (compression) {
    case Tar: ending = std::string(".") + vorn::trace::kLogTarExtension; break;
    case TarGz: ending = std::string(".") + vorn::trace::kLogTarGzExtension; break;
    default: ending = directorySuffix; break;
  }
  return std::string(vorn::trace::kSnapshotFolder) + vorn::trace::kLogDirPrefix + timestamp + ending;
}
