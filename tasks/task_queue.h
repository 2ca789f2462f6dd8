#pragma once
// The requests that wait for the executor thread: a FIFO between the host's threads and the executor.

#include <pthread.h>

#include <deque>
#include <optional>

#include "tasks/task_queue_elem.h"

/// Guarded by queue_mutex. Requests are never reordered, merged or dropped (but see takeTask).
extern std::deque<TaskQueueElem>& taskQueue;
extern pthread_mutex_t queue_mutex;
/// Signalled for each request that is queued.
extern pthread_cond_t worktodo;

/// Prepares the mutex and the condition variable; a failure is traced. Once, for vmq_taskmgr_init.
void initializeTaskQueue();

// queueTask, the producers' side, is declared in tasks/task_manager.h.

/// Waits until there is a request and takes the oldest off the queue. Empty, with the failure traced, when
/// - the mutex could not be locked;
/// - the wait failed with nothing queued. Kept on purpose: the mutex then stays locked, and the next call locks it
/// again;
/// - the mutex could not be unlocked: the request taken is dropped.
/// For the executor thread. Other requests may be queued and the mutex is free once it returns a request.
std::optional<TaskQueueElem> takeTask();
