// SPDX-License-Identifier: MIT
// vorn-helper: the reference helper service. Owns org.vorn.Helper and reports
// the newest baseband snapshot under its platform root.
#include <signal.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "server/common/daemon_loop.h"
#include "server/common/daemon_options.h"
#include "server/helper/helper_service.h"

int main(int argc, char** argv) {
  using namespace vorn::server;
  HelperOptions options;
  std::string text;
  switch (parseHelperOptions(std::vector<std::string>(argv + 1, argv + argc), std::getenv("VORN_ROOT"), &options,
                             &text)) {
    case OptionsVerdict::run: break;
    case OptionsVerdict::help:
    case OptionsVerdict::version: std::fputs(text.c_str(), stdout); return 0;
    case OptionsVerdict::error:
      std::fprintf(stderr, "vorn-helper: %s (see vorn-helper --help)\n", text.c_str());
      return 2;
  }
  std::string error;
  signal(SIGPIPE, SIG_IGN);
  DaemonLoop loop;
  HelperService* service = nullptr;
  if (!loop.open([&] { if (service != nullptr) service->stopping(); }, &error)) {
    std::fprintf(stderr, "vorn-helper: %s\n", error.c_str());
    return 1;
  }
  HelperService helperService(options, loop);
  service = &helperService;
  if (!helperService.start(&error)) {
    std::fprintf(stderr, "vorn-helper: %s\n", error.c_str());
    return 1;
  }
  std::fprintf(stderr, "vorn-helper: ready\n");
  return loop.run() < 0 ? 1 : 0;
}
