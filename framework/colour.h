// SPDX-License-Identifier: MIT
#pragma once

/// The colour sequences that the help and the invalid-word report put around
/// the words they mark. They are written whether or not the output is a
/// terminal; the program turns them off only when the user asks for plain text.
namespace colour {

void setEnabled(bool enabled);
bool enabled();

/// ESC "[31m", ESC "[32m" and ESC "[39m", or "" while colour is off.
const char* red();
const char* green();
const char* defaultColour();

}  // namespace colour
