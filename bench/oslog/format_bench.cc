// SPDX-License-Identifier: MIT
#include <benchmark/benchmark.h>

#include "oslog/line_formatter.h"

namespace {

logstore::Event typicalEvent() {
  logstore::Event e;
  e.type = logstore::kEventTypeLogMessage;
  e.dateMicros = 1772719629000000;
  e.secondsFromGMT = 3600;
  e.threadIdentifier = 0x1f3;
  e.processIdentifier = 312;
  e.process.assign("Telhub");
  e.sender.assign("libZelmarIPC");
  e.subsystem.assign("org.vorn.radio");
  e.composedMessage.assign("Registration state changed: home, rat=5, cell=0x1a2b3c, état ok");
  return e;
}

void BM_FormatLine(benchmark::State& state) {
  auto event = typicalEvent();
  oslog::LineFormatter formatter;
  std::string out;
  for (auto _ : state) {
    out.clear();
    event.dateMicros += 1000;  // a new second now and then, as in a real log
    formatter.append(event, out);
    benchmark::DoNotOptimize(out.data());
  }
  state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_FormatLine);

}  // namespace

BENCHMARK_MAIN();
