// SPDX-License-Identifier: MIT
// Collection timestamps: every name the server gives reads back as its own
// key, in the order of the times, and every name that reads as a key is
// spelled as the server would.
#include <cstdlib>
#include <ctime>
#include <string>

#include "fuzz/support.h"
#include "server/common/timestamp_naming.h"

namespace {

/// Zones east and west of Greenwich, with and without daylight saving time.
constexpr const char* kZones[] = {"UTC0", "CET-1CEST,M3.5.0,M10.5.0/3", "<+1345>-13:45<+1445>,M9.5.0/2:45,M4.1.0/3:45",
                                  "<-12>12", "NST3:30NDT,M3.2.0,M11.1.0"};
// Beyond these localtime fails in every zone (its year is an int); a few
// draws past them check the name of a time it cannot show.
constexpr std::time_t kEarliest = -67768040609740800 - 86400;
constexpr std::time_t kLatest = 67768036191676799 + 86400;
// Two days: more than any zone's change of offset moves the local clock back.
constexpr std::time_t kTwoDays = 2 * 86400;

std::string spelled(const vorn::server::TimestampKey& key) {
  return key.counter == 1 ? key.base : key.base + "-" + std::to_string(key.counter);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using vorn::server::kEarliestTimestamp;
  FuzzedDataProvider in(data, size);
  setenv("TZ", kZones[in.ConsumeIntegralInRange<std::size_t>(0, std::size(kZones) - 1)], /* overwrite= */ 1);
  tzset();
  const auto when = in.ConsumeIntegralInRange<std::time_t>(kEarliest, kLatest);
  const auto later = when + in.ConsumeIntegralInRange<std::time_t>(kTwoDays, kLatest / 1024);
  const auto counter = in.ConsumeIntegral<unsigned long>();

  const std::string base = vorn::server::formatTimestamp(when);
  const auto key = vorn::server::parseTimestamp(base);
  FUZZ_CHECK(key && key->base == base && key->counter == 1);
  if (counter >= 2) {
    const auto numbered = vorn::server::parseTimestamp(base + "-" + std::to_string(counter));
    FUZZ_CHECK(numbered && numbered->base == base && numbered->counter == counter);
  }
  // Names order as the times they stand for, except where one is the
  // earliest name, which also stands for every time it cannot show.
  const std::string laterBase = vorn::server::formatTimestamp(later);
  const auto laterKey = vorn::server::parseTimestamp(laterBase);
  FUZZ_CHECK(laterKey);
  if (base != kEarliestTimestamp && laterBase != kEarliestTimestamp) FUZZ_CHECK(*key < *laterKey);

  const std::string name = in.ConsumeRemainingBytesAsString();
  if (const auto parsed = vorn::server::parseTimestamp(name)) FUZZ_CHECK(spelled(*parsed) == name);
  return 0;
}
