// SPDX-License-Identifier: MIT
// The log store on sd-journal: one journal entry is one event.
#include <sys/stat.h>
#include <systemd/sd-journal.h>

#include <algorithm>
#include <charconv>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <system_error>
#include <vector>

#include "platform/logstore/log_store.h"
#include "platform/logstore/unicode_fold.h"

namespace logstore {
namespace {

struct JournalClose {
  void operator()(sd_journal* j) const { sd_journal_close(j); }
};
using JournalPtr = std::unique_ptr<sd_journal, JournalClose>;

struct FreeDeleter {
  void operator()(char* p) const { std::free(p); }
};

// The kernel cuts a process's name to this many bytes in _COMM.
constexpr std::size_t kCommBytes = 15;

std::string errnoText(int negativeErrno) { return std::generic_category().message(-negativeErrno); }

bool isDirectory(const std::string& path) {
  struct stat st {};
  return ::stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

struct Opened {
  JournalPtr journal;
  std::string error;
};

/// Opens the journal that localStore() describes; `root` empty means the
/// machine's own journal.
Opened openJournal(const std::string& root) {
  sd_journal* j = nullptr;
  int r;
  if (root.empty()) {
    r = sd_journal_open(&j, SD_JOURNAL_LOCAL_ONLY);
  } else {
    // With an OS root sd-journal quietly opens nothing when both folders are
    // missing; an export from a wrong root must fail instead of being empty.
    if (!isDirectory(root + "/var/log/journal") && !isDirectory(root + "/run/log/journal"))
      return {nullptr, root + "/var/log/journal: " + errnoText(-ENOENT)};
    r = sd_journal_open_directory(&j, root.c_str(), SD_JOURNAL_OS_ROOT);
  }
  if (r < 0) return {nullptr, errnoText(r)};
  return {JournalPtr(j), {}};
}

std::string_view baseName(std::string_view path) {
  auto slash = path.rfind('/');
  return slash == std::string_view::npos ? path : path.substr(slash + 1);
}

template <typename T>
T parseNumber(std::string_view text) {
  T value{};
  std::from_chars(text.data(), text.data() + text.size(), value);
  return value;
}

/// The local zone's offset changes only at transitions, which fall on whole
/// minutes; consecutive entries mostly share one.
class OffsetCache {
 public:
  std::int32_t at(std::int64_t unixSeconds) {
    std::int64_t minute = unixSeconds >= 0 ? unixSeconds / 60 : (unixSeconds - 59) / 60;
    if (minute != minute_) {
      minute_ = minute;
      offset_ = localSecondsFromGMT(unixSeconds);
    }
    return offset_;
  }

 private:
  std::int64_t minute_ = LLONG_MIN;
  std::int32_t offset_ = 0;
};

/// What the journal's own matches cannot decide: _COMM holds only 15 bytes
/// and the event's process comes from _EXE when there is one, so process
/// terms are checked again on each event; image terms are exact paths.
class Selection {
 public:
  enum class Outcome { kEverything, kMatches, kNothing, kError };

  Outcome build(sd_journal* j, const Predicate& predicate) {
    predicate_ = &predicate;
    if (predicate.empty()) return Outcome::kEverything;

    std::vector<std::string> paths;
    if (sd_journal_query_unique(j, "_EXE") < 0) return Outcome::kError;
    const void* data;
    std::size_t length;
    SD_JOURNAL_FOREACH_UNIQUE(j, data, length) {
      std::string_view field(static_cast<const char*>(data), length);
      if (field.starts_with("_EXE=")) paths.emplace_back(field.substr(5));
    }

    std::vector<std::string> comms, exes;
    for (const auto& process : predicate.processes()) {
      if (process.empty()) continue;
      comms.push_back("_COMM=" + process.substr(0, kCommBytes));
      for (const auto& path : paths)
        if (baseName(path) == process) exes.push_back(path);
    }
    if (!predicate.imageFragments().empty()) {
      for (const auto& path : paths)
        if (predicate.matchesImagePath(path)) {
          exes.push_back(path);
          imagePaths_.push_back(path);
        }
    }
    std::sort(imagePaths_.begin(), imagePaths_.end());
    std::sort(exes.begin(), exes.end());
    exes.erase(std::unique(exes.begin(), exes.end()), exes.end());
    // A journal without matches yields every entry: a filter none of whose
    // terms names anything must select nothing instead.
    if (comms.empty() && exes.empty()) return Outcome::kNothing;

    for (const auto& m : comms)
      if (sd_journal_add_match(j, m.data(), m.size()) < 0) return Outcome::kError;
    if (!comms.empty() && !exes.empty() && sd_journal_add_disjunction(j) < 0) return Outcome::kError;
    for (const auto& path : exes) {
      std::string m = "_EXE=" + path;
      if (sd_journal_add_match(j, m.data(), m.size()) < 0) return Outcome::kError;
    }
    return Outcome::kMatches;
  }

  bool accepts(const Event& event) const {
    if (event.process.has() && predicate_->matchesProcess(event.process.view())) return true;
    return event.senderImagePath.has() &&
           std::binary_search(imagePaths_.begin(), imagePaths_.end(), event.senderImagePath.view());
  }

 private:
  const Predicate* predicate_ = nullptr;
  std::vector<std::string> imagePaths_;
};

class JournalStream final : public Stream {
 public:
  explicit JournalStream(JournalPtr journal) : journal_(std::move(journal)) {}
  ~JournalStream() override { shutdown(); }

 private:
  std::uint64_t deliver(Clock::time_point start) override;
  void readEntry(std::uint64_t realtime, Event& event);

  JournalPtr journal_;
  Text comm_;
  OffsetCache offsets_;
};

std::uint64_t JournalStream::deliver(Clock::time_point start) {
  if (flags() != kStreamOptionsStoredThenEnd) return kReasonUnsupportedOptions;
  sd_journal* j = journal_.get();

  Selection selection;
  const auto outcome = selection.build(j, predicate());
  if (outcome == Selection::Outcome::kError) return kReasonReadError;
  if (outcome == Selection::Outcome::kNothing) return kReasonEnded;
  const bool recheck = outcome == Selection::Outcome::kMatches;

  // The end is fixed now: entries written while the stream runs are not
  // waited for.
  if (sd_journal_seek_tail(j) < 0) return kReasonReadError;
  int r = sd_journal_previous(j);
  if (r < 0) return kReasonReadError;
  if (r == 0) return kReasonEnded;
  char* rawCursor = nullptr;
  std::uint64_t tailRealtime = 0;
  if (sd_journal_get_cursor(j, &rawCursor) < 0) return kReasonReadError;
  std::unique_ptr<char, FreeDeleter> tailCursor(rawCursor);
  if (sd_journal_get_realtime_usec(j, &tailRealtime) < 0) return kReasonReadError;

  const auto sinceEpoch =
      std::chrono::duration_cast<std::chrono::microseconds>(start.time_since_epoch()).count();
  const std::uint64_t startRealtime = sinceEpoch > 0 ? static_cast<std::uint64_t>(sinceEpoch) : 0;
  if (sd_journal_seek_realtime_usec(j, startRealtime) < 0) return kReasonReadError;

  Event event;
  for (;;) {
    if (cancelled()) return kReasonInvalidatedByCaller;
    r = sd_journal_next(j);
    if (r < 0) return kReasonReadError;
    if (r == 0) return kReasonEnded;
    std::uint64_t realtime = 0;
    if (sd_journal_get_realtime_usec(j, &realtime) < 0) continue;
    // Files of different boots interleave, so an older entry may follow the seek.
    if (realtime >= startRealtime) {
      readEntry(realtime, event);
      if (!recheck || selection.accepts(event)) deliverEvent(event);
    }
    // Comparing cursors costs a parse; only the tail's own date can be the tail.
    if (realtime >= tailRealtime && sd_journal_test_cursor(j, tailCursor.get()) > 0) return kReasonEnded;
  }
}

void JournalStream::readEntry(std::uint64_t realtime, Event& event) {
  event.type = kEventTypeOther;
  event.threadIdentifier = 0;
  event.activityIdentifier = 0;
  event.processIdentifier = 0;
  event.process.clear();
  event.sender.clear();
  event.senderImagePath.clear();
  event.subsystem.clear();
  event.category.clear();
  event.composedMessage.clear();
  comm_.clear();

  sd_journal* j = journal_.get();
  const void* data;
  std::size_t length;
  SD_JOURNAL_FOREACH_DATA(j, data, length) {
    const char* text = static_cast<const char*>(data);
    const auto* eq = static_cast<const char*>(std::memchr(text, '=', length));
    if (eq == nullptr) continue;
    const std::string_view name(text, static_cast<std::size_t>(eq - text));
    const std::string_view value(eq + 1, length - name.size() - 1);
    switch (name.size()) {
      case 3:
        if (name == "TID") event.threadIdentifier = parseNumber<std::uint64_t>(value);
        break;
      case 4:
        if (name == "_PID")
          event.processIdentifier = parseNumber<std::int32_t>(value);
        else if (name == "_EXE")
          event.senderImagePath.assign(value);
        break;
      case 5:
        if (name == "_COMM") comm_.assign(value);
        break;
      case 7:
        if (name == "MESSAGE") {
          event.composedMessage.assign(value);
          event.type = kEventTypeLogMessage;
        }
        break;
      case 12:
        if (name == "LOG_CATEGORY") event.category.assign(value);
        break;
      case 13:
        if (name == "LOG_SUBSYSTEM") event.subsystem.assign(value);
        break;
      case 17:
        if (name == "SYSLOG_IDENTIFIER") event.sender.assign(value);
        break;
      default:
        break;
    }
  }

  if (event.senderImagePath.has())
    event.process.assign(baseName(event.senderImagePath.view()));
  else if (comm_.has())
    event.process.assign(comm_.view());
  if (!event.sender.has() && event.process.has()) event.sender.assign(event.process.view());

  event.dateMicros = static_cast<std::int64_t>(realtime);
  event.secondsFromGMT = offsets_.at(event.dateMicros / 1000000);
}

class JournalSource final : public Source {
 public:
  JournalSource(std::string root, JournalPtr opened) : root_(std::move(root)), opened_(std::move(opened)) {}

  std::unique_ptr<Stream> makeStream() override {
    std::lock_guard lock(mutex_);
    JournalPtr journal = std::move(opened_);
    // A journal handle is not shared between threads: later streams reopen.
    if (!journal) journal = openJournal(root_).journal;
    if (!journal) return nullptr;
    return std::make_unique<JournalStream>(std::move(journal));
  }

 private:
  std::string root_;
  std::mutex mutex_;
  JournalPtr opened_;
};

class JournalStore final : public Store {
 public:
  Prepared prepare() override {
    const char* env = std::getenv("VORN_ROOT");
    std::string root = env != nullptr ? env : "";
    Opened opened = openJournal(root);
    if (!opened.journal) return {nullptr, std::move(opened.error)};
    return {std::make_shared<JournalSource>(std::move(root), std::move(opened.journal)), {}};
  }
};

}  // namespace

std::unique_ptr<Store> localStore() { return std::make_unique<JournalStore>(); }

}  // namespace logstore
