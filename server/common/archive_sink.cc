// SPDX-License-Identifier: MIT
#include "server/common/archive_sink.h"

#include <archive.h>
#include <archive_entry.h>
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "server/common/gzip_members.h"
#include "server/common/output_policy.h"
#include "platform/linux/errno_text.h"

namespace vorn::server {

namespace {

constexpr size_t kReadBytes = 256 * 1024;
constexpr size_t kZeroBytes = 1 << 20;
// libarchive names a sparse entry by its ustar name, which loses bytes of a
// longer one; such a rare file is stored with its holes as data instead.
constexpr size_t kSparseNameLimit = 100;

struct EntryFree {
  void operator()(archive_entry* e) const { archive_entry_free(e); }
};

bool hasHoles(const StoredPart& part) {
  off_t covered = 0;
  for (const auto& e : part.extents) covered += e.length;
  return covered < part.size;
}

}  // namespace

std::unique_ptr<ArchiveSink> ArchiveSink::create(int dirFd, const std::string& partialName,
                                                 const std::string& entryPrefix, ArchiveFormat format,
                                                 std::optional<gid_t> group, std::string* error) {
  std::unique_ptr<ArchiveSink> sink(new ArchiveSink(dirFd, partialName, group));
  if (!sink->start(entryPrefix, format, error)) {
    sink->abandon();
    return nullptr;
  }
  return sink;
}

ArchiveSink::ArchiveSink(int dirFd, std::string partialName, std::optional<gid_t> group)
    : dirFd_(dirFd), partialName_(std::move(partialName)), group_(group), buffer_(kReadBytes) {}

ArchiveSink::~ArchiveSink() {
  if (!done_) abandon();
  if (archive_ != nullptr) archive_write_free(archive_);
  if (previous_ != nullptr) uselocale(previous_);
  if (utf8_ != nullptr) freelocale(utf8_);
}

bool ArchiveSink::start(const std::string& entryPrefix, ArchiveFormat format, std::string* error) {
  // libarchive writes pax names as UTF-8, converting from the locale; in a
  // UTF-8 locale a UTF-8 name goes in untouched, and one that is not UTF-8
  // goes in as bytes under a "hdrcharset=BINARY" record. Only this thread
  // switches, and only while the archive is written.
  utf8_ = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
  if (utf8_ != nullptr) previous_ = uselocale(utf8_);

  fd_.reset(::openat(dirFd_, partialName_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
  if (!fd_) {
    *error = errnoText("cannot create " + partialName_, errno);
    return false;
  }
  file_ = std::make_unique<FdByteSink>(fd_.get());
  out_ = file_.get();
  if (format == ArchiveFormat::tarGz) {
    gzip_ = std::make_unique<GzipMembersWriter>(*file_, GzipMembersWriter::Options{});
    out_ = gzip_.get();
  }
  archive_ = archive_write_new();
  int r = archive_write_set_format_pax_restricted(archive_);
  if (r == ARCHIVE_OK) r = archive_write_add_filter_none(archive_);
  // A compressed stream is not padded out to a whole tar record.
  if (r == ARCHIVE_OK && format == ArchiveFormat::tarGz) r = archive_write_set_bytes_in_last_block(archive_, 1);
  if (r == ARCHIVE_OK) r = archive_write_open(archive_, this, nullptr, &ArchiveSink::onWrite, nullptr);
  if (r != ARCHIVE_OK) {
    *error = archiveError("cannot start the archive");
    return false;
  }
  // The collection's own folder first, so that it unpacks as 0750 too.
  const struct timespec now = {::time(nullptr), 0};
  if (!header(entryPrefix, S_IFDIR, kFolderMode, 0, now, nullptr, error)) return false;
  path_.assign(1, entryPrefix);
  return true;
}

ssize_t ArchiveSink::onWrite(struct archive* a, void* self, const void* buffer, size_t length) {
  auto* sink = static_cast<ArchiveSink*>(self);
  if (sink->discard_) return static_cast<ssize_t>(length);
  if (!sink->out_->write(buffer, length)) {
    archive_set_error(a, EIO, "%s", sink->out_->error().c_str());
    return -1;
  }
  return static_cast<ssize_t>(length);
}

std::string ArchiveSink::entryName(const std::string& name) const {
  std::string out;
  for (const auto& p : path_) out += p + "/";
  return out + name;
}

std::string ArchiveSink::archiveError(const std::string& what) const {
  const char* text = archive_ != nullptr ? archive_error_string(archive_) : nullptr;
  return what + ": " + (text != nullptr ? text : out_ != nullptr && !out_->error().empty() ? out_->error() : "failed");
}

bool ArchiveSink::header(const std::string& name, mode_t type, mode_t perm, off_t size, const struct timespec& mtime,
                         const std::vector<Extent>* sparse, std::string* error) {
  std::unique_ptr<archive_entry, EntryFree> entry(archive_entry_new());
  // The bytes as they are; the charset is the locale's business above.
  archive_entry_copy_pathname(entry.get(), name.c_str());
  archive_entry_set_filetype(entry.get(), type);
  archive_entry_set_perm(entry.get(), perm);
  archive_entry_set_size(entry.get(), size);
  archive_entry_set_mtime(entry.get(), mtime.tv_sec, mtime.tv_nsec);
  // Collections are handed to other people: no local user names or ids.
  archive_entry_set_uid(entry.get(), 0);
  archive_entry_set_gid(entry.get(), 0);
  archive_entry_set_uname(entry.get(), "root");
  archive_entry_set_gname(entry.get(), "root");
  if (sparse != nullptr) {
    for (const auto& e : *sparse) archive_entry_sparse_add_entry(entry.get(), e.offset, e.length);
    // A file that is all hole still needs a map: one empty block at its end.
    if (sparse->empty()) archive_entry_sparse_add_entry(entry.get(), size, 0);
  }
  // A warning means a name went in as bytes, which is what we want.
  if (archive_write_header(archive_, entry.get()) < ARCHIVE_WARN) {
    *error = archiveError("cannot write the archive");
    return false;
  }
  return true;
}

bool ArchiveSink::data(const void* buffer, size_t length, std::string* error) {
  if (archive_write_data(archive_, buffer, length) != static_cast<la_ssize_t>(length)) {
    *error = archiveError("cannot write the archive");
    return false;
  }
  return true;
}

bool ArchiveSink::zeros(off_t length, std::string* error) {
  // Over a hole of a sparse entry libarchive only counts these bytes.
  static const std::vector<char> kZeros(kZeroBytes);
  while (length > 0) {
    const size_t n = static_cast<size_t>(std::min<off_t>(length, kZeroBytes));
    if (!data(kZeros.data(), n, error)) return false;
    length -= static_cast<off_t>(n);
  }
  return true;
}

bool ArchiveSink::enterFolder(const std::string& name, const struct stat& st, std::string* error) {
  if (!header(entryName(name), S_IFDIR, kFolderMode, 0, st.st_mtim, nullptr, error)) return false;
  path_.push_back(name);
  return true;
}

bool ArchiveSink::leaveFolder(std::string*) {
  path_.pop_back();
  return true;
}

bool ArchiveSink::addFile(const std::string& name, const SourceFile& file, const std::atomic<bool>& cancel,
                          std::string* error) {
  const std::string entry = entryName(name);
  const bool sparse = hasHoles(file.part) && entry.size() < kSparseNameLimit;
  if (!header(entry, S_IFREG, copiedFileMode(file.st.st_mode), file.part.size, file.st.st_mtim,
              sparse ? &file.part.extents : nullptr, error)) {
    return false;
  }
  return fileData(file, cancel, error);
}

bool ArchiveSink::fileData(const SourceFile& file, const std::atomic<bool>& cancel, std::string* error) {
  // Every call stays within one extent or one hole: libarchive's sparse
  // writer expects its blocks fed one at a time.
  off_t pos = 0;
  for (const auto& extent : file.part.extents) {
    if (extent.offset > pos && !zeros(extent.offset - pos, error)) return false;
    pos = extent.offset;
    const off_t end = extent.offset + extent.length;
    while (pos < end) {
      if (cancel.load()) {
        *error = "cancelled";
        return false;
      }
      const size_t want = static_cast<size_t>(std::min<off_t>(end - pos, static_cast<off_t>(buffer_.size())));
      ssize_t n = ::pread(file.fd, buffer_.data(), want, pos);
      if (n < 0 && errno == EINTR) continue;
      if (n < 0) {
        *error = errnoText("cannot read a log file", errno);
        return false;
      }
      // A log that shrank meanwhile: the header promised the bytes.
      if (n == 0) break;
      if (!data(buffer_.data(), static_cast<size_t>(n), error)) return false;
      pos += n;
    }
    if (pos < end && !zeros(end - pos, error)) return false;
    pos = end;
  }
  if (pos < file.part.size && !zeros(file.part.size - pos, error)) return false;
  if (archive_write_finish_entry(archive_) < ARCHIVE_WARN) {
    *error = archiveError("cannot write the archive");
    return false;
  }
  return true;
}

bool ArchiveSink::addManifest(int fd, off_t size, std::string* error) {
  SourceFile manifest;
  manifest.fd = fd;
  manifest.st.st_mode = S_IFREG | 0640;
  manifest.st.st_mtim.tv_sec = ::time(nullptr);
  manifest.part.size = size;
  if (size > 0) manifest.part.extents.push_back({0, size});
  path_.resize(1);
  static const std::atomic<bool> kNever{false};
  return addFile("manifest.txt", manifest, kNever, error);
}

bool ArchiveSink::commit(const std::string& finalName, std::string* error) {
  if (archive_write_close(archive_) != ARCHIVE_OK) {
    *error = archiveError("cannot finish the archive");
    return false;
  }
  if (!out_->finish()) {
    *error = "cannot finish the archive: " + out_->error();
    return false;
  }
  if (!applyOutputPolicy(fd_.get(), kArchiveMode, group_, partialName_, error)) return false;
  // Durable before it gets the name a reader trusts.
  if (::fsync(fd_.get()) != 0 || ::close(fd_.release()) != 0) {
    *error = errnoText("cannot flush " + partialName_, errno);
    return false;
  }
  if (!publishAt(dirFd_, partialName_, finalName, error)) return false;
  done_ = true;
  return true;
}

void ArchiveSink::abandon() {
  if (done_) return;
  done_ = true;
  // Freeing an open archive flushes it: into nothing, before the outputs go.
  discard_ = true;
  if (archive_ != nullptr) archive_write_free(archive_);
  archive_ = nullptr;
  gzip_.reset();
  fd_.reset();
  ::unlinkat(dirFd_, partialName_.c_str(), 0);
}

}  // namespace vorn::server
