#pragma once
// What the caller of a child and its waiter thread share.

#include <pthread.h>

#include <memory>

#include "process/descriptor.h"

namespace VMQ {

/// One child. Kept alive by both the Process and the waiter thread, whichever ends last.
struct ProcessData {
  // cppcheck-suppress uninitMemberVar ; initialize() makes mutex and condition
  ProcessData() = default;
  ~ProcessData();
  ProcessData(const ProcessData&) = delete;
  ProcessData& operator=(const ProcessData&) = delete;

  /// Makes what the threads share. False, with a trace, on failure. REQUIRES: called once, before the waiter exists.
  bool initialize();

  // Constant once the waiter thread exists.
  int pid = -1;
  int timeout = 0;  ///< seconds that Process::wait gives the child
  /// Becomes readable when `completed` is set, so that one poll can wait for output and for the end of the child.
  Descriptor completion;

  // The caller's thread only.
  pthread_t thread{};     ///< the waiter
  bool joinable = false;  ///< `thread` was started and neither joined nor detached

  pthread_mutex_t mutex;
  pthread_cond_t wait_cond;  ///< signalled when `completed` is set

  // Guarded by `mutex`. While it is held and `completed` is false the child has not been reaped: `pid` is the child's.
  int retCode = 0;         ///< exit code, 128 + the signal that ended the child, or 255 when it could not be reaped
  bool completed = false;  ///< set by the waiter, or when there is no waiter to set it

 private:
  bool hasMutex_ = false;
  bool hasCondition_ = false;
};

/// The body of a waiter thread: reaps the child and publishes its end. `argument` is a new
/// std::shared_ptr<ProcessData>, which it takes. Returns null.
extern "C" void* ProcTerminateThreadFunc(void* argument);

}  // namespace VMQ
