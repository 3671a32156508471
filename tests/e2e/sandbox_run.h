// SPDX-License-Identifier: MIT
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <string>
#include <vector>

/// Tests that run the sandbox. It makes PID and mount namespaces, which
/// only root may: as anybody else the tests are skipped, not failed.
class InTheSandbox : public testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() != 0) GTEST_SKIP() << "the sandbox makes PID and mount namespaces, which needs root";
  }
};

/// Runs a bash script inside the sandbox (private bus, daemons, platform
/// root) against this build's binaries, and collects what it printed.
struct SandboxResult {
  int status = -1;  // the script's exit status; -1 when it did not exit
  std::string out;
  std::string err;
};

SandboxResult runInSandbox(const std::vector<std::string>& sandboxOptions, const std::string& script);

/// `word` quoted for a shell command line.
std::string quoted(const std::string& word);
