#pragma once
// Counts what is under way, so that a stop can wait for its end.

#include <chrono>
#include <condition_variable>
#include <mutex>

namespace vmqd {

/// Any thread.
class Activity {
 public:
  void begin();
  void end();
  [[nodiscard]] unsigned count() const;
  /// Waits until nothing is under way, for `patience` at most. Returns what still is.
  unsigned waitForNone(std::chrono::milliseconds patience);

  /// One that lasts as long as the object.
  class Scope {
   public:
    explicit Scope(Activity& activity) : activity_(activity) { activity_.begin(); }
    ~Scope() { activity_.end(); }
    Scope(const Scope&) = delete;
    Scope& operator=(const Scope&) = delete;

   private:
    Activity& activity_;
  };

 private:
  mutable std::mutex mutex_;
  std::condition_variable none_;
  unsigned count_ = 0;  // guarded by mutex_
};

}  // namespace vmqd
