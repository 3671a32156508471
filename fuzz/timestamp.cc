// SPDX-License-Identifier: MIT
// Collection timestamps: every name the server gives reads back as its own
// key, and every name that reads as a key is spelled as the server would.
#include <fuzzer/FuzzedDataProvider.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <ctime>
#include <string>

#include "fuzz/fuzz_check.h"
#include "server/common/timestamp_naming.h"

namespace {

/// Zones east and west of Greenwich, with and without daylight saving time.
constexpr const char* kZones[] = {"UTC0", "CET-1CEST,M3.5.0,M10.5.0/3", "<+1345>-13:45<+1445>,M9.5.0/2:45,M4.1.0/3:45",
                                  "<-12>12", "NST3:30NDT,M3.2.0,M11.1.0"};
// 9999-12-30: a clock before the year 10000 in every zone above.
constexpr std::time_t kLastDay = 253402128000;

std::string spelled(const vorn::server::TimestampKey& key) {
  return key.counter == 1 ? key.base : key.base + "-" + std::to_string(key.counter);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  setenv("TZ", kZones[in.ConsumeIntegralInRange<std::size_t>(0, std::size(kZones) - 1)], /* overwrite= */ 1);
  tzset();
  const auto when = in.ConsumeIntegralInRange<std::time_t>(0, kLastDay);
  const auto counter = in.ConsumeIntegral<unsigned long>();

  const std::string base = vorn::server::formatTimestamp(when);
  const auto key = vorn::server::parseTimestamp(base);
  FUZZ_CHECK(key && key->base == base && key->counter == 1);
  if (counter >= 2) {
    const auto numbered = vorn::server::parseTimestamp(base + "-" + std::to_string(counter));
    FUZZ_CHECK(numbered && numbered->base == base && numbered->counter == counter);
  }

  const std::string name = in.ConsumeRemainingBytesAsString();
  if (const auto parsed = vorn::server::parseTimestamp(name)) FUZZ_CHECK(spelled(*parsed) == name);
  return 0;
}
