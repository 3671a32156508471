// SPDX-License-Identifier: MIT
#include "tool/output_check.h"

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <iostream>
#include <streambuf>

#include "platform/linux/errno_text.h"

namespace {

/// The first errno of a failed write to standard output; 0 while none failed.
std::atomic<int> firstWriteError{0};

void noteWriteError(int error) {
  int none = 0;
  firstWriteError.compare_exchange_strong(none, error != 0 ? error : EIO);
}

/// std::cout's own buffer writes through stdio, so it stays in order with
/// anything else written to stdout; this one does the same but keeps the
/// errno of a failure, which stdio forgets (it drops the buffer and keeps
/// only an error flag). Unbuffered itself: the completions of server calls
/// print from the dispatch queue's thread, and only the atomic is shared.
class CheckedStdout final : public std::streambuf {
 protected:
  int_type overflow(int_type c) override {
    if (traits_type::eq_int_type(c, traits_type::eof())) return traits_type::not_eof(c);
    if (std::fputc(traits_type::to_char_type(c), stdout) == EOF) {
      noteWriteError(errno);
      return traits_type::eof();
    }
    return c;
  }
  std::streamsize xsputn(const char* text, std::streamsize count) override {
    const auto written = std::fwrite(text, 1, static_cast<std::size_t>(count), stdout);
    if (static_cast<std::streamsize>(written) < count) noteWriteError(errno);
    return static_cast<std::streamsize>(written);
  }
  int sync() override {
    if (std::fflush(stdout) == 0) return 0;
    noteWriteError(errno);
    return -1;
  }
};

}  // namespace

void guardStandardOutput() {
  for (int fd = STDIN_FILENO; fd <= STDERR_FILENO; ++fd) {
    if (::fcntl(fd, F_GETFD) != -1 || errno != EBADF) continue;
    // The lowest free number is `fd` itself, the ones below being open.
    const int opened = ::open("/dev/null", O_RDONLY | O_NOCTTY);
    if (opened != fd && opened >= 0) ::close(opened);
  }
  // Never destroyed: the streams are flushed at exit after static objects
  // made here are gone.
  static auto* const buffer = new CheckedStdout;
  std::cout.rdbuf(buffer);
}

int checkedExitStatus(int status) {
  std::cout.flush();
  if (std::fflush(stdout) != 0) {
    noteWriteError(errno);
  } else if (std::ferror(stdout)) {
    // The line editor writes its prompt to stdout itself; of its failures
    // only stdio's flag is left.
    noteWriteError(EIO);
  }
  const int error = firstWriteError.load();
  if (error == 0) return status;
  std::cerr << "vorntool: write error: " << vorn::errnoText(error) << std::endl;
  return status == 0 ? 1 : status;
}
