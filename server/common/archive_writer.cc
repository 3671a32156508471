// SPDX-License-Identifier: MIT
#include "server/common/archive_writer.h"

#include <archive.h>
#include <archive_entry.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <utility>

#include "platform/linux/fd.h"

namespace vorn::server {

namespace fs = std::filesystem;

namespace {

struct ArchiveFree {
  void operator()(archive* a) const { archive_write_free(a); }
};
struct EntryFree {
  void operator()(archive_entry* e) const { archive_entry_free(e); }
};
using ArchivePtr = std::unique_ptr<archive, ArchiveFree>;
using EntryPtr = std::unique_ptr<archive_entry, EntryFree>;


std::string errnoText(const std::string& what, int err) { return what + ": " + std::strerror(err); }

bool copyFileData(archive* a, const std::string& path, off_t size, const std::atomic<bool>& cancel,
                  std::string* error) {
  Fd in(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW));
  if (in.get() < 0) {
    *error = errnoText("cannot open " + path, errno);
    return false;
  }
  // The header already promised `size` bytes: a growing log is cut there, a
  // shrinking one is padded by libarchive.
  char buf[64 * 1024];
  off_t left = size;
  while (left > 0) {
    if (cancel.load()) {
      *error = "cancelled";
      return false;
    }
    ssize_t n = ::read(in.get(), buf, static_cast<size_t>(std::min<off_t>(left, sizeof buf)));
    if (n < 0) {
      if (errno == EINTR) continue;
      *error = errnoText("cannot read " + path, errno);
      return false;
    }
    if (n == 0) break;
    if (archive_write_data(a, buf, static_cast<size_t>(n)) != n) {
      *error = std::string("cannot write the archive: ") + archive_error_string(a);
      return false;
    }
    left -= n;
  }
  return true;
}

bool writeEntries(archive* a, const ArchiveJob& job, const std::atomic<bool>& cancel, std::string* error) {
  for (const auto& rel : job.entries) {
    if (cancel.load()) {
      *error = "cancelled";
      return false;
    }
    std::string source = (fs::path(job.sourceDir) / rel).string();
    struct stat st {};
    if (::lstat(source.c_str(), &st) != 0) {
      *error = errnoText("cannot read " + source, errno);
      return false;
    }
    if (!S_ISREG(st.st_mode) && !S_ISDIR(st.st_mode)) continue;
    EntryPtr entry(archive_entry_new());
    archive_entry_copy_stat(entry.get(), &st);
    archive_entry_set_pathname(entry.get(), (job.entryPrefix + "/" + rel).c_str());
    // Collections are handed to other people: no local user names.
    archive_entry_set_uname(entry.get(), "root");
    archive_entry_set_gname(entry.get(), "root");
    if (archive_write_header(a, entry.get()) != ARCHIVE_OK) {
      *error = std::string("cannot write the archive: ") + archive_error_string(a);
      return false;
    }
    if (S_ISREG(st.st_mode) && !copyFileData(a, source, st.st_size, cancel, error)) return false;
  }
  return true;
}

}  // namespace

std::string partialArchivePath(const std::string& finalPath) {
  fs::path p(finalPath);
  return (p.parent_path() / ("." + p.filename().string() + ".partial")).string();
}

bool writeArchive(const ArchiveJob& job, const std::atomic<bool>& cancel, std::string* error) {
  const std::string tmp = partialArchivePath(job.finalPath);
  // A leftover from a crashed writer must not block this one.
  ::unlink(tmp.c_str());
  Fd fd(::open(tmp.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
  if (fd.get() < 0) {
    *error = errnoText("cannot create " + tmp, errno);
    return false;
  }
  bool ok = false;
  {
    ArchivePtr a(archive_write_new());
    int r = job.format == ArchiveFormat::tarGz ? archive_write_add_filter_gzip(a.get())
                                               : archive_write_add_filter_none(a.get());
    if (r == ARCHIVE_OK) r = archive_write_set_format_pax_restricted(a.get());
    if (r == ARCHIVE_OK) r = archive_write_open_fd(a.get(), fd.get());
    if (r != ARCHIVE_OK) {
      *error = std::string("cannot start the archive: ") + archive_error_string(a.get());
    } else if (writeEntries(a.get(), job, cancel, error)) {
      if (archive_write_close(a.get()) == ARCHIVE_OK) {
        ok = true;
      } else {
        *error = std::string("cannot finish the archive: ") + archive_error_string(a.get());
      }
    }
  }
  // Durable before it gets the name a reader trusts.
  if (ok && ::fsync(fd.get()) != 0) {
    *error = errnoText("cannot flush " + tmp, errno);
    ok = false;
  }
  if (ok && ::close(fd.release()) != 0) {
    *error = errnoText("cannot close " + tmp, errno);
    ok = false;
  }
  if (ok && ::rename(tmp.c_str(), job.finalPath.c_str()) != 0) {
    *error = errnoText("cannot rename " + tmp, errno);
    ok = false;
  }
  if (!ok) ::unlink(tmp.c_str());
  return ok;
}

bool listTree(const std::string& dir, std::vector<std::string>* out, std::string* error) {
  std::error_code ec;
  std::vector<std::string> found;
  fs::recursive_directory_iterator it(dir, fs::directory_options::none, ec);
  for (; !ec && it != fs::recursive_directory_iterator(); it.increment(ec)) {
    auto status = it->symlink_status(ec);
    if (ec) break;
    if (fs::is_directory(status) || fs::is_regular_file(status)) {
      found.push_back(fs::relative(it->path(), dir, ec).string());
      if (ec) break;
    }
  }
  if (ec) {
    *error = "cannot list " + dir + ": " + ec.message();
    return false;
  }
  // A folder's name is a prefix of its contents', so plain order puts it first.
  std::sort(found.begin(), found.end());
  *out = std::move(found);
  return true;
}

}  // namespace vorn::server
