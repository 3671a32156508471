// SPDX-License-Identifier: MIT
#pragma once

#include <archive.h>
#include <archive_entry.h>

#include <map>
#include <string>

/// What an archive holds, read back with libarchive: entry name -> contents
/// (empty for folders), plus the compression filter it found.
struct ArchiveListing {
  bool readable = false;
  int filter = ARCHIVE_FILTER_NONE;
  std::map<std::string, std::string> entries;
};

inline ArchiveListing listArchive(const std::string& path) {
  ArchiveListing out;
  archive* a = archive_read_new();
  archive_read_support_filter_all(a);
  archive_read_support_format_all(a);
  if (archive_read_open_filename(a, path.c_str(), 10240) == ARCHIVE_OK) {
    archive_entry* entry = nullptr;
    int r = ARCHIVE_OK;
    while ((r = archive_read_next_header(a, &entry)) == ARCHIVE_OK) {
      std::string data;
      char buf[8192];
      la_ssize_t n = 0;
      while ((n = archive_read_data(a, buf, sizeof buf)) > 0) data.append(buf, static_cast<size_t>(n));
      out.entries[archive_entry_pathname(entry)] = data;
    }
    out.readable = r == ARCHIVE_EOF;
    out.filter = archive_filter_code(a, 0);
  }
  archive_read_free(a);
  return out;
}
