// SPDX-License-Identifier: MIT
// The oslog command alone, for timing the export against other readers:
//   oslog_export <history seconds> <output path> [-p <process>...] [-i <fragment>...]
// The store is the one VORN_ROOT names. Exit status 0 when the export succeeded.
#include <list>
#include <string>

#include "logdump/oslog_command.h"

int main(int argc, char** argv) {
  std::list<std::string> words;
  for (int i = argc - 1; i >= 1; --i) words.emplace_back(argv[i]);
  return logdump::runOsLogCommand(std::move(words)) ? 0 : 1;
}
