// SPDX-License-Identifier: MIT
// trace.properties text: what is read is written back so that it reads the
// same, and a line added at the end wins.
#include "fuzz/support.h"
#include "platform/protocol/trace_properties.h"

using vorn::protocol::TraceProperties;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = fuzz::textOf(data, size);
  const std::string written = TraceProperties::parse(text).serialize();
  const TraceProperties reread = TraceProperties::parse(written);
  FUZZ_CHECK(reread.entries() == TraceProperties::parse(text).entries() && reread.serialize() == written);
  FUZZ_CHECK(TraceProperties::parse(text + "\n\tBaseband.Mode = lite \r\n").get("Baseband", "Mode") == "lite");
  return 0;
}
