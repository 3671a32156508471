// SPDX-License-Identifier: MIT
#include <ctime>

#include "platform/logstore/log_event.h"

namespace logstore {

std::int32_t localSecondsFromGMT(std::int64_t unixSeconds) {
  const auto t = static_cast<std::time_t>(unixSeconds);
  std::tm local{};
  if (localtime_r(&t, &local) == nullptr) return 0;
  return static_cast<std::int32_t>(local.tm_gmtoff);
}

}  // namespace logstore
