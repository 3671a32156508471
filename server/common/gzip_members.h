// SPDX-License-Identifier: MIT
#pragma once

#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "server/common/byte_sink.h"

/// gzip on every core. The stream is cut into blocks that a small pool of
/// threads compresses, each into a gzip member of its own, and the members
/// are written in order: a file of several members is one gzip file to
/// every reader. At most a fixed number of blocks is in flight, so memory
/// stays bounded whatever the stream's length; the writer waits for the
/// oldest block when the pool is behind.
namespace vorn::server {

class GzipMembersWriter : public ByteSink {
 public:
  struct Options {
    unsigned threads = 0;  // 0: one per core, at most 4
    size_t blockBytes = 1 << 20;
    int level = 6;
  };

  /// Writes the members to `out`, which must outlive this writer.
  GzipMembersWriter(ByteSink& out, Options options);
  ~GzipMembersWriter() override;
  GzipMembersWriter(const GzipMembersWriter&) = delete;
  GzipMembersWriter& operator=(const GzipMembersWriter&) = delete;

  bool write(const void* data, size_t size) override;
  bool finish() override;
  const std::string& error() const override { return error_; }

 private:
  struct Block;

  void submit();
  bool writeOldest();
  void work();
  void stopPool();

  ByteSink& out_;
  Options options_;
  size_t maxInFlight_;
  std::shared_ptr<Block> filling_;
  std::deque<std::shared_ptr<Block>> inOrder_;  // writer's side only
  bool submittedAny_ = false;
  std::string error_;

  std::mutex mutex_;
  std::condition_variable workReady_;
  std::condition_variable blockDone_;
  std::deque<std::shared_ptr<Block>> todo_;
  bool stop_ = false;
  std::vector<std::thread> pool_;
};

}  // namespace vorn::server
