// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <string>

#include "framework/line_reader.h"
#include "terminal/terminal_facts.h"

namespace terminal {

/// The editing reader when standard input is a terminal, the plain one
/// otherwise (pipes and files keep their exact bytes). When only the input is
/// a terminal, the prompt and the editing go to the controlling terminal, so
/// that standard output carries nothing but the commands' output.
std::unique_ptr<LineReader> openLineReader(const Facts& facts, const std::string& programName);

}  // namespace terminal
