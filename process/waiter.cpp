// The shared record of one child, and the thread that waits for its end.
#include <sys/eventfd.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>

#include "process/pipes.h"
#include "process/process_data.h"
#include "process/trace_errno.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/waiter"};

constexpr int kNotReaped = 255;
constexpr int kSignalBase = 128;

/// Of a child that has exited or that a signal has ended: one that is only stopped is not waited for.
int exitCodeOf(int waitStatus) {
  return WIFEXITED(waitStatus) ? WEXITSTATUS(waitStatus) : kSignalBase + WTERMSIG(waitStatus);
}

/// Returns when the child has ended, without reaping it: until the mutex is held its pid must stay its own, because
/// Process::wait may be about to kill it. False when the system does not let us wait so.
bool waitForEnd(pid_t pid) {
  siginfo_t info;
  int rc;
  do {
    rc = waitid(P_PID, static_cast<id_t>(pid), &info, WEXITED | WNOWAIT);
  } while (rc != 0 && errno == EINTR);
  return rc == 0;
}

int reap(const Trace& trace, pid_t pid) {
  int waitstat = 0;
  pid_t rc;
  do {
    rc = waitpid(pid, &waitstat, 0);
  } while (rc < 0 && errno == EINTR);
  const int error = errno;
  TRACE_DETAIL(trace, "waitpid returned rc=%d,waitstat=%d", static_cast<int>(rc), waitstat);
  if (rc < 0) {
    TRACE_ERRNO(trace, error);
    return kNotReaped;
  }
  TRACE_DETAIL(trace, "WEXITSTATUS(waitstat)=%d,WIFEXITED(waitstat)=%d", WEXITSTATUS(waitstat),
               static_cast<int>(WIFEXITED(waitstat)));
  return exitCodeOf(waitstat);
}

}  // namespace

ProcessData::~ProcessData() {
  // Nobody else holds the record any more, so neither can be busy.
  if (hasCondition_) (void)pthread_cond_destroy(&wait_cond);
  if (hasMutex_) (void)pthread_mutex_destroy(&mutex);
}

bool ProcessData::initialize() {
  const Trace trace(traceUnit);
  int rc = pthread_mutex_init(&mutex, nullptr);
  if (rc != 0) {
    TRACE_ERROR(trace, "Error initializing mutex: %d", rc);
    return false;
  }
  hasMutex_ = true;
  rc = pthread_cond_init(&wait_cond, nullptr);
  if (rc != 0) {
    TRACE_ERROR(trace, "Error initializing condition: %d", rc);
    return false;
  }
  hasCondition_ = true;
  completion = moveAboveStandard(Descriptor(eventfd(0, EFD_CLOEXEC)));
  if (!completion.isOpen()) {
    const int error = errno;
    TRACE_ERROR(trace, "failed to create completion event");
    TRACE_ERRNO(trace, error);
    return false;
  }
  return true;
}

void* ProcTerminateThreadFunc(void* argument) {
  const Trace trace(traceUnit);
  const std::unique_ptr<std::shared_ptr<ProcessData>> handle(static_cast<std::shared_ptr<ProcessData>*>(argument));
  ProcessData* const pd = handle->get();

  TRACE_DETAIL(trace, "Waiting for process id: %d", pd->pid);
  const bool ended = waitForEnd(pd->pid);
  // A child may run for as long as it likes, and wait for its input: not with the mutex held, which running() takes.
  const int early = ended ? kNotReaped : reap(trace, pd->pid);

  const int lockError = pthread_mutex_lock(&pd->mutex);
  if (lockError != 0) TRACE_ERROR(trace, "pthread_mutex_lock error=%d", lockError);
  pd->retCode = ended ? reap(trace, pd->pid) : early;
  pd->completed = true;
  TRACE_DETAIL(trace, "Signaling pd->wait_cond");
  int rc = pthread_cond_signal(&pd->wait_cond);
  if (rc != 0) TRACE_ERROR(trace, "pthread_cond_signal error=%d", rc);
  if (lockError == 0) {
    rc = pthread_mutex_unlock(&pd->mutex);
    if (rc != 0) TRACE_ERROR(trace, "pthread_mutex_unlock error=%d", rc);
  }
  // Not before the mutex is free again: whoever wakes up takes it next.
  const uint64_t one = 1;
  if (write(pd->completion.get(), &one, sizeof one) != sizeof one) {
    const int error = errno;
    TRACE_ERRNO(trace, error);
  }

  TRACE_DETAIL(trace, "Exiting function with pthread_exit(NULL)");
  return nullptr;
}

}  // namespace VMQ
