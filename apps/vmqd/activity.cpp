// Counts what is under way.

#include "apps/vmqd/activity.h"

namespace vmqd {

void Activity::begin() {
  const std::lock_guard held(mutex_);
  ++count_;
}

void Activity::end() {
  const std::lock_guard held(mutex_);
  if (--count_ == 0) none_.notify_all();
}

unsigned Activity::count() const {
  const std::lock_guard held(mutex_);
  return count_;
}

unsigned Activity::waitForNone(std::chrono::milliseconds patience) {
  std::unique_lock held(mutex_);
  (void)none_.wait_for(held, patience, [this] { return count_ == 0; });
  return count_;
}

}  // namespace vmqd
