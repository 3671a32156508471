// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <string_view>
#include <vector>

/// The system log at error level: the journal with priority LOG_ERR and the
/// identifier "vorntool".
namespace logstore {

/// Whether error-level messages are recorded; on Linux they always are.
bool systemLogErrorEnabled();
/// Records one error-level message. Safe from any thread.
void systemLogError(std::string_view message);

/// For tests: while one exists, messages are kept here instead of going to
/// the journal. Only one may exist at a time.
class SystemLogCapture {
 public:
  SystemLogCapture();
  ~SystemLogCapture();
  SystemLogCapture(const SystemLogCapture&) = delete;
  SystemLogCapture& operator=(const SystemLogCapture&) = delete;

  std::vector<std::string> messages() const;
};

}  // namespace logstore
