// SPDX-License-Identifier: MIT
// Runs one collection of vornd's collector on a platform root and reports
// its time and the process's peak memory: the collector without the bus,
// for bench/server/collect_compare.sh.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>

#include "server/common/collector.h"

namespace {

/// "VmHWM" and "RssAnon" of this process, in kB.
std::string memoryLine() {
  std::ifstream status("/proc/self/status");
  std::string line, out;
  while (std::getline(status, line)) {
    if (line.rfind("VmHWM:", 0) == 0 || line.rfind("RssAnon:", 0) == 0) out += line + "\n";
  }
  return out;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3 || std::strchr("012", argv[2][0]) == nullptr) {
    std::fprintf(stderr, "usage: %s ROOT COMPRESSION(0|1|2)\n", argv[0]);
    return 2;
  }
  vorn::server::Collector collector(argv[1]);
  vorn::server::CollectRequest request;
  request.compression = static_cast<vorn::server::Compression>(argv[2][0] - '0');
  request.reason = "benchmark";
  std::atomic<bool> cancel{false};
  const auto start = std::chrono::steady_clock::now();
  auto outcome = collector.collect(request, cancel);
  const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  if (!outcome.ok) {
    std::fprintf(stderr, "collection failed: %s\n", outcome.error.c_str());
    return 1;
  }
  std::printf("seconds %.3f\ntimestamp %s\n%s", seconds, outcome.timestamp.c_str(), memoryLine().c_str());
  return 0;
}
