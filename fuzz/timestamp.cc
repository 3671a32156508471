// SPDX-License-Identifier: MIT
// Collection timestamps: every name the server gives reads back as its own
// key, and every name that reads as a key is spelled as the server would.
#include <algorithm>
#include <ctime>

#include "fuzz/support.h"
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
  const std::string base = vorn::server::formatTimestamp(in.ConsumeIntegralInRange<std::time_t>(0, kLastDay));
  for (unsigned long counter : {1ul, std::max(in.ConsumeIntegral<unsigned long>(), 1ul)}) {
    const vorn::server::TimestampKey key{base, counter};
    FUZZ_CHECK(vorn::server::parseTimestamp(spelled(key)) == key);
  }
  const std::string name = in.ConsumeRemainingBytesAsString();
  if (const auto parsed = vorn::server::parseTimestamp(name)) FUZZ_CHECK(spelled(*parsed) == name);
  return 0;
}
