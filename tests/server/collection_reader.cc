// SPDX-License-Identifier: MIT
#include "tests/server/collection_reader.h"

#include <archive.h>
#include <archive_entry.h>

#include <filesystem>

namespace vorn::test {

namespace {

/// Reads every entry of `a`, opened with status `opened`. A disk walk enters
/// a folder only when asked, and names entries by the path it was given:
/// `strip` bytes of it go.
std::map<std::string, CollectedItem> readAll(archive* a, int opened, bool disk, size_t strip, std::string* error) {
  std::map<std::string, CollectedItem> items;
  archive_entry* entry = nullptr;
  int r = opened == ARCHIVE_OK ? ARCHIVE_OK : ARCHIVE_FATAL;
  while (r == ARCHIVE_OK && (r = archive_read_next_header(a, &entry)) >= ARCHIVE_WARN && r != ARCHIVE_EOF) {
    std::string name = std::string(archive_entry_pathname(entry)).substr(strip);
    if (!name.empty() && name.back() == '/') name.pop_back();
    CollectedItem& item = items[name];
    item.folder = archive_entry_filetype(entry) == AE_IFDIR;
    item.perms = archive_entry_perm(entry);
    item.size = item.folder ? 0 : archive_entry_size(entry);
    if (disk && item.folder) archive_read_disk_descend(a);
    const void* buffer = nullptr;
    size_t length = 0;
    la_int64_t offset = 0;
    while ((r = archive_read_data_block(a, &buffer, &length, &offset)) == ARCHIVE_OK) {
      if (length == 0) continue;
      item.blocks[offset].append(static_cast<const char*>(buffer), length);
      item.stored += static_cast<off_t>(length);
    }
    r = r == ARCHIVE_EOF ? ARCHIVE_OK : r;
  }
  if (r != ARCHIVE_EOF) {
    *error = archive_error_string(a) != nullptr ? archive_error_string(a) : "cannot read the collection";
    items.clear();
  }
  archive_free(a);
  return items;
}

}  // namespace

std::string CollectedItem::content() const {
  std::string out(static_cast<size_t>(size), '\0');
  for (const auto& [offset, bytes] : blocks) out.replace(static_cast<size_t>(offset), bytes.size(), bytes);
  return out;
}

std::map<std::string, CollectedItem> readCollection(const std::string& path, std::string* error) {
  if (std::filesystem::is_directory(path)) {
    // libarchive walks by descriptor: deeper than PATH_MAX, and holes seen
    // as such.
    archive* a = archive_read_disk_new();
    archive_read_disk_set_symlink_physical(a);
    const size_t parent = std::filesystem::path(path).parent_path().string().size() + 1;
    return readAll(a, archive_read_disk_open(a, path.c_str()), true, parent, error);
  }
  archive* a = archive_read_new();
  archive_read_support_filter_all(a);
  archive_read_support_format_all(a);
  return readAll(a, archive_read_open_filename(a, path.c_str(), 64 * 1024), false, 0, error);
}

}  // namespace vorn::test
