// Waiting for a child, and the end of those that take too long.
#include <cerrno>
#include <csignal>

#include "bss1.h"
#include "process/process.h"
#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/process_wait"};

constexpr int64_t kSliceMilliseconds = 10'000;
constexpr int kKilled = 128 + SIGKILL;

/// True when the signal was sent.
bool sendKill(const Trace& trace, pid_t target) {
  if (kill(target, SIGKILL) == 0) return true;
  const int error = errno;
  TRACE_ERRNO(trace, error);
  return false;
}

}  // namespace

int neg(int value) {
  // By way of unsigned, so that the least value, which has no counterpart, is not undefined.
  return static_cast<int>(0U - static_cast<unsigned>(value));
}

bool Process::wait(int* retCode) {
  const Trace trace(traceUnit);
  if (processData_ == nullptr) return false;
  return waitUntil(retCode, BSS1_GetElapsed() + int64_t{processData_->timeout} * 1000);
}

bool Process::waitUntil(int* retCode, int64_t killAtMilliseconds) {
  const Trace trace(traceUnit);
  if (processData_ == nullptr || !processData_->joinable) return false;

  int rc = pthread_mutex_lock(&processData_->mutex);
  if (rc != 0) {
    TRACE_ERROR(trace, "Error locking mutex: %d", rc);
    return false;
  }
  bool killed = false;
  const bool ends = waitForCompletion(killAtMilliseconds, &killed);
  rc = pthread_mutex_unlock(&processData_->mutex);
  if (rc != 0) TRACE_ERROR(trace, "Error unlocking mutex: %d", rc);
  // A child that even SIGKILL does not reach may run for ever: joining its waiter would hold the caller as long.
  if (!ends) return false;

  (void)pthread_join(processData_->thread, nullptr);  // joinable, and not this thread
  processData_->joinable = false;
  // A child that ended by itself at the very moment of the kill is still one that took too long.
  const int status = killed && processData_->retCode == 0 ? kKilled : processData_->retCode;
  TRACE_DETAIL(trace, "Setting retCode=%d", status);
  *retCode = status;
  return !killed;
}

/// REQUIRES: the record's mutex is held. False when the child could not be made to end.
bool Process::waitForCompletion(int64_t killAtMilliseconds, bool* killed) {
  const Trace trace(traceUnit);
  ProcessData& pd = *processData_;
  while (!pd.completed) {
    const int64_t deadline = BSS1_GetElapsed() + kSliceMilliseconds;
    TRACE_DETAIL(trace, "calling pthread_cond_timedwait");
    const int rc = BSS1_TimedWait(&pd.wait_cond, &pd.mutex, kSliceMilliseconds);
    TRACE_DETAIL(trace, "pthread_cond_timedwait rc=%d, pd->completed=%d", rc, static_cast<int>(pd.completed));
    if (rc == ETIMEDOUT) {
      if (!pd.completed && deadline >= killAtMilliseconds) {
        *killed = true;
        return killChild();
      }
    } else if (rc != 0) {
      // A clock that does not work would make this a busy loop, and no reason to kill an installer.
      TRACE_ERRNO(trace, rc);
      return true;
    }
  }
  return true;
}

/// REQUIRES: the record's mutex is held and the child has not completed, so its pid is still its own.
bool Process::killChild() {
  const Trace trace(traceUnit);
  const int pid = processData_->pid;
  TRACE_DETAIL(trace, "Terminating process group %d", neg(pid));
  (void)sendKill(trace, neg(pid));  // only a child that leads a group of its own has one
  TRACE_DETAIL(trace, "Terminating process %d", pid);
  return sendKill(trace, pid);
}

}  // namespace VMQ
