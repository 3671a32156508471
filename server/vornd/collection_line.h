// SPDX-License-Identifier: MIT
#pragma once

#include <cstddef>
#include <deque>
#include <memory>

#include "server/vornd/collection_worker.h"

/// The requests that wait for the collection worker, on the loop thread.
/// The line is short: a caller who finds kMaxWaiting requests waiting is
/// told the server is busy at once, rather than queueing work without end.
/// A waiting request whose caller has left the bus is dropped before it
/// starts: the bus tells us (NameOwnerChanged, through an sd_bus_track per
/// request), and no one would read the answer.
namespace vorn::server {

struct TrackUnref {
  void operator()(sd_bus_track* t) const { sd_bus_track_unref(t); }
};
using TrackPtr = std::unique_ptr<sd_bus_track, TrackUnref>;

class CollectionLine {
 public:
  static constexpr size_t kMaxWaiting = 8;

  CollectionLine(sd_bus* bus, CollectionWorker& worker);

  /// Starts the collection `call` asks for, or lines it up; false when the
  /// line is full (answer busy). `done` runs when it ends, never for a
  /// caller who left first.
  bool submit(sd_bus_message* call, const CollectRequest& request, CollectionWorker::Done done);

 private:
  struct Waiting {
    CollectRequest request;
    CollectionWorker::Done done;
    TrackPtr track;
  };

  static int onDeparted(sd_bus_track* track, void* userdata);
  void startNext();

  sd_bus* bus_;
  CollectionWorker& worker_;
  std::deque<std::unique_ptr<Waiting>> waiting_;
};

}  // namespace vorn::server
