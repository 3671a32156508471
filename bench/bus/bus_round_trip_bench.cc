// SPDX-License-Identifier: MIT
// One synchronous PerformCommand round trip through the client library to
// vornd on a private bus; reports the median and the 99th percentile.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <optional>
#include <vector>

#include "platform/protocol/protocol.h"
#include "platform/vorn_client.h"
#include "tests/support/private_bus.h"

namespace {

using Clock = std::chrono::steady_clock;

std::shared_ptr<vorn::client::Manager> gManager;

void BM_PerformCommandRoundTrip(benchmark::State& state) {
  const auto request = xpc::object::dictionary(
      {{vorn::kKeyTraceName, xpc::object::string(vorn::kTraceSystemLogs)},
       {vorn::kKeyTracePropertyName, xpc::object::string(vorn::kKeyTraceMode)}});
  std::vector<double> micros;
  micros.reserve(100000);
  for (auto _ : state) {
    xpc::object response;
    auto start = Clock::now();
    auto result = vorn::client::PerformCommand(gManager, vorn::kCommandGetTraceProperty, request,
                                               response);
    micros.push_back(std::chrono::duration<double, std::micro>(Clock::now() - start).count());
    if (result.status != 0) {
      state.SkipWithError("the server did not answer with success");
      break;
    }
  }
  if (micros.empty()) return;
  std::sort(micros.begin(), micros.end());
  auto at = [&](double q) { return micros[std::size_t(q * double(micros.size() - 1))]; };
  state.counters["p50_us"] = at(0.50);
  state.counters["p99_us"] = at(0.99);
}
BENCHMARK(BM_PerformCommandRoundTrip)->MinTime(2.0)->UseRealTime();

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  const std::string vornd = std::string(VORN_SERVER_DIR) + "/vornd";
  if (!std::filesystem::exists(vornd)) {
    std::printf("skipped: %s is not built\n", vornd.c_str());
    return 0;
  }
  vorn::test::PrivateBus bus;
  if (!bus.ok()) {
    std::fprintf(stderr, "no private bus: %s\n", bus.error().c_str());
    return 1;
  }
  std::string root = bus.directory() + "/root";
  std::filesystem::create_directories(root + "/etc/vorn");
  std::ofstream(root + "/etc/vorn/device.conf") << "radio=1\n";
  vorn::test::ChildProcess daemon({{vornd, "--root", root}, {}, -1, "/dev/null"});
  if (!vorn::test::waitForBusName(vorn::protocol::kManagerBusName, std::chrono::seconds(10))) {
    std::fprintf(stderr, "vornd did not take its name\n");
    return 1;
  }
  gManager = vorn::client::CreateManager("vorn-bench", dispatch::queue("vorn.bench.queue"));
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  gManager.reset();
  return 0;
}
