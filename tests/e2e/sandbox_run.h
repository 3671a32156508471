// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <vector>

/// Runs a bash script inside the sandbox (private bus, daemons, platform
/// root) against this build's binaries, and collects what it printed.
struct SandboxResult {
  int status = -1;  // the script's exit status; -1 when it did not exit
  std::string out;
  std::string err;
};

SandboxResult runInSandbox(const std::vector<std::string>& sandboxOptions, const std::string& script,
                           const std::string& input = {});

/// `word` quoted for a shell command line.
std::string quoted(const std::string& word);
