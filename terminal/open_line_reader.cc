// SPDX-License-Identifier: MIT
#include "terminal/open_line_reader.h"

#include <clocale>
#include <cstdio>
#include <cstdlib>

#include "terminal/edit_line_reader.h"
#include "terminal/history_file.h"

namespace terminal {

std::unique_ptr<LineReader> openLineReader(const Facts& facts, const std::string& programName) {
  if (!facts.inputIsTerminal) return std::make_unique<PlainLineReader>();

  EditLineReader::Options options;
  options.programName = programName;
  if (!facts.outputIsTerminal) {
    options.output = std::fopen("/dev/tty", "we");
    if (!options.output) return std::make_unique<PlainLineReader>();
    options.closeOutput = true;
  }
  options.history = historyLocation(std::getenv("VORNTOOL_HISTFILE"), std::getenv("XDG_STATE_HOME"),
                                    std::getenv("HOME"));
  // Multibyte input needs the user's character set. Set here, before the
  // session starts any other thread.
  std::setlocale(LC_CTYPE, "");  // NOLINT(concurrency-mt-unsafe): see above
  return std::make_unique<EditLineReader>(std::move(options));
}

}  // namespace terminal
