// SPDX-License-Identifier: MIT
#pragma once

#include "toolbase/device_profile.h"

/// The checks before the session: a radio, and Telhub or modemd running
/// unless the device is a watch. Prints why it refuses.
bool passesStartupChecks(const DeviceProfile& device);
/// The same on this machine.
bool passesStartupChecks();

/// The worker thread: runs the session over the word list at `wordList` and
/// ends the process with its outcome. Never returns.
[[noreturn]] void* RunShellThread(void* wordList);
