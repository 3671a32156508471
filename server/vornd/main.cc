// SPDX-License-Identifier: MIT
// vornd: the reference Vorn server. Owns org.vorn.Manager on the system bus
// and collects logs under its platform root.
#include <malloc.h>
#include <signal.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "server/common/collector.h"
#include "server/common/daemon_loop.h"
#include "server/common/daemon_options.h"
#include "server/common/trace_properties.h"
#include "server/vornd/collection_line.h"
#include "server/vornd/collection_worker.h"
#include "server/vornd/manager_service.h"

namespace {

#ifdef VORN_TEST_SWITCHES
/// --collect-delay-ms: holds a collection before it starts, so that tests
/// can line requests up behind it; a stop ends the wait.
void holdFor(long ms, const std::atomic<bool>& cancel) {
  const auto until = std::chrono::steady_clock::now() + std::chrono::milliseconds(ms);
  while (!cancel.load() && std::chrono::steady_clock::now() < until) {
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
}
#endif

}  // namespace

int main(int argc, char** argv) {
  using namespace vorn::server;
  ManagerOptions options;
  std::string text;
  switch (parseManagerOptions(std::vector<std::string>(argv + 1, argv + argc), std::getenv("VORN_ROOT"), &options,
                              &text)) {
    case OptionsVerdict::run: break;
    case OptionsVerdict::help:
    case OptionsVerdict::version: std::fputs(text.c_str(), stdout); return 0;
    case OptionsVerdict::error: std::fprintf(stderr, "vornd: %s (see vornd --help)\n", text.c_str()); return 2;
  }
  // A refused request may be tens of megabytes; with a fixed threshold such
  // buffers are mapped and unmapped, rather than raising glibc's moving one
  // and staying in the heap for good.
  mallopt(M_MMAP_THRESHOLD, 4 << 20);  // NOLINT(concurrency-mt-unsafe): no thread runs yet
  // A full disk or a file-size limit must fail a collection, not kill us.
  signal(SIGXFSZ, SIG_IGN);
  signal(SIGPIPE, SIG_IGN);

  std::string error;
  TraceProperties properties = loadTraceProperties(options.root, &error);
  if (!error.empty()) std::fprintf(stderr, "vornd: %s\n", error.c_str());

  Collector::Options collectorOptions;
  collectorOptions.maxBytes = options.maxCollectionBytes;
  Collector collector(options.root, collectorOptions);
  // Whatever a killed run was writing is of no use to anyone.
  collector.removeLeftovers();

  DaemonLoop loop;
  ManagerService* service = nullptr;
  CollectionWorker* worker = nullptr;
  if (!loop.open(
          [&] {
            if (worker != nullptr) worker->stop();
            if (service != nullptr) service->stopping();
          },
          &error)) {
    std::fprintf(stderr, "vornd: %s\n", error.c_str());
    return 1;
  }
  CollectionWorker collectionWorker(loop, [&](const CollectRequest& request, const std::atomic<bool>& cancel) {
#ifdef VORN_TEST_SWITCHES
    holdFor(options.collectDelayMs, cancel);
#endif
    return collector.collect(request, cancel);
  });
  CollectionLine line(loop.bus(), collectionWorker);
  ManagerService managerService(options, loop, std::move(properties), line);
  worker = &collectionWorker;
  service = &managerService;
  if (!collectionWorker.start()) {
    std::fprintf(stderr, "vornd: cannot start the collection thread\n");
    return 1;
  }
  if (!managerService.start(&error)) {
    std::fprintf(stderr, "vornd: %s\n", error.c_str());
    return 1;
  }
  int r = loop.run();
  collectionWorker.stop();
  return r < 0 ? 1 : 0;
}
