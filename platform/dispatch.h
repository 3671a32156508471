// SPDX-License-Identifier: MIT
#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <utility>

/// Dispatch primitives: serial queues, groups and blocks with the ownership
/// rules of the original platform (copying a handle retains, destroying it
/// releases). Standard library only.
namespace dispatch {

namespace detail {
struct QueueCore;
struct GroupState;
}  // namespace detail

/// A serial FIFO queue with its own worker thread. Copies share the queue;
/// the thread ends once the last handle is gone and the pending work is done.
/// Work still queued when the last handle goes away runs all the same, in
/// order: releasing that handle waits for it, unless the release happens in
/// work on the queue itself, whose thread then finishes the rest alone.
class queue {
 public:
  queue() = default;  // empty handle
  explicit queue(std::string label);

  /// Runs `work` on the queue's thread after everything submitted before it.
  void async(std::function<void()> work) const;
  const std::string& label() const;
  /// True when called from this queue's own thread.
  bool isCurrent() const;
  explicit operator bool() const { return core_ != nullptr; }
  friend bool operator==(const queue&, const queue&) = default;

 private:
  std::shared_ptr<detail::QueueCore> core_;
};

/// A counter of outstanding work that a thread can wait on. Enter and leave
/// are safe from any thread. A default-made group is a new, empty group.
class group {
 public:
  group();

  void enter() const;
  void leave() const;
  /// Waits until the group is empty or `timeout` has passed; true when empty.
  bool wait(std::chrono::nanoseconds timeout) const;
  /// Waits for as long as it takes.
  void wait() const;
  friend bool operator==(const group&, const group&) = default;

 private:
  std::shared_ptr<detail::GroupState> state_;
};

template <typename Signature>
class block;

/// Owning handle of a callable, possibly empty. Copying the handle copies the
/// callable and with it everything it captured.
template <typename R, typename... Args>
class block<R(Args...)> {
 public:
  block() = default;
  block(std::nullptr_t) {}
  template <typename F,
            typename = std::enable_if_t<!std::is_same_v<std::decay_t<F>, block> &&
                                        std::is_invocable_r_v<R, F&, Args...>>>
  block(F&& f) : fn_(std::forward<F>(f)) {}

  explicit operator bool() const { return static_cast<bool>(fn_); }
  R operator()(Args... args) const { return fn_(std::forward<Args>(args)...); }

 private:
  std::function<R(Args...)> fn_;
};

}  // namespace dispatch

/// Holds one membership of a dispatch group: entered when made or copied,
/// left when destroyed. An empty holder does nothing.
class GroupMembership {
 public:
  GroupMembership() = default;
  explicit GroupMembership(dispatch::group g) : group_(std::move(g)), held_(true) { group_.enter(); }
  GroupMembership(const GroupMembership& other) : group_(other.group_), held_(other.held_) {
    if (held_) group_.enter();
  }
  GroupMembership(GroupMembership&& other) noexcept
      : group_(other.group_), held_(std::exchange(other.held_, false)) {}
  GroupMembership& operator=(GroupMembership other) noexcept {
    std::swap(group_, other.group_);
    std::swap(held_, other.held_);
    return *this;
  }
  ~GroupMembership() {
    if (held_) group_.leave();
  }

 private:
  dispatch::group group_;
  bool held_ = false;
};
