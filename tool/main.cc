// SPDX-License-Identifier: MIT
#include <pthread.h>
#include <unistd.h>

#include <iostream>
#include <list>
#include <string>

#include "framework/command_shell.h"
#include "tool/startup.h"

int main(int argc, char** argv) {
  std::list<std::string> words = CommandShell::convertCmdArgsToList(argc, argv);
  if (!passesStartupChecks()) return -1;

  pthread_t worker;
  if (pthread_create(&worker, /* attr= */ nullptr, RunShellThread, &words) != 0) {
    std::cout << "Could not start the session thread." << std::endl;
    return -1;
  }
  // The main thread has nothing else to do; the worker ends the process.
  for (;;) pause();
}
