// SPDX-License-Identifier: MIT
// Journal entries into export lines: one valid UTF-8 line per entry, whatever
// bytes its fields hold.
#include <algorithm>

#include "fuzz/support.h"
#include "oslog/line_formatter.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  // One formatter for two entries, as the export uses it: what it keeps from
  // one line must not leak into the next.
  oslog::LineFormatter shared;
  for (int i = 0; i < 2; ++i) {
    logstore::Event e;
    e.type = logstore::kEventTypeLogMessage;
    e.dateMicros = in.ConsumeIntegral<std::int64_t>();
    e.secondsFromGMT = in.ConsumeIntegral<std::int32_t>();
    e.threadIdentifier = in.ConsumeIntegral<std::uint64_t>();
    e.activityIdentifier = in.ConsumeIntegral<std::uint64_t>();
    e.processIdentifier = in.ConsumeIntegral<std::int32_t>();
    for (logstore::Text* field : {&e.process, &e.sender, &e.senderImagePath, &e.subsystem, &e.category,
                                  &e.composedMessage})
      if (in.ConsumeBool()) field->assign(in.ConsumeRandomLengthString(256));
    std::string line, alone;
    shared.append(e, line);
    oslog::LineFormatter().append(e, alone);
    FUZZ_CHECK(line == alone && fuzz::validUtf8(line));
    FUZZ_CHECK(std::count(line.begin(), line.end(), '\n') == 1 && line.back() == '\n');
  }
  return 0;
}
