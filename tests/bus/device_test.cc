// SPDX-License-Identifier: MIT
// device.conf, trace.properties and process names: the parsers alone, then
// the Linux device against a temporary root and real processes.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <thread>

#include "platform/device.h"
#include "platform/linux/device_conf.h"
#include "platform/linux/trace_properties.h"
#include "tests/support/private_bus.h"

namespace {

namespace fs = std::filesystem;
using platform::BuildKind;
using platform::DeviceFacts;

TEST(DeviceConf, ParsesSettingsAndIgnoresTheRest) {
  struct Case {
    const char* what;
    const char* text;
    std::optional<int> radio;
    int product, vendor;
    BuildKind build;
  } cases[] = {
      {"empty file", "", std::nullopt, 0, 0, BuildKind::customer},
      {"all keys", "radio=2\nproduct=7\nvendor=3\nbuild=internal\n", 2, 7, 3, BuildKind::internal},
      {"blanks and comments", "  # device\n\n radio = 0 # none\n\tbuild\t=\tcarrier \n", 0, 0, 0,
       BuildKind::carrier},
      {"junk lines", "radio\n=5\nthis is junk\nproduct=9\n", std::nullopt, 9, 0, BuildKind::customer},
      {"not numbers", "radio=one\nproduct=12abc\nvendor=\nbuild=Internal\n", std::nullopt, 0, 0,
       BuildKind::customer},
      {"unknown keys", "colour=blue\nvendor=4\n", std::nullopt, 0, 4, BuildKind::customer},
      {"signs and last wins", "product=-3\nvendor=+8\nradio=1\nradio=5\n", 5, -3, 8,
       BuildKind::customer},
      {"CRLF lines", "radio=1\r\nbuild=carrier\r\n", 1, 0, 0, BuildKind::carrier},
      {"out of range", "product=99999999999999999999\n", std::nullopt, 0, 0, BuildKind::customer},
  };
  for (const auto& c : cases) {
    DeviceFacts f = platform::parseDeviceConf(c.text);
    EXPECT_EQ(f.radio, c.radio) << c.what;
    EXPECT_EQ(f.product, c.product) << c.what;
    EXPECT_EQ(f.vendor, c.vendor) << c.what;
    EXPECT_EQ(f.build, c.build) << c.what;
  }
}

TEST(TraceProperties, FindsTraceDotPropertyLines) {
  const char* text =
      "# written by the server\n"
      "Baseband.Enabled=1\n"
      "SystemLogs.Mode = 3\n"
      "junk\n"
      "NoDot=4\n"
      "Baseband.Path=/var/a=b\n";
  struct Case {
    const char* trace;
    const char* property;
    std::optional<std::string> value;
  } cases[] = {
      {"Baseband", "Enabled", "1"},
      {"SystemLogs", "Mode", "3"},
      {"Baseband", "Path", "/var/a=b"},
      {"baseband", "Enabled", std::nullopt},
      {"Baseband", "Mode", std::nullopt},
      {"NoDot", "", std::nullopt},
      {"", "", std::nullopt},
  };
  for (const auto& c : cases)
    EXPECT_EQ(vorn::bus::findTraceProperty(text, c.trace, c.property), c.value)
        << c.trace << "." << c.property;
  EXPECT_EQ(vorn::bus::tracePropertiesPath("/"), "/var/lib/vorn/trace.properties");
  EXPECT_EQ(vorn::bus::tracePropertiesPath("/tmp/r/"), "/tmp/r/var/lib/vorn/trace.properties");
}

TEST(ProcessName, UsesTheFullNameOnlyWhenCommWasCut) {
  struct Case {
    const char* comm;
    const char* exe;
    const char* argv0;
    const char* name;
  } cases[] = {
      {"Telhub", "/usr/bin/Telhub", "Telhub", "Telhub"},
      {"Telhub", "/usr/bin/other", "", "Telhub"},
      {"TelhubMobileHel", "/opt/TelhubMobileHelperX", "", "TelhubMobileHelperX"},
      {"TelhubMobileHel", "/opt/TelhubMobileHelperX (deleted)", "", "TelhubMobileHelperX"},
      // A symlink: the executable is the target, argv[0] the link's name.
      {"TelhubMobileHel", "/usr/bin/sleep", "/tmp/x/TelhubMobileHelperX", "TelhubMobileHelperX"},
      {"TelhubMobileHel", "", "TelhubMobileHelperX", "TelhubMobileHelperX"},
      {"TelhubMobileHel", "/usr/bin/python3", "python3", "TelhubMobileHel"},
      {"fifteen-bytes-x", "/bin/fifteen-bytes-x", "", "fifteen-bytes-x"},
  };
  for (const auto& c : cases) EXPECT_EQ(platform::processName(c.comm, c.exe, c.argv0), c.name) << c.comm;
}

/// A temporary platform root exported as VORN_ROOT for one test.
class LinuxDevice : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/vorn-root-XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    root_ = pattern;
    setenv("VORN_ROOT", root_.c_str(), 1);
    platform::SetDeviceInfo(nullptr);
  }
  void TearDown() override {
    unsetenv("VORN_ROOT");
    fs::remove_all(root_);
  }
  void writeConf(const std::string& text) {
    fs::create_directories(root_ + "/etc/vorn");
    std::ofstream(root_ + "/etc/vorn/device.conf") << text;
  }
  std::string root_;
};

