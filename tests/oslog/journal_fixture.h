// SPDX-License-Identifier: MIT
#pragma once

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <ctime>
#include <fstream>
#include <map>
#include <string>

namespace oslog_test {

/// A generated journal under `root` (see make_journal.py) and the counts of
/// its message entries. Built once per build tree and reused: a lock keeps
/// parallel test processes from building it twice, and a newer generator
/// script or an hour's age rebuilds it (tests rely on its dates being recent).
struct JournalFixture {
  std::string root;
  std::map<std::string, long> counts;  ///< "messages", "process\t<name>", "exe\t<path>", ...
  std::string error;                   ///< why it could not be built

  long count(const std::string& key) const {
    auto it = counts.find(key);
    return it == counts.end() ? 0 : it->second;
  }

  static const JournalFixture& get() {
    static const JournalFixture fixture = build(VORN_OSLOG_FIXTURE_DIR, 4000);
    return fixture;
  }

 private:
  static long mtime(const std::string& path) {
    struct stat st {};
    return ::stat(path.c_str(), &st) == 0 ? static_cast<long>(st.st_mtime) : -1;
  }

  static JournalFixture build(const std::string& base, int entries) {
    JournalFixture f;
    f.root = base + "/root";
    const std::string summary = base + "/summary.txt";
    ::mkdir(base.c_str(), 0755);
    int lock = ::open((base + "/lock").c_str(), O_CREAT | O_RDWR | O_CLOEXEC, 0644);
    if (lock >= 0) ::flock(lock, LOCK_EX);
    const long made = mtime(summary);
    if (made < mtime(VORN_MAKE_JOURNAL) || made < static_cast<long>(::time(nullptr)) - 3600) {
      const std::string command = "rm -rf '" + f.root + "' '" + summary + "' && python3 '" VORN_MAKE_JOURNAL
                                  "' --root '" + f.root + "' --entries " + std::to_string(entries) +
                                  " --summary '" + summary + ".new' && mv '" + summary + ".new' '" + summary + "'";
      if (std::system(command.c_str()) != 0) f.error = "could not run: " + command;
    }
    if (lock >= 0) ::close(lock);
    std::ifstream in(summary);
    for (std::string line; std::getline(in, line);) {
      auto tab = line.rfind('\t');
      if (tab != std::string::npos) f.counts[line.substr(0, tab)] = std::atol(line.c_str() + tab + 1);
    }
    if (f.counts.empty() && f.error.empty()) f.error = "no fixture summary in " + summary;
    return f;
  }
};

}  // namespace oslog_test
