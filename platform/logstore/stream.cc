// SPDX-License-Identifier: MIT
#include "platform/logstore/log_store.h"

namespace logstore {

Stream::~Stream() { shutdown(); }

void Stream::activateStreamFromDate(Clock::time_point start) {
  std::lock_guard lock(mutex_);
  if (activated_) return;
  activated_ = true;
  thread_ = std::thread([this, start] { finish(cancelled() ? kReasonInvalidatedByCaller : deliver(start)); });
}

void Stream::invalidate() {
  {
    std::lock_guard lock(mutex_);
    cancelled_.store(true, std::memory_order_relaxed);
    cancelWake_.notify_all();
    if (!activated_) {
      activated_ = true;  // a stream is never started after being invalidated
    } else if (thread_.joinable() && thread_.get_id() != std::this_thread::get_id()) {
      // Joined outside the lock below; the handlers may call back in.
    } else {
      return;  // from a handler: the stream's thread reports when it unwinds
    }
  }
  std::thread running;
  {
    std::lock_guard lock(mutex_);
    running = std::move(thread_);
  }
  if (running.joinable())
    running.join();
  else
    finish(kReasonInvalidatedByCaller);
}

bool Stream::waitForCancel(std::chrono::nanoseconds timeout) {
  std::unique_lock lock(mutex_);
  return cancelWake_.wait_for(lock, timeout, [this] { return cancelled(); });
}

void Stream::shutdown() {
  std::thread running;
  {
    std::lock_guard lock(mutex_);
    cancelled_.store(true, std::memory_order_relaxed);
    cancelWake_.notify_all();
    running = std::move(thread_);
  }
  if (running.joinable()) running.join();
}

void Stream::finish(std::uint64_t reason) {
  if (finished_.exchange(true)) return;
  if (invalidationHandler_) invalidationHandler_(reason);
}

}  // namespace logstore
