#include "tasks/task_queue.h"

#include <type_traits>
#include <utility>

#include "tasks/task_manager.h"
#include "util/trace.h"

using VMQ::Trace;

// NOLINTNEXTLINE(cert-err58-cpp): without that little memory the host had better not load the component
std::deque<TaskQueueElem>& taskQueue = *new std::deque<TaskQueueElem>();
pthread_mutex_t queue_mutex;
pthread_cond_t worktodo;

namespace {
RAS1_Unit traceUnit{"tasks/task_queue"};
}

// takeTask moves a request while it holds the mutex.
static_assert(std::is_nothrow_move_constructible_v<TaskQueueElem>);

void initializeTaskQueue() {
  const Trace trace(traceUnit);
  if (const int rc = pthread_mutex_init(&queue_mutex, nullptr); rc != 0)
    TRACE_ERROR(trace, "Unable to initialize queue mutex, return code %d\n", rc);
  if (const int rc = pthread_cond_init(&worktodo, nullptr); rc != 0)
    TRACE_ERROR(trace, "Unable to initialize condition variable, return code %d\n", rc);
}

void queueTask(TaskQueueElem request) {
  const Trace trace(traceUnit);
  // A request is never lost for a lock that fails: it is queued regardless.
  const int locked = pthread_mutex_lock(&queue_mutex);
  if (locked != 0) TRACE_ERROR(trace, "Unable to get lock on queue mutex, return code %d\n", locked);
  try {
    taskQueue.push_back(std::move(request));
  } catch (...) {
    if (locked == 0) (void)pthread_mutex_unlock(&queue_mutex);  // held by this thread; the exception says more
    throw;
  }
  if (const int rc = pthread_cond_signal(&worktodo); rc != 0)
    TRACE_ERROR(trace, "Unable to signal executor thread, return code %d\n", rc);
  if (const int rc = pthread_mutex_unlock(&queue_mutex); rc != 0)
    TRACE_ERROR(trace, "Unable to unlock queue mutex, return code %d\n", rc);
}

std::optional<TaskQueueElem> takeTask() {
  const Trace trace(traceUnit);
  if (const int rc = pthread_mutex_lock(&queue_mutex); rc != 0) {
    TRACE_ERROR(trace, "Failed to lock queue mutex, return code %d", rc);
    return std::nullopt;
  }
  if (taskQueue.empty()) {
    int rc;
    do {
      rc = pthread_cond_wait(&worktodo, &queue_mutex);
    } while (rc == 0 && taskQueue.empty());  // a condition variable may wake without a signal
    if (rc != 0)
      TRACE_ERROR(trace, "Failed to wait on condition, return code %d", rc);
    else
      TRACE_DETAIL(trace, "Executor awoken by signal");
  } else {
    TRACE_DETAIL(trace, "Executor has %d items on queue", static_cast<int>(taskQueue.size()));
  }
  if (taskQueue.empty()) return std::nullopt;
  std::optional<TaskQueueElem> request(std::move(taskQueue.front()));
  taskQueue.pop_front();
  if (const int rc = pthread_mutex_unlock(&queue_mutex); rc != 0) {
    TRACE_ERROR(trace, "Failed to unlock queue mutex, return code %d", rc);
    request.reset();
  }
  return request;
}
