// SPDX-License-Identifier: MIT
#pragma once

#include <time.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <optional>
#include <sstream>

#include "platform/logstore/log_store.h"

namespace oslog_test {

/// A fresh directory, removed with its contents when the test ends.
struct TempDir {
  std::string path = [] {
    std::string pattern = (std::filesystem::temp_directory_path() / "oslog-test-XXXXXX").string();
    return std::string(::mkdtemp(pattern.data()));
  }();
  ~TempDir() { std::filesystem::remove_all(path); }
};

inline std::string readFile(const std::string& path) {
  std::ostringstream all;
  all << std::ifstream(path, std::ios::binary).rdbuf();
  return all.str();
}

inline std::vector<std::string> splitLines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) lines.push_back(line);
  return lines;
}

/// Sets an environment variable (and re-reads TZ) for the object's lifetime.
struct ScopedEnv {
  ScopedEnv(const char* n, const std::string& value) : name(n) {
    if (const char* was = std::getenv(n)) old = was;
    ::setenv(n, value.c_str(), 1), tzset();
  }
  ~ScopedEnv() { (old ? ::setenv(name, old->c_str(), 1) : ::unsetenv(name)), tzset(); }
  const char* name;
  std::optional<std::string> old;
};

/// What a scripted store does: fail to open with `openError`, or deliver the
/// `events` dated from the start on that the filter accepts, then end with
/// `endReason` or, without one, wait to be invalidated. Like the journal, it
/// accepts only the export's stream options.
struct FakeScript {
  FakeScript(std::vector<logstore::Event> e = {}, std::optional<std::uint64_t> reason = logstore::kReasonEnded)
      : events(std::move(e)), endReason(reason) {}
  std::vector<logstore::Event> events;
  std::optional<std::uint64_t> endReason;
  std::string openError;
};

class FakeStream final : public logstore::Stream {
 public:
  explicit FakeStream(FakeScript script) : script_(std::move(script)) {}
  ~FakeStream() override { shutdown(); }

 private:
  std::uint64_t deliver(logstore::Clock::time_point start) override {
    if (flags() != logstore::kStreamOptionsStoredThenEnd) return logstore::kReasonUnsupportedOptions;
    const auto from = std::chrono::duration_cast<std::chrono::microseconds>(start.time_since_epoch()).count();
    for (const auto& e : script_.events)
      if (e.dateMicros >= from && predicate().matches(e)) deliverEvent(e);
    if (script_.endReason) return *script_.endReason;
    waitForCancel(std::chrono::minutes(10));
    return logstore::kReasonInvalidatedByCaller;
  }
  FakeScript script_;
};

/// The store and, once opened, its source.
struct FakeStore final : logstore::Store, logstore::Source {
  explicit FakeStore(FakeScript s) : script(std::move(s)) {}
  logstore::Prepared prepare() override {
    if (!script.openError.empty()) return {nullptr, script.openError};
    return {std::make_shared<FakeStore>(script), {}};
  }
  std::unique_ptr<logstore::Stream> makeStream() override { return std::make_unique<FakeStream>(script); }
  FakeScript script;
};

/// A log message dated `unixSeconds`, in UTC.
inline logstore::Event messageEvent(std::int64_t unixSeconds, std::string_view process, std::string_view message) {
  logstore::Event e;
  e.type = logstore::kEventTypeLogMessage;
  e.dateMicros = unixSeconds * 1000000;
  e.process.assign(process);
  e.composedMessage.assign(message);
  return e;
}

}  // namespace oslog_test
