// SPDX-License-Identifier: MIT
// vornd: the reference Vorn server. Owns org.vorn.Manager on the system bus
// and collects logs under its platform root.
#include <signal.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "server/common/collector.h"
#include "server/common/daemon_loop.h"
#include "server/common/daemon_options.h"
#include "server/common/trace_properties.h"
#include "server/vornd/collection_worker.h"
#include "server/vornd/manager_service.h"

int main(int argc, char** argv) {
  using namespace vorn::server;
  ManagerOptions options;
  std::string error;
  if (!parseManagerOptions(std::vector<std::string>(argv + 1, argv + argc), std::getenv("VORN_ROOT"), &options,
                           &error)) {
    std::fprintf(stderr, "vornd: %s\n", error.c_str());
    return 2;
  }
  // A full disk or a file-size limit must fail a collection, not kill us.
  signal(SIGXFSZ, SIG_IGN);
  signal(SIGPIPE, SIG_IGN);

  TraceProperties properties = loadTraceProperties(options.root, &error);
  if (!error.empty()) std::fprintf(stderr, "vornd: %s\n", error.c_str());

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
  Collector collector(options.root);
  CollectionWorker collectionWorker(loop, collector);
  ManagerService managerService(options, loop, std::move(properties), collectionWorker);
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
