// SPDX-License-Identifier: MIT
#pragma once

/// Device and build predicates of the device this process runs on
/// (DeviceProfile::ofThisDevice).
namespace config {
namespace hw {
/// True for the watch products 58-61, 69, 70 and 85-88.
bool watch();
}  // namespace hw
namespace build {
/// True on an internal or a carrier build.
bool internal_or_carrier();
}  // namespace build
}  // namespace config
