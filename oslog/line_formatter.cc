// SPDX-License-Identifier: MIT
#include "oslog/line_formatter.h"

#include <cstdio>
#include <cstring>

namespace oslog {
namespace {

constexpr std::string_view kNull = "(null)";
constexpr std::string_view kReplacement = "\xEF\xBF\xBD";

/// Days since 1970-01-01 to a proleptic Gregorian date (H. Hinnant's
/// civil_from_days), valid for the whole int64 range used here.
void civilFromDays(std::int64_t z, std::int64_t& y, unsigned& m, unsigned& d) {
  z += 719468;
  const std::int64_t era = (z >= 0 ? z : z - 146096) / 146097;
  const auto doe = static_cast<unsigned>(z - era * 146097);
  const unsigned yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const unsigned doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const unsigned mp = (5 * doy + 2) / 153;
  d = doy - (153 * mp + 2) / 5 + 1;
  m = mp < 10 ? mp + 3 : mp - 9;
  y = static_cast<std::int64_t>(yoe) + era * 400 + (m <= 2);
}

void appendHex(std::uint64_t value, int minDigits, std::string& out) {
  char digits[16];
  int n = 0;
  do {
    digits[n++] = "0123456789abcdef"[value & 0xF];
    value >>= 4;
  } while (value != 0);
  out.append("0x");
  for (int pad = minDigits - n; pad > 0; --pad) out.push_back('0');
  while (n > 0) out.push_back(digits[--n]);
}

void appendDecimal(std::int32_t value, std::string& out) {
  char digits[12];
  int n = 0;
  auto magnitude = static_cast<std::uint32_t>(value);
  if (value < 0) {
    out.push_back('-');
    magnitude = 0u - magnitude;
  }
  do {
    digits[n++] = static_cast<char>('0' + magnitude % 10);
    magnitude /= 10;
  } while (magnitude != 0);
  while (n > 0) out.push_back(digits[--n]);
}

void appendField(const logstore::Text& field, std::string& out) {
  if (!field.has()) {
    out.append(kNull);
    return;
  }
  // One line per entry: a line break inside a field (a multi-line message)
  // is written as the two characters "\n". A newline byte never lies inside
  // a UTF-8 sequence, so the pieces are checked alike.
  std::string_view text = field.view();
  for (auto end = text.find('\n'); end != std::string_view::npos; end = text.find('\n')) {
    appendUtf8(text.substr(0, end), out);
    out.append("\\n");
    text.remove_prefix(end + 1);
  }
  appendUtf8(text, out);
}

/// Length of the well-formed UTF-8 sequence at `s[i]`, or 0.
std::size_t sequenceLength(std::string_view s, std::size_t i) {
  const auto b0 = static_cast<unsigned char>(s[i]);
  auto cont = [&](std::size_t k, unsigned char lo = 0x80, unsigned char hi = 0xBF) {
    if (i + k >= s.size()) return false;
    const auto b = static_cast<unsigned char>(s[i + k]);
    return b >= lo && b <= hi;
  };
  // The second byte's range rules out overlong forms, surrogates and values
  // past U+10FFFF.
  if (b0 >= 0xC2 && b0 <= 0xDF) return cont(1) ? 2 : 0;
  if (b0 == 0xE0) return cont(1, 0xA0) && cont(2) ? 3 : 0;
  if ((b0 >= 0xE1 && b0 <= 0xEC) || b0 == 0xEE || b0 == 0xEF) return cont(1) && cont(2) ? 3 : 0;
  if (b0 == 0xED) return cont(1, 0x80, 0x9F) && cont(2) ? 3 : 0;
  if (b0 == 0xF0) return cont(1, 0x90) && cont(2) && cont(3) ? 4 : 0;
  if (b0 >= 0xF1 && b0 <= 0xF3) return cont(1) && cont(2) && cont(3) ? 4 : 0;
  if (b0 == 0xF4) return cont(1, 0x80, 0x8F) && cont(2) && cont(3) ? 4 : 0;
  return 0;
}

}  // namespace

void appendUtf8(std::string_view text, std::string& out) {
  std::size_t i = 0;
  while (i < text.size()) {
    std::size_t run = i;
    while (run < text.size() && static_cast<unsigned char>(text[run]) < 0x80) ++run;
    out.append(text.data() + i, run - i);
    i = run;
    while (i < text.size() && static_cast<unsigned char>(text[i]) >= 0x80) {
      if (std::size_t n = sequenceLength(text, i); n != 0) {
        out.append(text.data() + i, n);
        i += n;
      } else {
        out.append(kReplacement);
        ++i;
      }
    }
  }
}

std::size_t formatDate(std::int64_t unixSeconds, char* buffer) {
  std::int64_t days = unixSeconds / 86400;
  std::int64_t rest = unixSeconds % 86400;
  if (rest < 0) {
    rest += 86400;
    --days;
  }
  std::int64_t year;
  unsigned month, day;
  civilFromDays(days, year, month, day);
  const int n = std::snprintf(buffer, 32, "%04lld-%02u-%02u %02d:%02d:%02d +0000", static_cast<long long>(year),
                              month, day, static_cast<int>(rest / 3600), static_cast<int>(rest / 60 % 60),
                              static_cast<int>(rest % 60));
  return n > 0 ? static_cast<std::size_t>(n) : 0;
}

void LineFormatter::append(const logstore::Event& event, std::string& out) {
  // Whole seconds, rounded toward the past, then moved to local wall-clock time.
  std::int64_t second = event.dateMicros / 1000000;
  if (event.dateMicros % 1000000 < 0) --second;
  second += event.secondsFromGMT;
  if (second != cachedSecond_) {
    cachedSecond_ = second;
    cachedDateLength_ = formatDate(second, cachedDate_);
  }
  out.append(cachedDate_, cachedDateLength_);
  out.push_back(' ');
  appendHex(event.threadIdentifier, 5, out);
  out.push_back(' ');
  appendHex(event.activityIdentifier, 1, out);
  out.push_back(' ');
  appendDecimal(event.processIdentifier, out);
  out.push_back(' ');
  appendField(event.process, out);
  out.push_back('(');
  appendField(event.sender, out);
  out.append("):");
  appendField(event.subsystem, out);
  out.append(" [");
  appendField(event.category, out);
  out.append("] ");
  appendField(event.composedMessage, out);
  out.push_back('\n');
}

}  // namespace oslog
