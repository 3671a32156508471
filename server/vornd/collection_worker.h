// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <optional>
#include <thread>

#include "server/common/collector.h"
#include "server/common/daemon_loop.h"

/// Runs one collection at a time on a thread of its own, so that the bus
/// loop keeps answering (Hello, property queries) during a long one. Which
/// collection runs next is the loop's business (see collection_line.h):
/// the worker takes one job, and tells the loop when it is free again.
/// Completions run on the loop's thread, which alone touches the bus.
namespace vorn::server {

class CollectionWorker {
 public:
  using Collect = std::function<CollectOutcome(const CollectRequest&, const std::atomic<bool>& cancel)>;
  using Done = std::function<void(const CollectOutcome&)>;

  CollectionWorker(DaemonLoop& loop, Collect collect);
  ~CollectionWorker();
  CollectionWorker(const CollectionWorker&) = delete;
  CollectionWorker& operator=(const CollectionWorker&) = delete;

  /// Starts the thread and watches for finished collections. False when
  /// the wake-up channel cannot be made.
  bool start();

  /// Loop thread: true from `run` until the completion has run.
  bool busy() const { return busy_; }
  /// Loop thread: starts a collection; only when not busy. `done` runs on
  /// the loop thread when it ends, then `onFree`.
  void run(const CollectRequest& request, Done done);
  std::function<void()> onFree;

  /// Cancels the running collection and joins the thread.
  void stop();

 private:
  struct Job {
    CollectRequest request;
    Done done;
    CollectOutcome outcome;
  };

  void loop();
  static int onWake(sd_event_source* s, int fd, uint32_t revents, void* userdata);

  DaemonLoop& loop_;
  Collect collect_;
  int wakeFd_ = -1;
  bus::EventSourcePtr wakeSource_;
  std::thread thread_;
  bool busy_ = false;  // loop thread only

  std::mutex mutex_;
  std::condition_variable cv_;
  std::optional<Job> next_;
  std::optional<Job> finished_;
  bool quit_ = false;
  std::atomic<bool> cancel_{false};
};

}  // namespace vorn::server
