// Recursive locks.

#include <cerrno>
#include <climits>
#include <new>

#include "lock.h"
#include "seam.h"

namespace vmqhost {

int acquire(BSS1_Lock& lock) {
  const pthread_t self = pthread_self();
  if (lock.owner.load(std::memory_order_relaxed) == self) {
    if (lock.depth == UINT_MAX) return EAGAIN;
    ++lock.depth;
    return 0;
  }
  if (const int error = pthread_mutex_lock(&lock.mutex)) return error;
  lock.owner.store(self, std::memory_order_relaxed);
  lock.depth = 1;
  return 0;
}

int release(BSS1_Lock& lock) {
  if (lock.owner.load(std::memory_order_relaxed) != pthread_self()) return EPERM;
  if (--lock.depth > 0) return 0;
  lock.owner.store(pthread_t{}, std::memory_order_relaxed);
  return pthread_mutex_unlock(&lock.mutex);
}

}  // namespace vmqhost

BSS1_Lock* BSS1_NewLock() {
  return new (std::nothrow) BSS1_Lock;
}

void BSS1_DeleteLock(BSS1_Lock* lock) {
  if (lock == nullptr) return;
  (void)pthread_mutex_destroy(&lock->mutex);  // EBUSY is the caller's mistake, and nobody could be told
  delete lock;
}

int BSS1_GetLock(BSS1_Lock* lock) {
  if (int status; vmqhost::seam::fails("BSS1_GetLock", &status)) return status;
  return lock == nullptr ? EINVAL : vmqhost::acquire(*lock);
}

int BSS1_ReleaseLock(BSS1_Lock* lock) {
  const int released = lock == nullptr ? EINVAL : vmqhost::release(*lock);
  if (int status; vmqhost::seam::fails("BSS1_ReleaseLock", &status)) return status;
  return released;
}
