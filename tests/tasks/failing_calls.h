#pragma once
// The queue's own synchronisation calls, as the linker gives them to a test program (--wrap): they do what they always
// do unless a test makes them fail. Starting the executor only makes a thread that ends at once, so that a test can run
// the executor's steps itself.

#include <pthread.h>

#include <atomic>
#include <functional>

/// The calls of this program while it lives. A status other than 0 is returned by the next such call on the queue's
/// mutex or condition variable, which then does nothing else, and by that one only.
struct FailingCalls {
  FailingCalls();
  ~FailingCalls();
  FailingCalls(const FailingCalls&) = delete;
  FailingCalls& operator=(const FailingCalls&) = delete;

  std::atomic<int> mutex_init = 0;
  std::atomic<int> cond_init = 0;
  std::atomic<int> create = 0;
  std::atomic<int> lock = 0;
  std::atomic<int> unlock = 0;
  std::atomic<int> signal = 0;
  /// Called in place of every wait, with the mutex held, when it is set.
  std::function<int()> wait;

  int executors_started = 0;
};

/// True when somebody holds the queue's mutex.
bool queueMutexIsHeld();
