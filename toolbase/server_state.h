// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>

/// Whether the last server-state event reported that the server has started.
/// Written on the tool's queue, read on the worker thread.
extern std::atomic<bool> gServerRunning;

bool IsServerRunning();
