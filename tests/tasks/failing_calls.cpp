#include "tests/tasks/failing_calls.h"

#include <cerrno>

#include "tasks/task_manager.h"
#include "tasks/task_queue.h"

namespace {

FailingCalls* calls = nullptr;  // set while no other thread of the test runs

int takeStatus(std::atomic<int> FailingCalls::*status) {
  return calls == nullptr ? 0 : (calls->*status).exchange(0);
}

void* endAtOnce(void*) {
  return nullptr;
}

}  // namespace

FailingCalls::FailingCalls() {
  calls = this;
}

FailingCalls::~FailingCalls() {
  calls = nullptr;
}

// The names are the linker's: what the component calls, and what it would have called. Visible, because the linker asks
// for that when a shared library (such as a sanitizer's) calls the same functions.
#pragma GCC visibility push(default)
extern "C" {

int __real_pthread_mutex_init(pthread_mutex_t*, const pthread_mutexattr_t*);
int __real_pthread_cond_init(pthread_cond_t*, const pthread_condattr_t*);
int __real_pthread_create(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
int __real_pthread_mutex_lock(pthread_mutex_t*);
int __real_pthread_mutex_unlock(pthread_mutex_t*);
int __real_pthread_cond_signal(pthread_cond_t*);
int __real_pthread_cond_wait(pthread_cond_t*, pthread_mutex_t*);

int __wrap_pthread_mutex_init(pthread_mutex_t* mutex, const pthread_mutexattr_t* attributes) {
  if (mutex == &queue_mutex) {
    if (const int status = takeStatus(&FailingCalls::mutex_init); status != 0) return status;
  }
  return __real_pthread_mutex_init(mutex, attributes);
}

int __wrap_pthread_cond_init(pthread_cond_t* condition, const pthread_condattr_t* attributes) {
  if (condition == &worktodo) {
    if (const int status = takeStatus(&FailingCalls::cond_init); status != 0) return status;
  }
  return __real_pthread_cond_init(condition, attributes);
}

int __wrap_pthread_create(pthread_t* thread, const pthread_attr_t* attributes, void* (*body)(void*), void* argument) {
  if (body != executor_thread) return __real_pthread_create(thread, attributes, body, argument);
  if (const int status = takeStatus(&FailingCalls::create); status != 0) return status;
  if (attributes != nullptr || argument != nullptr) return EINVAL;  // the executor wants neither
  if (calls != nullptr) ++calls->executors_started;
  return __real_pthread_create(thread, attributes, endAtOnce, argument);
}

int __wrap_pthread_mutex_lock(pthread_mutex_t* mutex) {
  if (mutex == &queue_mutex) {
    if (const int status = takeStatus(&FailingCalls::lock); status != 0) return status;
  }
  return __real_pthread_mutex_lock(mutex);
}

int __wrap_pthread_mutex_unlock(pthread_mutex_t* mutex) {
  if (mutex == &queue_mutex) {
    if (const int status = takeStatus(&FailingCalls::unlock); status != 0) return status;
  }
  return __real_pthread_mutex_unlock(mutex);
}

int __wrap_pthread_cond_signal(pthread_cond_t* condition) {
  if (condition == &worktodo) {
    if (const int status = takeStatus(&FailingCalls::signal); status != 0) return status;
  }
  return __real_pthread_cond_signal(condition);
}

int __wrap_pthread_cond_wait(pthread_cond_t* condition, pthread_mutex_t* mutex) {
  if (condition == &worktodo && calls != nullptr && calls->wait) return calls->wait();
  return __real_pthread_cond_wait(condition, mutex);
}

}  // extern "C"
#pragma GCC visibility pop

bool queueMutexIsHeld() {
  const int status = pthread_mutex_trylock(&queue_mutex);
  if (status == 0) (void)__real_pthread_mutex_unlock(&queue_mutex);  // just locked
  return status == EBUSY;
}
