// SPDX-License-Identifier: MIT
// The Linux device against a temporary root (device.conf) and real processes.
#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <optional>
#include <thread>

#include "platform/device.h"
#include "tests/support/private_bus.h"

namespace {

namespace fs = std::filesystem;

/// A temporary platform root exported as VORN_ROOT for one test.
class LinuxDevice : public ::testing::Test {
 protected:
  void SetUp() override { setenv("VORN_ROOT", root_.c_str(), 1); }
  void TearDown() override { fs::remove_all(root_); }
  const std::string root_ = ::testing::TempDir() + "vorn-root-" + std::to_string(getpid());
};

TEST_F(LinuxDevice, ReadsDeviceConfOnEachCall) {
  // Without a radio setting the radio comes from this machine's WWAN class.
  const int wwan = fs::exists("/sys/class/wwan") && !fs::is_empty("/sys/class/wwan") ? 1 : 0;
  struct Case {
    const char *what, *conf;  // no file when `conf` is null
    std::optional<int> radio;
    int product, vendor;
    bool internal, carrier;
  } const cases[] = {
      {"missing file", nullptr, std::nullopt, 0, 0, false, false},
      {"all keys", "radio=3\nproduct=12\nvendor=2\nbuild=carrier\n", 3, 12, 2, false, true},
      {"missing keys", "build=internal\n", std::nullopt, 0, 0, true, false},
      {"comments and blanks", "  # device\n\n radio = 0 # none\n\tvendor\t=\t5 \r\n", 0, 0, 5, false, false},
      {"junk", "radio\n=5\njunk\nproduct=12abc\nvendor=\nbuild=Internal\ncolour=blue\nproduct=9\n",
       std::nullopt, 9, 0, false, false},
      {"out of range", "product=99999999999999999999\nradio=1\nradio=-4\n", -4, 0, 0, false, false},
  };
  for (const auto& c : cases) {
    fs::create_directories(root_ + "/etc/vorn");
    fs::remove(root_ + "/etc/vorn/device.conf");
    if (c.conf) std::ofstream(root_ + "/etc/vorn/device.conf") << c.conf;
    EXPECT_EQ(TelephonyRadiosGetRadio(), c.radio.value_or(wwan)) << c.what;
    EXPECT_EQ(TelephonyRadiosGetProduct(), c.product) << c.what;
    EXPECT_EQ(TelephonyRadiosGetRadioVendor(), c.vendor) << c.what;
    EXPECT_EQ(TelephonyUtilIsInternalBuild(), c.internal) << c.what;
    EXPECT_EQ(TelephonyUtilIsCarrierBuild(), c.carrier) << c.what;
  }
}

TEST_F(LinuxDevice, FindsLongProcessNamesWholeButNotNearMisses) {
  const std::string longName = "TelhubMobileHelperX";  // longer than comm's 15 bytes
  for (bool symlink : {false, true}) {
    fs::path path = fs::path(root_) / (symlink ? "link" : "copy") / longName;
    fs::create_directories(path.parent_path());
    if (symlink) fs::create_symlink("/bin/sleep", path);
    else fs::copy_file("/bin/sleep", path);
    vorn::test::ChildProcess child({{path.string(), "30"}, {}, -1, ""});
    // exec may not have happened yet: wait for it, with a deadline.
    for (int i = 0; i < 1000 && !rilx::isProcessRunning(longName); ++i)
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    EXPECT_TRUE(rilx::isProcessRunning(longName)) << path;
    for (const std::string& miss : {longName.substr(0, 15), std::string("telhubmobilehelperx"),
                                    longName + "Y", std::string("")})
      EXPECT_FALSE(rilx::isProcessRunning(miss)) << path << " found " << miss;
    child.kill();
    EXPECT_FALSE(rilx::isProcessRunning(longName)) << path;
  }
}

}  // namespace
