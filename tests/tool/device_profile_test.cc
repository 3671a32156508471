// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "../fakes/fake_device.h"
#include "toolbase/device_profile.h"

namespace {

TEST(DeviceProfile, WatchProductsAreExactlyTheListedCodes) {
  const std::set<int> watches{58, 59, 60, 61, 69, 70, 85, 86, 87, 88};
  auto device = std::make_shared<FakeDevice>();
  const DeviceProfile profile(device);
  for (int product : {-1, 0, 1, 57, 58, 59, 60, 61, 62, 68, 69, 70, 71, 84, 85, 88, 89, 90, 1000,
                      58 + 32, 58 + 64, INT32_MIN, INT32_MAX}) {
    device->productCode = product;
    EXPECT_EQ(profile.watch(), watches.contains(product)) << product;
  }
}

TEST(DeviceProfile, EachSuffixKeepsTheVendorItSawFirst) {
  struct Case {
    int vendor;
    const char* baseband;
    const char* coreDump;
  };
  const Case cases[] = {{2, "-bb-trace", "-coredump"}, {0, "-diag", "-cd"}, {1, "-diag", "-cd"}, {3, "-diag", "-cd"}};
  for (const auto& first : cases) {
    const Case& later = first.vendor == 2 ? cases[1] : cases[0];
    auto device = std::make_shared<FakeDevice>();
    device->vendorCode = first.vendor;
    const DeviceProfile profile(device);
    EXPECT_EQ(profile.basebandTraceDirSuffix(), first.baseband) << first.vendor;
    device->vendorCode = later.vendor;
    EXPECT_EQ(profile.basebandTraceDirSuffix(), first.baseband) << first.vendor;
    // The core-dump suffix is fixed on its own first use, which comes now.
    EXPECT_EQ(profile.coreDumpDirSuffix(), later.coreDump) << first.vendor;
    device->vendorCode = first.vendor;
    EXPECT_EQ(profile.coreDumpDirSuffix(), later.coreDump) << first.vendor;
  }
}

}  // namespace
