// SPDX-License-Identifier: MIT
#include "terminal/terminal_facts.h"

#include <unistd.h>

#include <cstdlib>
#include <string_view>

namespace terminal {

bool colourWanted(const char* noColor, const char* term) {
  if (noColor && *noColor) return false;
  return !dumbTerminal(term);
}

bool dumbTerminal(const char* term) { return term && std::string_view(term) == "dumb"; }

Facts probe() {
  Facts facts;
  facts.inputIsTerminal = isatty(STDIN_FILENO) == 1;
  facts.outputIsTerminal = isatty(STDOUT_FILENO) == 1;
  facts.errorIsTerminal = isatty(STDERR_FILENO) == 1;
  const char* term = std::getenv("TERM");
  facts.colour = colourWanted(std::getenv("NO_COLOR"), term);
  facts.dumb = dumbTerminal(term);
  return facts;
}

}  // namespace terminal
