// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string>

/// What the platform reports about the device: the telephony utility calls
/// and the process table.
namespace platform {

enum class BuildKind { customer, internal, carrier };

/// The device facts behind the telephony utility calls. The Linux one reads
/// <root>/etc/vorn/device.conf and /proc; tests describe devices of their own.
class DeviceInfo {
 public:
  virtual ~DeviceInfo() = default;
  virtual int radio() = 0;
  virtual int product() = 0;
  virtual int vendor() = 0;
  virtual BuildKind build() = 0;
  virtual bool isProcessRunning(const std::string& name) = 0;
};

/// This machine, as the Linux platform sees it; the calls below ask it.
std::shared_ptr<DeviceInfo> linuxDevice();

}  // namespace platform

int TelephonyRadiosGetRadio();
int TelephonyRadiosGetProduct();
int TelephonyRadiosGetRadioVendor();
bool TelephonyUtilIsInternalBuild();
bool TelephonyUtilIsCarrierBuild();

namespace rilx {
/// True when a process whose name is exactly `processName` is running.
bool isProcessRunning(const std::string& processName);
}  // namespace rilx

/// The program's short name, as the shell started it.
const char* getprogname();
