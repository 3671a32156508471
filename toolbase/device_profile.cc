// SPDX-License-Identifier: MIT
#include "toolbase/device_profile.h"

#include <cstdint>

#include "platform/protocol/protocol.h"

DeviceProfile::DeviceProfile(std::shared_ptr<platform::DeviceInfo> device)
    : device_(std::move(device)) {}

std::shared_ptr<DeviceProfile> DeviceProfile::ofThisDevice() {
  static const auto profile = std::make_shared<DeviceProfile>(platform::linuxDevice());
  return profile;
}

int DeviceProfile::radio() const { return device_->radio(); }

bool DeviceProfile::watch() const {
  // Bit n stands for product 58 + n; the unsigned offset puts every code
  // below 58 far out of range.
  constexpr std::uint32_t kWatchProducts = 0x7800180F;
  const std::uint32_t offset = static_cast<std::uint32_t>(device_->product()) - 58u;
  return offset <= 30 && ((kWatchProducts >> offset) & 1u) != 0;
}

bool DeviceProfile::internalOrCarrier() const {
  const platform::BuildKind build = device_->build();
  return build == platform::BuildKind::internal || build == platform::BuildKind::carrier;
}

bool DeviceProfile::isProcessRunning(const std::string& name) const {
  return device_->isProcessRunning(name);
}

std::string DeviceProfile::basebandTraceDirSuffix() const {
  std::call_once(basebandSuffix_.once, [this] {
    basebandSuffix_.text = vorn::trace::basebandTraceDirSuffix(device_->vendor());
  });
  return basebandSuffix_.text;
}

std::string DeviceProfile::coreDumpDirSuffix() const {
  std::call_once(coreDumpSuffix_.once, [this] {
    coreDumpSuffix_.text = vorn::trace::coreDumpDirSuffix(device_->vendor());
  });
  return coreDumpSuffix_.text;
}
