// SPDX-License-Identifier: MIT
#include "tool/startup.h"

#include <cstdlib>
#include <iostream>
#include <list>
#include <memory>
#include <string>

#include "framework/colour.h"
#include "platform/device.h"
#include "terminal/open_line_reader.h"
#include "terminal/terminal_facts.h"
#include "terminal/terminal_progress.h"
#include "tool/output_check.h"
#include "tool/vorn_shell.h"

bool passesStartupChecks() { return passesStartupChecks(*DeviceProfile::ofThisDevice()); }

bool passesStartupChecks(const DeviceProfile& device) {
  if (device.radio() == 0) {
    std::cout << "'vorntool' is not supported on this product." << std::endl;
    return false;
  }
  if (!device.watch() && !device.isProcessRunning("Telhub") &&
      !device.isProcessRunning("modemd")) {
    std::cout << "Telhub process is not running. Please run/load Telhub (or modemd) and try again."
              << std::endl;
    return false;
  }
  return true;
}

void* RunShellThread(void* wordList) {
  const std::list<std::string> words = *static_cast<std::list<std::string>*>(wordList);
  // exit() does not unwind this stack: the shell, and with it the tree, the
  // connection and the queue, stay alive until the process is gone.
  const terminal::Facts facts = terminal::probe();
  colour::setEnabled(facts.colour);
  ToolContext context = ToolContext::onThisDevice({}, {});
  // The program's name alone: the session prompts for its commands.
  context.progress = terminal::openProgress(facts, /* prompting= */ words.size() <= 1);
  auto shell = std::make_shared<VornShell>(vorn::client::CreateManager, std::move(context));
  shell->setLineReader(terminal::openLineReader(facts, getprogname()));
  const bool ok = shell->run(words);
  // The worker ends the process while the main thread waits for ever; no
  // other thread runs static destructors, so exit's race cannot happen.
  std::exit(checkedExitStatus(ok ? 0 : 1));  // NOLINT(concurrency-mt-unsafe)
}
