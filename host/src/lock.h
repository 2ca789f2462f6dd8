#pragma once
// The recursive lock behind BSS1_*Lock, for this library's own use: without the test seam.

#include <pthread.h>

#include <atomic>

#include "bss1.h"

/// Recursive by hand: a PTHREAD_MUTEX_RECURSIVE remembers the kernel's thread id, which fork changes, so that the
/// child could not release it. pthread_self stays the same.
struct BSS1_Lock {
  pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
  std::atomic<pthread_t> owner{};  // 0: nobody; only the owner itself ever sees its own id here
  unsigned depth = 0;              // the owner's
};

namespace vmqhost {

/// These return 0 or an errno value.
int acquire(BSS1_Lock& lock);
int release(BSS1_Lock& lock);

/// Holds a lock while it lives.
class LockScope {
 public:
  explicit LockScope(BSS1_Lock& lock) : lock_(lock) { (void)acquire(lock_); }  // fails only after 2^32 nested calls
  ~LockScope() { (void)release(lock_); }
  LockScope(const LockScope&) = delete;
  LockScope& operator=(const LockScope&) = delete;

 private:
  BSS1_Lock& lock_;
};

}  // namespace vmqhost
