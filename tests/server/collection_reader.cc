// SPDX-License-Identifier: MIT
#include "tests/server/collection_reader.h"

#include <archive.h>
#include <archive_entry.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <sstream>

namespace vorn::test {

namespace fs = std::filesystem;

std::string CollectedItem::content() const {
  std::string out(static_cast<size_t>(size), '\0');
  for (const auto& [offset, bytes] : blocks) out.replace(static_cast<size_t>(offset), bytes.size(), bytes);
  return out;
}

std::map<std::string, CollectedItem> readArchive(const std::string& path, std::string* error) {
  std::map<std::string, CollectedItem> items;
  archive* a = archive_read_new();
  archive_read_support_filter_all(a);
  archive_read_support_format_all(a);
  if (archive_read_open_filename(a, path.c_str(), 64 * 1024) != ARCHIVE_OK) {
    *error = archive_error_string(a);
    archive_read_free(a);
    return {};
  }
  archive_entry* entry = nullptr;
  int r = ARCHIVE_OK;
  while ((r = archive_read_next_header(a, &entry)) >= ARCHIVE_WARN && r != ARCHIVE_EOF) {
    std::string name = archive_entry_pathname(entry);
    if (!name.empty() && name.back() == '/') name.pop_back();
    CollectedItem& item = items[name];
    item.folder = archive_entry_filetype(entry) == AE_IFDIR;
    item.perms = archive_entry_perm(entry);
    item.size = archive_entry_size(entry);
    const void* buffer = nullptr;
    size_t length = 0;
    la_int64_t offset = 0;
    while ((r = archive_read_data_block(a, &buffer, &length, &offset)) == ARCHIVE_OK) {
      if (length == 0) continue;
      item.blocks[offset].append(static_cast<const char*>(buffer), length);
      item.stored += static_cast<off_t>(length);
    }
    if (r != ARCHIVE_EOF) break;
  }
  if (r != ARCHIVE_EOF) {
    *error = archive_error_string(a) != nullptr ? archive_error_string(a) : "cannot read the archive";
    items.clear();
  }
  archive_read_free(a);
  return items;
}

std::map<std::string, CollectedItem> readFolder(const std::string& path, std::string* error) {
  std::map<std::string, CollectedItem> items;
  const fs::path base = fs::path(path).parent_path();
  auto add = [&](const fs::path& p) {
    struct stat st {};
    if (::lstat(p.c_str(), &st) != 0) return;
    CollectedItem& item = items[fs::relative(p, base).string()];
    item.folder = S_ISDIR(st.st_mode);
    item.perms = st.st_mode & 07777;
    item.size = S_ISDIR(st.st_mode) ? 0 : st.st_size;
    item.stored = st.st_blocks * 512;
    if (S_ISREG(st.st_mode) && st.st_size < (16 << 20)) {
      std::ifstream in(p, std::ios::binary);
      std::ostringstream text;
      text << in.rdbuf();
      if (!text.str().empty()) item.blocks[0] = text.str();
    }
  };
  std::error_code ec;
  add(path);
  for (fs::recursive_directory_iterator it(path, ec), end; !ec && it != end; it.increment(ec)) add(it->path());
  if (ec) {
    *error = ec.message();
    items.clear();
  }
  return items;
}

}  // namespace vorn::test
