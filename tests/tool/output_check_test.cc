// SPDX-License-Identifier: MIT
#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <iostream>

#include "tool/output_check.h"

namespace {

struct Case {
  const char* name;
  const char* output;  // what standard output is
  std::function<void()> write;
  int status;    // what the tool would end with
  int expected;  // what it ends with
  const char* err;  // a regex over standard error
};

void PrintTo(const Case& c, std::ostream* os) { *os << c.name; }

class OutputCheck : public testing::TestWithParam<Case> {};

// Each case runs in a child of its own: the check keeps the first failure
// for the rest of the process.
TEST_P(OutputCheck, TurnsALostWriteIntoStatusOneAndALine) {
  const Case& c = GetParam();
  EXPECT_EXIT(
      {
        guardStandardOutput();
        const int fd = ::open(c.output, O_WRONLY);
        if (fd < 0 || ::dup2(fd, STDOUT_FILENO) < 0) std::_Exit(99);
        c.write();
        std::_Exit(checkedExitStatus(c.status));
      },
      testing::ExitedWithCode(c.expected), c.err);
}

INSTANTIATE_TEST_SUITE_P(
    Tool, OutputCheck,
    testing::Values(
        Case{"Written", "/dev/null", [] { std::cout << "Path = x" << std::endl; }, 0, 0, "^$"},
        Case{"LostThroughCout", "/dev/full", [] { std::cout << "Path = x" << std::endl; }, 0, 1,
             "^vorntool: write error: No space left on device\n$"},
        // A writer that goes around std::cout, as the line editor does:
        // stdio keeps only its error flag.
        Case{"LostThroughStdio", "/dev/full", [] { std::fputs("(/vorntool)>> ", stdout), std::fflush(stdout); }, 0, 1,
             "^vorntool: write error: Input/output error\n$"},
        Case{"LostAtTheEnd", "/dev/full", [] { std::cout << "unflushed"; }, 0, 1,
             "^vorntool: write error: No space left on device\n$"},
        Case{"AFailureKeepsItsStatus", "/dev/full", [] { std::cout << "x" << std::endl; }, 255, 255,
             "write error"}),
    [](const auto& paramInfo) { return std::string(paramInfo.param.name); });

}  // namespace
