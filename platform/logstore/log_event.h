// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace logstore {

/// Event type of an entry that carries a message text; every other entry has
/// kEventTypeOther.
inline constexpr std::uint64_t kEventTypeLogMessage = 1024;
inline constexpr std::uint64_t kEventTypeOther = 0;

/// A text field that may be absent, which is not the same as empty. Clearing
/// keeps the buffer, so a reader that reuses one event per entry stops
/// allocating once the longest field has been seen.
class Text {
 public:
  bool has() const { return present_; }
  std::string_view view() const { return present_ ? std::string_view(value_) : std::string_view(); }
  void assign(std::string_view v) {
    value_.assign(v.data(), v.size());
    present_ = true;
  }
  void clear() {
    value_.clear();
    present_ = false;
  }

 private:
  std::string value_;
  bool present_ = false;
};

/// One entry of the log store as the export sees it. Handed to an event
/// handler by reference and valid only for the duration of that call.
struct Event {
  std::uint64_t type = kEventTypeOther;
  std::int64_t dateMicros = 0;  ///< since the Unix epoch, UTC
  /// Offset of the event's time zone from GMT at `dateMicros`, in seconds,
  /// negative west of Greenwich.
  std::int32_t secondsFromGMT = 0;
  std::uint64_t threadIdentifier = 0;
  std::uint64_t activityIdentifier = 0;
  std::int32_t processIdentifier = 0;
  Text process;
  Text sender;
  Text senderImagePath;
  Text subsystem;
  Text category;
  Text composedMessage;
};

/// Offset from GMT of the process's local zone (TZ, /etc/localtime) at
/// `unixSeconds`, aware of daylight saving time. A change of TZ is seen after
/// tzset().
std::int32_t localSecondsFromGMT(std::int64_t unixSeconds);

}  // namespace logstore
