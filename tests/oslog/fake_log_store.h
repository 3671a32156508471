// SPDX-License-Identifier: MIT
#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "platform/logstore/log_store.h"

namespace oslog_test {

/// A scripted log store: it fails to open with `openError`, or delivers the
/// events of `events` dated from the stream's start on that the filter
/// accepts, then ends with `endReason`, or, with `hangAfterEvents`, waits to
/// be invalidated. Like the journal, it accepts only the export's options.
struct FakeScript {
  std::string openError;
  std::vector<logstore::Event> events;
  std::uint64_t endReason = logstore::kReasonEnded;
  bool hangAfterEvents = false;
};

class FakeStream final : public logstore::Stream {
 public:
  explicit FakeStream(std::shared_ptr<const FakeScript> script) : script_(std::move(script)) {}
  ~FakeStream() override { shutdown(); }

 private:
  std::uint64_t deliver(logstore::Clock::time_point start) override {
    if (flags() != logstore::kStreamOptionsStoredThenEnd) return logstore::kReasonUnsupportedOptions;
    const auto startMicros =
        std::chrono::duration_cast<std::chrono::microseconds>(start.time_since_epoch()).count();
    for (const auto& event : script_->events) {
      if (cancelled()) return logstore::kReasonInvalidatedByCaller;
      if (event.dateMicros < startMicros || !predicate().matches(event)) continue;
      deliverEvent(event);
    }
    if (script_->hangAfterEvents) {
      waitForCancel(std::chrono::minutes(10));
      return logstore::kReasonInvalidatedByCaller;
    }
    return script_->endReason;
  }

  std::shared_ptr<const FakeScript> script_;
};

class FakeSource final : public logstore::Source {
 public:
  explicit FakeSource(std::shared_ptr<const FakeScript> script) : script_(std::move(script)) {}
  std::unique_ptr<logstore::Stream> makeStream() override { return std::make_unique<FakeStream>(script_); }

 private:
  std::shared_ptr<const FakeScript> script_;
};

class FakeStore final : public logstore::Store {
 public:
  explicit FakeStore(FakeScript script) : script_(std::make_shared<FakeScript>(std::move(script))) {}
  logstore::Prepared prepare() override {
    if (!script_->openError.empty()) return {nullptr, script_->openError};
    return {std::make_shared<FakeSource>(script_), {}};
  }

 private:
  std::shared_ptr<const FakeScript> script_;
};

/// A log-message event dated `unixSeconds` in the zone `secondsFromGMT`.
inline logstore::Event messageEvent(std::int64_t unixSeconds, std::string process, std::string message,
                                    std::int32_t secondsFromGMT = 0) {
  logstore::Event e;
  e.type = logstore::kEventTypeLogMessage;
  e.dateMicros = unixSeconds * 1000000;
  e.secondsFromGMT = secondsFromGMT;
  e.processIdentifier = 42;
  e.process.assign(process);
  e.sender.assign(process);
  e.composedMessage.assign(message);
  return e;
}

}  // namespace oslog_test
