// SPDX-License-Identifier: MIT
#pragma once

#include <cstddef>
#include <string>

/// A stream of bytes on its way to a file: the archive writer hands its
/// output to one, plain or through the parallel gzip writer.
namespace vorn::server {

class ByteSink {
 public:
  virtual ~ByteSink() = default;
  virtual bool write(const void* data, size_t size) = 0;
  /// Writes out whatever is held back; false when anything failed.
  virtual bool finish() = 0;
  virtual const std::string& error() const = 0;
};

/// Writes straight to a descriptor it does not own.
class FdByteSink : public ByteSink {
 public:
  explicit FdByteSink(int fd) : fd_(fd) {}
  bool write(const void* data, size_t size) override;
  bool finish() override { return error_.empty(); }
  const std::string& error() const override { return error_; }

 private:
  int fd_;
  std::string error_;
};

}  // namespace vorn::server
