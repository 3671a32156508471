// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string_view>

#include "framework/command_base.h"
#include "framework/line_reader.h"

/// The words that the shell would accept at the end of `beforeCursor`, typed
/// at the prompt of `start`. The words before the cursor are resolved as the
/// shell resolves a group (sub-commands descend, a handler takes the rest as
/// its arguments, "cd" takes one path); only the group after the last "--"
/// counts. `isAllowed` is not asked, since completing must not print or
/// depend on the server's state.
Completions completeLine(const std::shared_ptr<CommandBase>& start, std::string_view beforeCursor);
