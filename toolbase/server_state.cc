// SPDX-License-Identifier: MIT
#include "toolbase/server_state.h"

std::atomic<bool> gServerRunning{false};

bool IsServerRunning() { return gServerRunning.load(); }
