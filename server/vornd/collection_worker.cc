// SPDX-License-Identifier: MIT
#include "server/vornd/collection_worker.h"

#include <sys/eventfd.h>
#include <unistd.h>

#include <cstdint>

namespace vorn::server {

CollectionWorker::CollectionWorker(DaemonLoop& loop, Collect collect) : loop_(loop), collect_(std::move(collect)) {}

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
  thread_ = std::thread([this] { loop(); });
  return true;
}

void CollectionWorker::run(const CollectRequest& request, Done done) {
  busy_ = true;
  {
    std::lock_guard lock(mutex_);
    next_ = Job{request, std::move(done), {}};
  }
  cv_.notify_one();
}

void CollectionWorker::stop() {
  {
    std::lock_guard lock(mutex_);
    quit_ = true;
    next_.reset();
  }
  cancel_ = true;
  cv_.notify_one();
  if (thread_.joinable()) thread_.join();
}

void CollectionWorker::loop() {
  for (;;) {
    Job job;
    {
      std::unique_lock lock(mutex_);
      cv_.wait(lock, [this] { return quit_ || next_.has_value(); });
      if (quit_) return;
      job = std::move(*next_);
      next_.reset();
    }
    try {
      job.outcome = collect_(job.request, cancel_);
    } catch (const std::exception& e) {
      job.outcome = CollectOutcome{false, {}, e.what()};
    }
    {
      std::lock_guard lock(mutex_);
      finished_ = std::move(job);
    }
    std::uint64_t one = 1;
    [[maybe_unused]] auto n = ::write(wakeFd_, &one, sizeof one);
  }
}

int CollectionWorker::onWake(sd_event_source*, int fd, uint32_t, void* userdata) {
  auto* self = static_cast<CollectionWorker*>(userdata);
  std::uint64_t count = 0;
  [[maybe_unused]] auto n = ::read(fd, &count, sizeof count);
  std::optional<Job> done;
  {
    std::lock_guard lock(self->mutex_);
    done.swap(self->finished_);
  }
  if (!done) return 0;
  self->busy_ = false;
  try {
    done->done(done->outcome);
  } catch (...) {
    // A failed answer must not stop the line.
  }
  if (self->onFree) self->onFree();
  return 0;
}

}  // namespace vorn::server
