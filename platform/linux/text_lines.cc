// SPDX-License-Identifier: MIT
#include "platform/linux/text_lines.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "platform/linux/fd.h"

namespace vorn::bus {

std::string_view trim(std::string_view s) {
  const char* blanks = " \t\r\f\v";
  auto first = s.find_first_not_of(blanks);
  if (first == std::string_view::npos) return {};
  auto last = s.find_last_not_of(blanks);
  return s.substr(first, last - first + 1);
}

void forEachSetting(std::string_view text,
                    const std::function<void(std::string_view, std::string_view)>& setting) {
  while (!text.empty()) {
    auto end = text.find('\n');
    std::string_view line = text.substr(0, end);
    text = end == std::string_view::npos ? std::string_view() : text.substr(end + 1);
    if (auto hash = line.find('#'); hash != std::string_view::npos) line = line.substr(0, hash);
    auto eq = line.find('=');
    if (eq == std::string_view::npos) continue;
    auto key = trim(line.substr(0, eq));
    if (key.empty()) continue;
    setting(key, trim(line.substr(eq + 1)));
  }
}

std::string readSmallFile(const std::string& path, std::size_t limit) {
  Fd fd(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
  struct stat st {};
  if (!fd || ::fstat(fd.get(), &st) != 0 || !S_ISREG(st.st_mode)) return {};
  std::string text;
  char buffer[4096];
  while (text.size() < limit) {
    const ssize_t n = ::read(fd.get(), buffer, std::min(sizeof buffer, limit - text.size()));
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) break;
    text.append(buffer, std::size_t(n));
  }
  return text;
}

}  // namespace vorn::bus
