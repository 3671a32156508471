// SPDX-License-Identifier: MIT
#include "server/common/collector.h"

#include <cctype>
#include <filesystem>
#include <fstream>
#include <set>
#include <vector>

#include "server/common/archive_writer.h"
#include "platform/protocol/protocol.h"
#include "server/common/device_facts.h"
#include "server/common/text_util.h"
#include "server/common/timestamp_naming.h"

namespace vorn::server {

namespace fs = std::filesystem;

namespace {

// Reasons come from the caller; the manifest keeps a sane amount of them.
constexpr size_t kReasonLimit = 4096;

struct Source {
  const char* from;  // a device path, resolved under the root
  const char* into;  // under the collection directory
};

std::vector<Source> sourcesFor(CollectAction action) {
  std::vector<Source> sources = {
      {protocol::kTelephonyLogFolder, "vorn"},
      {trace::kScratchFolder, "ZelmarBasebandManager"},
  };
  if (action == CollectAction::telephonyLogsWithCoredump) sources.push_back({protocol::kModemDumpFolder, "coredump"});
  return sources;
}

/// Copies the folders and regular files of `from` into `into`. A missing
/// source is not an error (nothing was logged yet); one that is not a
/// folder, or a file that cannot be read or written, is.
bool copyTree(const fs::path& from, const fs::path& into, const std::atomic<bool>& cancel,
              std::vector<std::string>* copied, std::string* error) {
  std::error_code ec;
  auto status = fs::symlink_status(from, ec);
  if (ec && status.type() != fs::file_type::not_found) {
    *error = "cannot read " + from.string() + ": " + ec.message();
    return false;
  }
  if (status.type() == fs::file_type::not_found) return true;
  if (!fs::is_directory(status)) {
    *error = "cannot read " + from.string() + ": not a folder";
    return false;
  }
  std::vector<std::string> entries;
  if (!listTree(from.string(), &entries, error)) return false;
  if (!fs::create_directory(into, ec) && ec) {
    *error = "cannot create " + into.string() + ": " + ec.message();
    return false;
  }
  for (const auto& rel : entries) {
    if (cancel.load()) {
      *error = "cancelled";
      return false;
    }
    fs::path src = from / rel;
    fs::path dst = into / rel;
    if (fs::is_directory(fs::symlink_status(src, ec))) {
      fs::create_directory(dst, ec);
    } else {
      fs::copy_file(src, dst, fs::copy_options::overwrite_existing, ec);
      copied->push_back((into.filename() / rel).string());
    }
    if (ec) {
      *error = "cannot copy " + src.string() + ": " + ec.message();
      return false;
    }
  }
  return true;
}

std::string manifestText(const CollectRequest& request, const std::string& ts, std::time_t when,
                         const DeviceFacts& facts, const std::vector<std::string>& files) {
  char iso[64];
  std::tm local{};
  localtime_r(&when, &local);
  std::strftime(iso, sizeof iso, "%Y-%m-%dT%H:%M:%S%z", &local);
  std::string out;
  out += "action: " + std::string(actionName(request.action)) + "\n";
  out += "reason: " + oneLine(request.reason, kReasonLimit) + "\n";
  out += "timestamp: " + ts + "\n";
  out += "time: " + std::string(iso) + "\n";
  for (const auto& [key, value] : facts.entries) out += "device." + oneLine(key, 256) + ": " + oneLine(value, 256) + "\n";
  out += "files:\n";
  for (const auto& f : files) out += "  " + oneLine(f, 4096) + "\n";
  return out;
}

bool writeTextFile(const fs::path& path, const std::string& text, std::string* error) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out << text;
  out.flush();
  if (!out) {
    *error = "cannot write " + path.string();
    return false;
  }
  return true;
}

std::string pickTimestamp(const fs::path& folder, std::time_t when) {
  std::set<std::string> names;
  std::error_code ec;
  for (fs::directory_iterator it(folder, ec); !ec && it != fs::directory_iterator(); it.increment(ec)) {
    names.insert(it->path().filename().string());
  }
  return uniqueTimestamp(formatTimestamp(when), [&](const std::string& ts) {
    for (const auto& name : names) {
      if (nameUsesTimestamp(name, ts)) return true;
    }
    return false;
  });
}

}  // namespace

