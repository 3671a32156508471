// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <mutex>
#include <string>

#include "platform/device.h"

/// The device as the tool sees it: the facts that the start-up checks and the
/// commands ask about, over the platform's device facts. The build kind and
/// the process table are asked afresh each time; the radio vendor's directory
/// suffixes are fixed when first asked for, each on its own.
class DeviceProfile {
 public:
  explicit DeviceProfile(std::shared_ptr<platform::DeviceInfo> device);
  DeviceProfile(const DeviceProfile&) = delete;
  DeviceProfile& operator=(const DeviceProfile&) = delete;

  /// The one of this process, over the Linux device.
  static std::shared_ptr<DeviceProfile> ofThisDevice();

  /// The radio kind; 0 means no radio.
  int radio() const;
  /// True for the watch products 58-61, 69, 70 and 85-88.
  bool watch() const;
  /// True on an internal or a carrier build.
  bool internalOrCarrier() const;
  bool isProcessRunning(const std::string& name) const;
  /// "-bb-trace" for radio vendor 2, else "-diag".
  std::string basebandTraceDirSuffix() const;
  /// "-coredump" for radio vendor 2, else "-cd".
  std::string coreDumpDirSuffix() const;

 private:
  struct FixedText {
    std::once_flag once;
    std::string text;
  };

  std::shared_ptr<platform::DeviceInfo> device_;
  mutable FixedText basebandSuffix_;
  mutable FixedText coreDumpSuffix_;
};
