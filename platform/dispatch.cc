// SPDX-License-Identifier: MIT
#include "platform/dispatch.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <thread>

namespace dispatch::detail {

struct QueueState {
  std::mutex mutex;
  std::condition_variable wake;
  std::deque<std::function<void()>> pending;
  bool closing = false;
};

/// The part of a queue that handles share. Its destruction closes the queue;
/// the worker thread owns the state, so it may outlive the last handle.
struct QueueCore {
  std::string label;
  std::shared_ptr<QueueState> state = std::make_shared<QueueState>();
  std::thread thread;

  explicit QueueCore(std::string l) : label(std::move(l)) {
    thread = std::thread([s = state] {
      std::unique_lock lock(s->mutex);
      for (;;) {
        s->wake.wait(lock, [&] { return s->closing || !s->pending.empty(); });
        if (s->pending.empty()) return;
        auto work = std::move(s->pending.front());
        s->pending.pop_front();
        lock.unlock();
        work();
        // Whatever the work captured is released before the lock is taken
        // again, so a capture that drops the last queue handle cannot deadlock.
        work = nullptr;
        lock.lock();
      }
    });
  }

  ~QueueCore() {
    {
      std::lock_guard lock(state->mutex);
      state->closing = true;
    }
    state->wake.notify_one();
    // The last handle may go away inside work running on this very queue.
    if (thread.get_id() == std::this_thread::get_id())
      thread.detach();
    else
      thread.join();
  }
};

struct GroupState {
  std::mutex mutex;
  std::condition_variable emptied;
  long count = 0;
};

}  // namespace dispatch::detail

namespace dispatch {

queue::queue(std::string label) : core_(std::make_shared<detail::QueueCore>(std::move(label))) {}

void queue::async(std::function<void()> work) const {
  if (!core_ || !work) return;
  auto& s = *core_->state;
  {
    std::lock_guard lock(s.mutex);
    s.pending.push_back(std::move(work));
  }
  s.wake.notify_one();
}

const std::string& queue::label() const {
  static const std::string none;
  return core_ ? core_->label : none;
}

bool queue::isCurrent() const {
  return core_ && core_->thread.get_id() == std::this_thread::get_id();
}

group::group() : state_(std::make_shared<detail::GroupState>()) {}

void group::enter() const {
  std::lock_guard lock(state_->mutex);
  ++state_->count;
}

void group::leave() const {
  std::lock_guard lock(state_->mutex);
  // An unbalanced leave is a caller's bug; never let the count go negative.
  if (state_->count > 0 && --state_->count == 0) state_->emptied.notify_all();
}

bool group::wait(std::chrono::nanoseconds timeout) const {
  std::unique_lock lock(state_->mutex);
  return state_->emptied.wait_for(lock, timeout, [&] { return state_->count == 0; });
}

void group::wait() const {
  std::unique_lock lock(state_->mutex);
  state_->emptied.wait(lock, [&] { return state_->count == 0; });
}

}  // namespace dispatch
