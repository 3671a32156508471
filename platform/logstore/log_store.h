// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include "platform/dispatch.h"
#include "platform/logstore/log_event.h"
#include "platform/logstore/predicate.h"

/// The log-store reader: a store is opened into a source, a source makes
/// streams, and a stream delivers the stored events from a start date on its
/// own thread, one at a time, then reports once why it ended.
namespace logstore {

/// Stream options: deliver the stored events from the start date up to the
/// end of the store as it was when the stream started, then end. The only
/// options the stores here support.
inline constexpr std::uint64_t kStreamOptionsStoredThenEnd = 21;

/// Reasons given to the invalidation handler.
inline constexpr std::uint64_t kReasonInvalidatedByCaller = 1;  ///< invalidate() was called
inline constexpr std::uint64_t kReasonReadError = 2;            ///< the store could not be read
inline constexpr std::uint64_t kReasonUnsupportedOptions = 3;   ///< flags other than the ones above
inline constexpr std::uint64_t kReasonEnded = 5;                ///< everything was delivered

using EventHandler = dispatch::block<void(const Event&)>;
using InvalidationHandler = dispatch::block<void(std::uint64_t reason)>;
using Clock = std::chrono::system_clock;

/// A one-shot stream over a source. Set it up, activate it once; the event
/// handler then runs on the stream's thread for each event, and the
/// invalidation handler runs exactly once at the end, also on that thread.
///
/// Implementations supply deliver(); they must call shutdown() first thing in
/// their destructor so the thread never runs into a half-destroyed object.
/// A stream must not be destroyed from inside its own handlers.
class Stream {
 public:
  virtual ~Stream();
  Stream(const Stream&) = delete;
  Stream& operator=(const Stream&) = delete;

  void setFlags(std::uint64_t flags) { flags_ = flags; }
  void setFilterPredicate(Predicate predicate) { predicate_ = std::move(predicate); }
  void setEventHandler(EventHandler handler) { eventHandler_ = std::move(handler); }
  void setInvalidationHandler(InvalidationHandler handler) { invalidationHandler_ = std::move(handler); }

  /// Starts delivery of the events dated `start` or later. A second call
  /// does nothing.
  void activateStreamFromDate(Clock::time_point start);
  /// Stops the stream. Called from another thread, it returns only after the
  /// stream's thread has stopped delivering and has run the invalidation
  /// handler (reason kReasonInvalidatedByCaller unless the stream had already
  /// ended), so whatever the handlers use may be released afterwards.
  void invalidate();

 protected:
  Stream() = default;

  /// Runs on the stream's thread: hands each event to deliverEvent() and
  /// returns the reason to report. Should return kReasonInvalidatedByCaller
  /// soon after cancelled() turns true.
  virtual std::uint64_t deliver(Clock::time_point start) = 0;

  std::uint64_t flags() const { return flags_; }
  const Predicate& predicate() const { return predicate_; }
  bool cancelled() const { return cancelled_.load(std::memory_order_relaxed); }
  void deliverEvent(const Event& event) const {
    if (eventHandler_) eventHandler_(event);
  }
  /// Blocks the stream's thread until invalidate() or `timeout`; true when
  /// the stream was cancelled.
  bool waitForCancel(std::chrono::nanoseconds timeout);
  void shutdown();

 private:
  void finish(std::uint64_t reason);

  std::uint64_t flags_ = 0;
  Predicate predicate_;
  EventHandler eventHandler_;
  InvalidationHandler invalidationHandler_;

  std::atomic<bool> cancelled_{false};
  std::atomic<bool> finished_{false};
  std::mutex mutex_;  // guards thread_ and activated_, and pairs with cancelWake_
  std::condition_variable cancelWake_;
  bool activated_ = false;
  std::thread thread_;
};

/// An opened store; each stream made from it reads on its own.
class Source {
 public:
  virtual ~Source() = default;
  virtual std::unique_ptr<Stream> makeStream() = 0;
};

/// The outcome of opening a store: a source, or the reason it failed.
struct Prepared {
  std::shared_ptr<Source> source;
  std::string error;
};

class Store {
 public:
  virtual ~Store() = default;
  virtual Prepared prepare() = 0;
};

/// The machine's log store: the local system journal, or when VORN_ROOT is
/// set, the journal directories <root>/var/log/journal and <root>/run/log/journal
/// (at least one must exist).
std::unique_ptr<Store> localStore();

}  // namespace logstore
