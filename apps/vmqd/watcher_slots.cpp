// How many clients watch.

#include "apps/vmqd/watcher_slots.h"

#include <string>

#include "apps/vmqd/refusal.h"

namespace vmqd {

WatcherSlots::Slot WatcherSlots::take() {
  if (++taken_ <= maximum_) return Slot(*this);
  --taken_;
  throw Refusal(errors::busy, "There are already " + std::to_string(maximum_) + " watchers.");
}

}  // namespace vmqd
