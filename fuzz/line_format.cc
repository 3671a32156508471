// SPDX-License-Identifier: MIT
// Journal entries into export lines: one valid UTF-8 line per entry, whatever
// bytes its fields hold.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>

#include "fuzz/code_points.h"
#include "fuzz/fuzz_check.h"
#include "oslog/line_formatter.h"

namespace {

logstore::Event eventFrom(FuzzedDataProvider& in) {
  logstore::Event e;
  e.type = logstore::kEventTypeLogMessage;
  e.dateMicros = in.ConsumeIntegral<std::int64_t>();
  e.secondsFromGMT = in.ConsumeIntegral<std::int32_t>();
  e.threadIdentifier = in.ConsumeIntegral<std::uint64_t>();
  e.activityIdentifier = in.ConsumeIntegral<std::uint64_t>();
  e.processIdentifier = in.ConsumeIntegral<std::int32_t>();
  for (logstore::Text* field : {&e.process, &e.sender, &e.senderImagePath, &e.subsystem, &e.category,
                                &e.composedMessage}) {
    if (in.ConsumeBool()) field->assign(in.ConsumeRandomLengthString(256));
  }
  return e;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  const logstore::Event first = eventFrom(in);
  const logstore::Event second = eventFrom(in);

  // One formatter for both, as the export uses it: what it keeps from one
  // line must not leak into the next.
  oslog::LineFormatter shared;
  for (const logstore::Event* e : {&first, &second}) {
    std::string line;
    shared.append(*e, line);
    std::string alone;
    oslog::LineFormatter().append(*e, alone);
    FUZZ_CHECK(line == alone);
    FUZZ_CHECK(fuzz::validUtf8(line));
    FUZZ_CHECK(!line.empty() && line.back() == '\n');
    FUZZ_CHECK(std::count(line.begin(), line.end(), '\n') == 1);
  }
  return 0;
}
