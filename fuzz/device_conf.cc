// SPDX-License-Identifier: MIT
// device.conf text, and the process names read from /proc.
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "fuzz/fuzz_check.h"
#include "platform/linux/device_conf.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  platform::parseDeviceConf(text);

  // Each line stands alone: whatever came before, lines added at the end win.
  const auto facts = platform::parseDeviceConf(text + "\n radio = 3\nproduct=-7 # note\nvendor=+12\nbuild=carrier\n");
  FUZZ_CHECK(facts.radio == 3);
  FUZZ_CHECK(facts.product == -7);
  FUZZ_CHECK(facts.vendor == 12);
  FUZZ_CHECK(facts.build == platform::BuildKind::carrier);

  // The same bytes as a process's comm, executable link and argv[0]: the name
  // is the comm, or a base name that the cut comm starts.
  const std::string_view all(text);
  const auto cut1 = all.find('\0');
  const std::string_view comm = all.substr(0, cut1);
  const std::string_view rest = cut1 == std::string_view::npos ? std::string_view() : all.substr(cut1 + 1);
  const auto cut2 = rest.find('\0');
  const std::string name = platform::processName(
      comm, rest.substr(0, cut2), cut2 == std::string_view::npos ? std::string_view() : rest.substr(cut2 + 1));
  FUZZ_CHECK(name == comm || (name.starts_with(comm) && name.find('/') == std::string::npos));
  return 0;
}
