// SPDX-License-Identifier: MIT
#pragma once

/// Device and build predicates over the telephony utility calls.
namespace config {
namespace hw {
/// True for the watch products 58-61, 69, 70 and 85-88.
bool watch();
}  // namespace hw
namespace build {
/// Asks about a carrier build only when the build is not internal.
bool internal_or_carrier();
}  // namespace build
}  // namespace config
