#pragma once
// How many clients watch.

#include <atomic>
#include <utility>

namespace vmqd {

/// Watches hold a connection for as long as they like, so they are not given all of them. Any thread.
class WatcherSlots {
 public:
  explicit WatcherSlots(unsigned maximum) : maximum_(maximum) {}

  /// One watcher's place, given back when it goes.
  class Slot {
   public:
    explicit Slot(WatcherSlots& slots) : slots_(&slots) {}
    Slot(const Slot&) = delete;
    Slot& operator=(const Slot&) = delete;
    Slot(Slot&& other) noexcept : slots_(std::exchange(other.slots_, nullptr)) {}
    Slot& operator=(Slot&&) = delete;
    ~Slot() {
      if (slots_ != nullptr) --slots_->taken_;
    }

   private:
    WatcherSlots* slots_;
  };

  /// Throws Refusal (busy) when all are taken.
  Slot take();
  [[nodiscard]] unsigned taken() const { return taken_; }

 private:
  const unsigned maximum_;
  std::atomic<unsigned> taken_{0};
};

}  // namespace vmqd
