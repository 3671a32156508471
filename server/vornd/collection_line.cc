// SPDX-License-Identifier: MIT
#include "server/vornd/collection_line.h"

#include <algorithm>

namespace vorn::server {

CollectionLine::CollectionLine(sd_bus* bus, CollectionWorker& worker) : bus_(bus), worker_(worker) {
  worker_.onFree = [this] { startNext(); };
}

bool CollectionLine::submit(sd_bus_message* call, const CollectRequest& request, CollectionWorker::Done done) {
  if (!worker_.busy() && waiting_.empty()) {
    worker_.run(request, std::move(done));
    return true;
  }
  if (waiting_.size() >= kMaxWaiting) return false;
  auto waiting = std::make_unique<Waiting>(Waiting{request, std::move(done), nullptr});
  sd_bus_track* track = nullptr;
  if (sd_bus_track_new(bus_, &track, &CollectionLine::onDeparted, this) >= 0) {
    waiting->track.reset(track);
    // Fails when the caller is gone already; the handler runs then too.
    sd_bus_track_add_sender(track, call);
  }
  waiting_.push_back(std::move(waiting));
  return true;
}

int CollectionLine::onDeparted(sd_bus_track* track, void* userdata) {
  auto* self = static_cast<CollectionLine*>(userdata);
  // sd-bus holds the track while this runs, so it may go with its request.
  auto it = std::find_if(self->waiting_.begin(), self->waiting_.end(),
                         [track](const auto& w) { return w->track.get() == track; });
  if (it != self->waiting_.end()) self->waiting_.erase(it);
  return 0;
}

void CollectionLine::startNext() {
  if (worker_.busy() || waiting_.empty()) return;
  std::unique_ptr<Waiting> next = std::move(waiting_.front());
  waiting_.pop_front();
  worker_.run(next->request, std::move(next->done));
}

}  // namespace vorn::server
