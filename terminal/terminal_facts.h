// SPDX-License-Identifier: MIT
#pragma once

/// What the process learns about its terminal once, at the start of a
/// session: which standard streams are terminals and whether the user wants
/// colour. The line reader and anything else that draws on the terminal
/// (progress on standard error, say) decide from the same facts.
namespace terminal {

struct Facts {
  bool inputIsTerminal = false;
  bool outputIsTerminal = false;
  bool errorIsTerminal = false;
  bool colour = true;
  /// TERM is "dumb": the terminal cannot move its cursor or clear a line.
  bool dumb = false;
};

/// Colour stays on, also into pipes, unless NO_COLOR holds a non-empty value
/// or TERM is "dumb". Either argument may be null (variable not set).
bool colourWanted(const char* noColor, const char* term);

/// True when TERM (null: not set) names the dumb terminal.
bool dumbTerminal(const char* term);

/// The facts of this process's standard streams and environment.
Facts probe();

}  // namespace terminal
