// SPDX-License-Identifier: MIT
#include "platform/protocol/protocol.h"

#include <cstdlib>

namespace vorn {

namespace {
// The vendor whose collections carry the long suffixes.
constexpr int kVendorWithLongSuffixes = 2;
}  // namespace

std::string protocol::underRoot(std::string_view root, std::string_view devicePath) {
  while (!root.empty() && root.back() == '/') root.remove_suffix(1);
  std::string path(root);
  path += devicePath;
  return path;
}

std::string protocol::platformRoot() {
  const char* root = std::getenv("VORN_ROOT");
  return root != nullptr && *root != '\0' ? root : "/";
}

std::string trace::basebandTraceDirSuffix(int vendor) {
  return vendor == kVendorWithLongSuffixes ? "-bb-trace" : "-diag";
}

std::string trace::coreDumpDirSuffix(int vendor) {
  return vendor == kVendorWithLongSuffixes ? "-coredump" : "-cd";
}

}  // namespace vorn
