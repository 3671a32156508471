// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>
#include <zlib.h>

#include <random>

#include "server/common/gzip_members.h"
#include "tests/support/file_size_limit.h"

using vorn::server::ByteSink;
using vorn::server::GzipMembersWriter;

namespace {

class StringSink : public ByteSink {
 public:
  bool write(const void* data, size_t size) override {
    out.append(static_cast<const char*>(data), size);
    return true;
  }
  bool finish() override { return true; }
  const std::string& error() const override { return error_; }
  std::string out;

 private:
  std::string error_;
};

/// Inflates every member of `gz` in turn, as gzip readers do; counts them.
std::string gunzip(const std::string& gz, int* members) {
  std::string out;
  *members = 0;
  z_stream z{};
  inflateInit2(&z, 15 + 16);
  z.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(gz.data()));
  z.avail_in = static_cast<uInt>(gz.size());
  char buffer[1 << 16];
  while (z.avail_in > 0) {
    z.next_out = reinterpret_cast<Bytef*>(buffer);
    z.avail_out = sizeof buffer;
    int r = inflate(&z, Z_NO_FLUSH);
    out.append(buffer, sizeof buffer - z.avail_out);
    if (r == Z_STREAM_END) {
      ++*members;
      inflateReset(&z);
    } else if (r != Z_OK) {
      out = "<corrupt>";
      break;
    }
  }
  inflateEnd(&z);
  return out;
}

struct Stream {
  const char* label;
  size_t bytes;
  size_t blockBytes;
  unsigned threads;
  size_t writeSize;  // how the producer hands it over
  int members;
};

void PrintTo(const Stream& s, std::ostream* os) { *os << s.label; }

class GzipMembers : public ::testing::TestWithParam<Stream> {};

TEST_P(GzipMembers, UnpackToTheInputInOrder) {
  const Stream& s = GetParam();
  std::mt19937 random(s.bytes);
  std::string input(s.bytes, '\0');
  for (auto& c : input) c = static_cast<char>('a' + random() % 8);
  StringSink sink;
  {
    GzipMembersWriter writer(sink, {s.threads, s.blockBytes, 6});
    for (size_t at = 0; at < input.size(); at += s.writeSize) {
      ASSERT_TRUE(writer.write(input.data() + at, std::min(s.writeSize, input.size() - at)));
    }
    ASSERT_TRUE(writer.finish()) << writer.error();
  }
  int members = 0;
  EXPECT_EQ(gunzip(sink.out, &members), input);
  EXPECT_EQ(members, s.members);
}

INSTANTIATE_TEST_SUITE_P(Server, GzipMembers,
                         ::testing::Values(Stream{"Empty", 0, 4096, 2, 1, 1},
                                           Stream{"LessThanABlock", 100, 4096, 2, 7, 1},
                                           Stream{"ExactBlocks", 4 * 4096, 4096, 2, 4096, 4},
                                           Stream{"ManyBlocksFewThreads", 100 * 4096 + 5, 4096, 1, 10000, 101},
                                           Stream{"ManyBlocksManyThreads", 100 * 4096 + 5, 4096, 4, 333, 101}),
                         [](const auto& paramInfo) { return std::string(paramInfo.param.label); });

TEST(FdByteSink, AShortWriteIsFinishedOrFails) {
  char path[] = "/tmp/vorn-byte-sink.XXXXXX";
  const int fd = ::mkstemp(path);
  ASSERT_GE(fd, 0);
  const std::string data(10000, 'x');
  {
    // The first write takes what fits, the second one fails.
    vorn::test::FileSizeLimit disk(4096);
    vorn::server::FdByteSink sink(fd);
    EXPECT_FALSE(sink.write(data.data(), data.size()));
    EXPECT_EQ(sink.error(), "File too large");
    EXPECT_FALSE(sink.finish());
  }
  struct stat st {};
  EXPECT_EQ(::fstat(fd, &st), 0);
  EXPECT_EQ(st.st_size, 4096);
  ::close(fd);
  ::unlink(path);
}

}  // namespace
