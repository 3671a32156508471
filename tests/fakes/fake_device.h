// SPDX-License-Identifier: MIT
#pragma once

#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "platform/device.h"

/// A device described by the test, remembering which processes were asked for.
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
  bool isProcessRunning(const std::string& name) override {
    std::lock_guard lock(mutex_);
    asked_.push_back(name);
    return running.contains(name);
  }
  std::vector<std::string> asked() {
    std::lock_guard lock(mutex_);
    return asked_;
  }

 private:
  std::mutex mutex_;
  std::vector<std::string> asked_;
};

