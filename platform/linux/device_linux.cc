// SPDX-License-Identifier: MIT
// Device facts from <root>/etc/vorn/device.conf and the process table from
// /proc, behind the telephony utility calls.
#include <dirent.h>
#include <errno.h>
#include <unistd.h>

#include <cstring>

#include "platform/device.h"
#include "platform/linux/device_conf.h"
#include "platform/linux/text_lines.h"
#include "platform/protocol/protocol.h"

namespace platform {
namespace {

struct DirClose {
  void operator()(DIR* d) const { closedir(d); }
};
using DirPtr = std::unique_ptr<DIR, DirClose>;

bool hasWwanDevice() {
  DirPtr dir(opendir("/sys/class/wwan"));
  if (!dir) return false;
  while (dirent* e = readdir(dir.get()))
    if (std::strcmp(e->d_name, ".") != 0 && std::strcmp(e->d_name, "..") != 0) return true;
  return false;
}

std::string readLink(const std::string& path) {
  char buffer[4096];
  ssize_t n = readlink(path.c_str(), buffer, sizeof buffer);
  return n > 0 ? std::string(buffer, std::size_t(n)) : std::string();
}

class LinuxDevice final : public DeviceInfo {
 public:
  // The file is read on every call: it is tiny, and a test or an operator may
  // change it while the process runs.
  int radio() override {
    auto facts = read();
    return facts.radio ? *facts.radio : (hasWwanDevice() ? 1 : 0);
  }
  int product() override { return read().product; }
  int vendor() override { return read().vendor; }
  BuildKind build() override { return read().build; }

  bool isProcessRunning(const std::string& name) override {
    if (name.empty()) return false;
    DirPtr proc(opendir("/proc"));
    if (!proc) return false;
    while (dirent* e = readdir(proc.get())) {
      if (e->d_name[0] < '0' || e->d_name[0] > '9') continue;
      std::string base = std::string("/proc/") + e->d_name;
      std::string comm = vorn::bus::readSmallFile(base + "/comm", 64);
      if (!comm.empty() && comm.back() == '\n') comm.pop_back();
      if (comm.empty()) continue;  // gone meanwhile, or a kernel oddity
      // Only a name that could match is worth the extra reads below.
      if (comm.size() > name.size() || name.compare(0, comm.size(), comm) != 0) continue;
      std::string exe, argv0;
      if (comm.size() >= 15) {
        exe = readLink(base + "/exe");
        std::string cmdline = vorn::bus::readSmallFile(base + "/cmdline", 8192);
        argv0 = cmdline.substr(0, cmdline.find('\0'));
      }
      if (processName(comm, exe, argv0) == name) return true;
    }
    return false;
  }

 private:
  static DeviceFacts read() {
    using namespace vorn::protocol;
    return parseDeviceConf(
        vorn::bus::readSmallFile(underRoot(platformRoot(), kDeviceConfPath), 64 * 1024));
  }
};

}  // namespace

std::shared_ptr<DeviceInfo> linuxDevice() {
  static const std::shared_ptr<DeviceInfo> device = std::make_shared<LinuxDevice>();
  return device;
}

}  // namespace platform

int TelephonyRadiosGetRadio() { return platform::linuxDevice()->radio(); }
int TelephonyRadiosGetProduct() { return platform::linuxDevice()->product(); }
int TelephonyRadiosGetRadioVendor() { return platform::linuxDevice()->vendor(); }
bool TelephonyUtilIsInternalBuild() {
  return platform::linuxDevice()->build() == platform::BuildKind::internal;
}
bool TelephonyUtilIsCarrierBuild() {
  return platform::linuxDevice()->build() == platform::BuildKind::carrier;
}

namespace rilx {
bool isProcessRunning(const std::string& processName) {
  return platform::linuxDevice()->isProcessRunning(processName);
}
}  // namespace rilx

const char* getprogname() { return program_invocation_short_name; }
