// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>

#include "server/common/collector.h"
#include "server/common/daemon_loop.h"

/// Runs collections one at a time on a thread of its own, so that the bus
/// loop keeps answering (Hello, property queries) during a long one. A
/// request that arrives meanwhile waits in line. Completions run on the
/// loop's thread, which alone touches the bus.
namespace vorn::server {

class CollectionWorker {
 public:
  using Done = std::function<void(const CollectOutcome&)>;

  CollectionWorker(DaemonLoop& loop, Collector& collector);
  ~CollectionWorker();
  CollectionWorker(const CollectionWorker&) = delete;
  CollectionWorker& operator=(const CollectionWorker&) = delete;

  /// Starts the thread and watches for finished collections. False when
  /// the wake-up channel cannot be made.
  bool start();

  /// Queues a collection; `done` runs on the loop thread when it ends.
  void submit(const CollectRequest& request, Done done);

  /// Cancels the running collection, drops the queued ones and joins.
  void stop();

 private:
  struct Job {
    CollectRequest request;
    Done done;
    CollectOutcome outcome;
  };

  void run();
  static int onWake(sd_event_source* s, int fd, uint32_t revents, void* userdata);

  DaemonLoop& loop_;
  Collector& collector_;
  int wakeFd_ = -1;
  bus::EventSourcePtr wakeSource_;
  std::thread thread_;
  std::mutex mutex_;
  std::condition_variable cv_;
  std::deque<Job> queued_;
  std::deque<Job> finished_;
  bool quit_ = false;
  std::atomic<bool> cancel_{false};
};

}  // namespace vorn::server
