// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "../fakes/fake_device.h"
#include "../framework/stdio_capture.h"
#include "tool/startup.h"

namespace {

TEST(Startup, ChecksRadioThenDaemons) {
  const std::string noRadio = "'vorntool' is not supported on this product.\n";
  const std::string noDaemon =
      "Telhub process is not running. Please run/load Telhub (or modemd) and try again.\n";
  struct Case {
    const char* what;
    int radio;
    int product;
    std::set<std::string> running;
    std::string out;  // none: the checks pass
  };
  const Case cases[] = {
      {"no radio", 0, 0, {"Telhub"}, noRadio},
      {"no radio on a watch", 0, 58, {}, noRadio},
      {"Telhub running", 1, 0, {"Telhub"}, ""},
      {"only modemd", 1, 0, {"modemd"}, ""},
      {"neither daemon", 1, 0, {"telhub", "Telhub2"}, noDaemon},
      {"watch needs no daemon", 1, 88, {}, ""},
      {"any non-zero radio", -3, 57, {}, noDaemon},
  };
  for (const auto& c : cases) {
    auto device = std::make_shared<FakeDevice>();
    device->radioKind = c.radio;
    device->productCode = c.product;
    device->running = c.running;
    StdioCapture io;
    EXPECT_EQ(passesStartupChecks(DeviceProfile(device)), c.out.empty()) << c.what;
    EXPECT_EQ(io.out(), c.out) << c.what;
    EXPECT_EQ(io.err(), "") << c.what;
  }
}

}  // namespace
