// SPDX-License-Identifier: MIT
#pragma once

#include <set>
#include <string>

#include "platform/device.h"

/// A device described by the test.
class FakeDevice : public platform::DeviceInfo {
 public:
  int radioKind = 1;
  int productCode = 0;
  int vendorCode = 2;
  platform::BuildKind buildKind = platform::BuildKind::customer;
  std::set<std::string> running;

  int radio() override { return radioKind; }
  int product() override { return productCode; }
  int vendor() override { return vendorCode; }
  platform::BuildKind build() override { return buildKind; }
  bool isProcessRunning(const std::string& name) override { return running.contains(name); }
};