TEST_F(LinuxDevice, ReadsDeviceConfOnEachCall) {
  // Missing file: defaults, radio from the WWAN class of this machine.
  bool wwan = fs::exists("/sys/class/wwan") && !fs::is_empty("/sys/class/wwan");
  EXPECT_EQ(TelephonyRadiosGetRadio(), wwan ? 1 : 0);
  EXPECT_EQ(TelephonyRadiosGetProduct(), 0);
  EXPECT_FALSE(TelephonyUtilIsInternalBuild());
  EXPECT_FALSE(TelephonyUtilIsCarrierBuild());

  writeConf("radio=3\nproduct=12\nvendor=2\nbuild=carrier\n");
  EXPECT_EQ(TelephonyRadiosGetRadio(), 3);
  EXPECT_EQ(TelephonyRadiosGetProduct(), 12);
  EXPECT_EQ(TelephonyRadiosGetRadioVendor(), 2);
  EXPECT_TRUE(TelephonyUtilIsCarrierBuild());
  EXPECT_FALSE(TelephonyUtilIsInternalBuild());

  writeConf("build=internal\n");
  EXPECT_TRUE(TelephonyUtilIsInternalBuild());
  EXPECT_EQ(TelephonyRadiosGetRadioVendor(), 0);
}

TEST_F(LinuxDevice, AnInstalledFakeAnswersUntilRemoved) {
  struct Fake : platform::DeviceInfo {
    int radio() override { return 42; }
    int product() override { return 43; }
    int vendor() override { return 44; }
    platform::BuildKind build() override { return platform::BuildKind::internal; }
    bool isProcessRunning(const std::string& name) override { return name == "ghost"; }
  };
  writeConf("radio=0\n");
  platform::SetDeviceInfo(std::make_shared<Fake>());
  EXPECT_EQ(TelephonyRadiosGetRadio(), 42);
  EXPECT_EQ(TelephonyRadiosGetRadioVendor(), 44);
  EXPECT_TRUE(rilx::isProcessRunning("ghost"));
  platform::SetDeviceInfo(nullptr);
  EXPECT_EQ(TelephonyRadiosGetRadio(), 0);
  EXPECT_FALSE(rilx::isProcessRunning("ghost"));
}

TEST_F(LinuxDevice, FindsLongProcessNamesWholeButNotTheirPrefix) {
  const std::string longName = "TelhubMobileHelperX";  // longer than comm's 15 bytes
  struct Case {
    const char* how;
    bool symlink;
  } cases[] = {{"copy of sleep", false}, {"symlink to sleep", true}};
  for (const auto& c : cases) {
    std::string dir = root_ + (c.symlink ? "/link" : "/copy");
    fs::create_directories(dir);
    std::string path = dir + "/" + longName;
    if (c.symlink)
      fs::create_symlink("/bin/sleep", path);
    else
      fs::copy_file("/bin/sleep", path);
    vorn::test::ChildProcess child({{path, "30"}, {}, -1, ""});
    ASSERT_TRUE(child.running()) << c.how;
    // exec may not have happened yet: wait for it, with a deadline.
    auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(5);
    while (!rilx::isProcessRunning(longName) && std::chrono::steady_clock::now() < deadline)
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    EXPECT_TRUE(rilx::isProcessRunning(longName)) << c.how;
    EXPECT_FALSE(rilx::isProcessRunning(longName.substr(0, 15))) << c.how;
    EXPECT_FALSE(rilx::isProcessRunning("telhubmobilehelperx")) << c.how;
    EXPECT_FALSE(rilx::isProcessRunning(longName + "Y")) << c.how;
    child.kill();
    EXPECT_FALSE(rilx::isProcessRunning(longName)) << c.how;
  }
}

TEST(ProcessTable, FindsShortNamesExactly) {
  // This very process: its comm is the test binary's name, cut to 15 bytes.
  std::string self = program_invocation_short_name;
  EXPECT_TRUE(rilx::isProcessRunning(self));
  EXPECT_STREQ(getprogname(), self.c_str());
  EXPECT_FALSE(rilx::isProcessRunning(""));
  EXPECT_FALSE(rilx::isProcessRunning(self.substr(0, 3)));
}

}  // namespace