std::string snapshotFolder(const std::string& root) {
  return protocol::underRoot(root, trace::kSnapshotFolder);
}

std::string directorySuffix(CollectAction action, int vendor) {
  switch (action) {
    case CollectAction::telephonyLogs: return trace::kTelephonyDirSuffix;
    case CollectAction::telephonyLogsWithCoredump: return trace::coreDumpDirSuffix(vendor);
    case CollectAction::basebandLogs: return trace::basebandTraceDirSuffix(vendor);
  }
  return trace::kTelephonyDirSuffix;
}

bool nameUsesTimestamp(const std::string& name, const std::string& ts) {
  std::string stem = trace::kLogDirPrefix + ts;
  if (name.compare(0, stem.size(), stem) != 0) return false;
  if (name.size() == stem.size()) return true;
  char next = name[stem.size()];
  if (next == '.') return true;
  if (next != '-') return false;
  return name.size() == stem.size() + 1 || !std::isdigit(static_cast<unsigned char>(name[stem.size() + 1]));
}

Collector::Collector(std::string root, std::function<std::time_t()> clock)
    : root_(std::move(root)), clock_(std::move(clock)) {}

CollectOutcome Collector::collect(const CollectRequest& request, const std::atomic<bool>& cancel) {
  CollectOutcome outcome;
  const fs::path folder = snapshotFolder(root_);
  std::error_code ec;
  fs::create_directories(folder, ec);
  if (ec) {
    outcome.error = "cannot create " + folder.string() + ": " + ec.message();
    return outcome;
  }
  const DeviceFacts facts = loadDeviceFacts(root_);
  const std::time_t when = clock_();
  const std::string ts = pickTimestamp(folder, when);
  const std::string dirName = trace::kLogDirPrefix + ts + directorySuffix(request.action, facts.vendor);
  // Built under a hidden name so that nothing incomplete ever carries a
  // collection's name, directory or archive.
  const fs::path work = folder / ("." + dirName + ".partial");
  fs::remove_all(work, ec);
  auto fail = [&](std::string why) {
    std::error_code ignored;
    fs::remove_all(work, ignored);
    outcome.ok = false;
    outcome.error = std::move(why);
    return outcome;
  };
  if (!fs::create_directory(work, ec)) return fail("cannot create " + work.string() + ": " + ec.message());

  std::vector<std::string> files;
  std::string error;
  for (const auto& source : sourcesFor(request.action)) {
    // Without the folder's trailing '/', so that a file in its place is seen
    // as what it is rather than as missing.
    if (!copyTree(fs::path(protocol::underRoot(root_, source.from)).parent_path(), work / source.into, cancel, &files, &error)) return fail(error);
  }
  if (!writeTextFile(work / "manifest.txt", manifestText(request, ts, when, facts, files), &error)) return fail(error);

  if (request.compression == Compression::none) {
    fs::rename(work, folder / dirName, ec);
    if (ec) return fail("cannot rename " + work.string() + ": " + ec.message());
  } else {
    ArchiveJob job;
    job.sourceDir = work.string();
    job.entryPrefix = dirName;
    job.format = request.compression == Compression::tar ? ArchiveFormat::tar : ArchiveFormat::tarGz;
    job.finalPath = (folder / (trace::kLogDirPrefix + ts + (job.format == ArchiveFormat::tar ? ".tar" : ".tar.gz"))).string();
    if (!listTree(job.sourceDir, &job.entries, &error)) return fail(error);
    if (!writeArchive(job, cancel, &error)) return fail(error);
    fs::remove_all(work, ec);
  }
  outcome.ok = true;
  outcome.timestamp = ts;
  return outcome;
}

}  // namespace vorn::server
