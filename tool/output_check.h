// SPDX-License-Identifier: MIT
#pragma once

/// Standard output that cannot be lost without a word. Call
/// guardStandardOutput() first thing in main; every way out of the process
/// then takes its status from checkedExitStatus().
///
/// A descriptor 0, 1 or 2 that is closed at start is given /dev/null, read
/// only: otherwise the first file the tool opens (the bus socket) would take
/// its number and receive the output. Writing to it fails as writing to the
/// closed descriptor would, with EBADF. std::cout keeps writing through
/// stdio, byte for byte and flushed as before, but the error of its first
/// failed write is kept.
void guardStandardOutput();

/// `status`, or 1 instead of 0 when a write to standard output failed; the
/// failure is reported on standard error as "vorntool: write error: TEXT".
/// A refusal at start-up keeps its own status.
int checkedExitStatus(int status);
