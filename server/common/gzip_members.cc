// SPDX-License-Identifier: MIT
#include "server/common/gzip_members.h"

#include <zlib.h>

#include <algorithm>
#include <cstring>

namespace vorn::server {

struct GzipMembersWriter::Block {
  std::vector<unsigned char> in;
  std::vector<unsigned char> out;
  bool done = false;
  bool ok = false;
};

namespace {

constexpr int kGzipWindow = 15 + 16;  // deflate with a gzip header and trailer
constexpr int kMemLevel = 8;

/// One gzip member holding `in`; false when zlib fails.
bool compressMember(z_stream& z, const std::vector<unsigned char>& in, std::vector<unsigned char>* out) {
  if (deflateReset(&z) != Z_OK) return false;
  out->resize(deflateBound(&z, in.size()) + 32);
  z.next_in = const_cast<unsigned char*>(in.data());
  z.avail_in = static_cast<uInt>(in.size());
  z.next_out = out->data();
  z.avail_out = static_cast<uInt>(out->size());
  if (deflate(&z, Z_FINISH) != Z_STREAM_END) return false;
  out->resize(out->size() - z.avail_out);
  return true;
}

}  // namespace

GzipMembersWriter::GzipMembersWriter(ByteSink& out, Options options) : out_(out), options_(options) {
  if (options_.threads == 0) options_.threads = std::clamp(std::thread::hardware_concurrency(), 1u, 4u);
  options_.blockBytes = std::max<size_t>(options_.blockBytes, 4096);
  // Enough to keep every thread busy while the oldest block is written.
  maxInFlight_ = 2 * options_.threads;
  for (unsigned i = 0; i < options_.threads; ++i) pool_.emplace_back([this] { work(); });
}

GzipMembersWriter::~GzipMembersWriter() {
  {
    // Given up on (an error upstream): what is queued is not wanted.
    std::lock_guard lock(mutex_);
    todo_.clear();
  }
  stopPool();
}

void GzipMembersWriter::stopPool() {
  {
    std::lock_guard lock(mutex_);
    stop_ = true;
  }
  workReady_.notify_all();
  for (auto& t : pool_) t.join();
  pool_.clear();
}

bool GzipMembersWriter::write(const void* data, size_t size) {
  const auto* p = static_cast<const unsigned char*>(data);
  while (error_.empty() && size > 0) {
    if (!filling_) {
      filling_ = std::make_shared<Block>();
      filling_->in.reserve(options_.blockBytes);
    }
    const size_t take = std::min(size, options_.blockBytes - filling_->in.size());
    filling_->in.insert(filling_->in.end(), p, p + take);
    p += take;
    size -= take;
    if (filling_->in.size() == options_.blockBytes) submit();
  }
  return error_.empty();
}

void GzipMembersWriter::submit() {
  submittedAny_ = true;
  inOrder_.push_back(filling_);
  {
    std::lock_guard lock(mutex_);
    todo_.push_back(std::move(filling_));
  }
  filling_.reset();
  workReady_.notify_one();
  while (error_.empty() && inOrder_.size() >= maxInFlight_) writeOldest();
}

bool GzipMembersWriter::writeOldest() {
  std::shared_ptr<Block> oldest = inOrder_.front();
  {
    std::unique_lock lock(mutex_);
    blockDone_.wait(lock, [&] { return oldest->done; });
  }
  inOrder_.pop_front();
  if (!oldest->ok) {
    error_ = "cannot compress";
  } else if (!out_.write(oldest->out.data(), oldest->out.size())) {
    error_ = out_.error();
  }
  return error_.empty();
}

bool GzipMembersWriter::finish() {
  // An empty stream still makes a gzip file: one empty member.
  if (filling_ || !submittedAny_) {
    if (!filling_) filling_ = std::make_shared<Block>();
    submit();
  }
  while (error_.empty() && !inOrder_.empty()) writeOldest();
  stopPool();
  return error_.empty() && out_.finish();
}

void GzipMembersWriter::work() {
  z_stream z{};
  const bool ready = deflateInit2(&z, options_.level, Z_DEFLATED, kGzipWindow, kMemLevel, Z_DEFAULT_STRATEGY) == Z_OK;
  for (;;) {
    std::shared_ptr<Block> block;
    {
      std::unique_lock lock(mutex_);
      workReady_.wait(lock, [&] { return stop_ || !todo_.empty(); });
      if (todo_.empty()) break;
      block = std::move(todo_.front());
      todo_.pop_front();
    }
    const bool ok = ready && compressMember(z, block->in, &block->out);
    std::vector<unsigned char>().swap(block->in);
    {
      std::lock_guard lock(mutex_);
      block->ok = ok;
      block->done = true;
    }
    blockDone_.notify_all();
  }
  if (ready) deflateEnd(&z);
}

}  // namespace vorn::server
