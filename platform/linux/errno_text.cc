// SPDX-License-Identifier: MIT
#include "platform/linux/errno_text.h"

#include <string.h>

namespace vorn {

std::string errnoText(int err) {
  char buffer[256];
  // The GNU strerror_r returns the text, in `buffer` or in static storage.
  return strerror_r(err, buffer, sizeof buffer);
}

std::string errnoText(const std::string& what, int err) { return what + ": " + errnoText(err); }

}  // namespace vorn
