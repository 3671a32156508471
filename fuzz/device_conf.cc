// SPDX-License-Identifier: MIT
// device.conf text, and the process names read from /proc.
#include "fuzz/support.h"
#include "platform/linux/device_conf.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = fuzz::textOf(data, size);
  // Each line stands alone: whatever came before, lines added at the end win.
  const auto facts = platform::parseDeviceConf(text + "\n radio = 3\nproduct=-7 # note\nvendor=+12\nbuild=carrier\n");
  FUZZ_CHECK(facts.radio == 3 && facts.product == -7 && facts.vendor == 12);
  FUZZ_CHECK(facts.build == platform::BuildKind::carrier);

  // The same bytes as a process's comm, executable link and argv[0]: the name
  // is the comm, or a base name that the cut comm starts.
  auto words = fuzz::wordsOf(text);
  words.resize(std::max<std::size_t>(words.size(), 3));
  const std::string name = platform::processName(words[0], words[1], words[2]);
  FUZZ_CHECK(name == words[0] || (name.starts_with(words[0]) && name.find('/') == std::string::npos));
  return 0;
}
