#pragma once
// Checks requests, runs the quick ones at once and queues the others for the one executor thread.

#include <vector>

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// The agent depot directory found at start, ending in "/"; empty before. Written once by vmq_taskmgr_init.
extern VMQ::String& depotDir;

/// Finds the depot, fills the command table and starts the executor thread; once, for the entry point. Without a depot
/// nothing is set up and every later request is refused as not supported.
void vmq_taskmgr_init();

/// Checks the request and runs or queues it. Returns the code of the synchronous answer (TASK_OK for a queued one) with
/// the element's row filled. Clears the request's result texts first. For any thread.
int runTask(TaskQueueElem& request);

/// Appends the request to the queue and wakes the executor.
void queueTask(TaskQueueElem request);

/// The executor's body; never returns.
void* executor_thread(void* ignored);

/// Runs the task of a dequeued request on the calling thread. An exception of the task becomes its "could not start"
/// code.
TASK_RC processAsyncTask(TaskQueueElem& request);

bool isSupportedTask(VMQ::String name);
std::vector<VMQ::String> getSupportedTasks();

/// Returns `rc` unchanged when the value is not empty. Otherwise sets the request's message and returns `errorRc`; kept
/// on purpose: also over an earlier failure in `rc`.
TASK_RC requiredParameterOk(const VMQ::String& name, const VMQ::String& value, TaskQueueElem& request, TASK_RC rc,
                            TASK_RC errorRc);

/// Back to the state before vmq_taskmgr_init. REQUIRES: no executor thread was started, no request is queued.
void TEST_resetTaskManager();
