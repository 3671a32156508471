// SPDX-License-Identifier: MIT
#include "framework/colour.h"

#include <atomic>

namespace colour {
namespace {
// Set once before the session starts; atomic because the setting is process-wide.
std::atomic<bool> gEnabled{true};

const char* unlessOff(const char* sequence) { return gEnabled.load() ? sequence : ""; }
}  // namespace

void setEnabled(bool enabled) { gEnabled = enabled; }
bool enabled() { return gEnabled; }

const char* red() { return unlessOff("\x1b[31m"); }
const char* green() { return unlessOff("\x1b[32m"); }
const char* defaultColour() { return unlessOff("\x1b[39m"); }

}  // namespace colour
