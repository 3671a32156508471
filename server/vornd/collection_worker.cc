// SPDX-License-Identifier: MIT
#include "server/vornd/collection_worker.h"

#include <sys/eventfd.h>
#include <unistd.h>

#include <cstdint>

namespace vorn::server {

CollectionWorker::CollectionWorker(DaemonLoop& loop, Collector& collector) : loop_(loop), collector_(collector) {}

CollectionWorker::~CollectionWorker() {
  stop();
  wakeSource_.reset();
  if (wakeFd_ >= 0) ::close(wakeFd_);
}

bool CollectionWorker::start() {
  wakeFd_ = ::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
  if (wakeFd_ < 0) return false;
  sd_event_source* src = nullptr;
  if (sd_event_add_io(loop_.event(), &src, wakeFd_, EPOLLIN, &CollectionWorker::onWake, this) < 0) return false;
  wakeSource_.reset(src);
  thread_ = std::thread([this] { run(); });
  return true;
}

void CollectionWorker::submit(const CollectRequest& request, Done done) {
  std::lock_guard lock(mutex_);
  queued_.push_back(Job{request, std::move(done), {}});
  cv_.notify_one();
}

void CollectionWorker::stop() {
  {
    std::lock_guard lock(mutex_);
    quit_ = true;
    queued_.clear();
  }
  cancel_ = true;
  cv_.notify_one();
  if (thread_.joinable()) thread_.join();
}

void CollectionWorker::run() {
  for (;;) {
    Job job;
    {
      std::unique_lock lock(mutex_);
      cv_.wait(lock, [this] { return quit_ || !queued_.empty(); });
      if (quit_) return;
      job = std::move(queued_.front());
      queued_.pop_front();
    }
    try {
      job.outcome = collector_.collect(job.request, cancel_);
    } catch (const std::exception& e) {
      job.outcome = CollectOutcome{false, {}, e.what()};
    }
    {
      std::lock_guard lock(mutex_);
      finished_.push_back(std::move(job));
    }
    std::uint64_t one = 1;
    // The loop drains every finished job per wake-up, so a lost increment
    // (counter full) cannot strand one.
    [[maybe_unused]] auto n = ::write(wakeFd_, &one, sizeof one);
  }
}

int CollectionWorker::onWake(sd_event_source*, int fd, uint32_t, void* userdata) {
  auto* self = static_cast<CollectionWorker*>(userdata);
  std::uint64_t count = 0;
  [[maybe_unused]] auto n = ::read(fd, &count, sizeof count);
  std::deque<Job> done;
  {
    std::lock_guard lock(self->mutex_);
    done.swap(self->finished_);
  }
  for (auto& job : done) {
    try {
      job.done(job.outcome);
    } catch (...) {
      // One caller's failed answer must not strand the others.
    }
  }
  return 0;
}

}  // namespace vorn::server
