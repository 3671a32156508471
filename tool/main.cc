// SPDX-License-Identifier: MIT
#include <pthread.h>
#include <unistd.h>

#include <iostream>
#include <list>
#include <string>
#include <string_view>

#include "framework/command_shell.h"
#include "platform/vorn_version.h"
#include "tool/output_check.h"
#include "tool/startup.h"

int main(int argc, char** argv) {
  guardStandardOutput();
  // Answered before the start-up checks: a package manager or a person asks
  // it on machines where the tool itself would refuse to run.
  if (argc == 2 && std::string_view(argv[1]) == "--version") {
    std::cout << "vorntool " << kVornVersion << std::endl;
    return checkedExitStatus(0);
  }
  std::list<std::string> words = CommandShell::convertCmdArgsToList(argc, argv);
  if (!passesStartupChecks()) return checkedExitStatus(-1);

  pthread_t worker;
  if (pthread_create(&worker, /* attr= */ nullptr, RunShellThread, &words) != 0) {
    std::cout << "Could not start the session thread." << std::endl;
    return checkedExitStatus(-1);
  }
  // The main thread has nothing else to do; the worker ends the process.
  for (;;) pause();
}
