// SPDX-License-Identifier: MIT
// trace.properties text: what is read is written back so that it reads the
// same, and a line added at the end wins.
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "fuzz/fuzz_check.h"
#include "platform/protocol/trace_properties.h"

using vorn::protocol::TraceProperties;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  const TraceProperties read = TraceProperties::parse(text);
  const std::string written = read.serialize();
  const TraceProperties reread = TraceProperties::parse(written);
  FUZZ_CHECK(reread.entries() == read.entries());
  FUZZ_CHECK(reread.serialize() == written);

  const TraceProperties amended = TraceProperties::parse(text + "\n\tBaseband.Mode = lite \r\n");
  FUZZ_CHECK(amended.get("Baseband", "Mode") == "lite");
  return 0;
}
