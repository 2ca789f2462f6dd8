#pragma once
// INSTALL and COMPLETE_INSTALL: runs an installer that the management server has put into the depot.

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// Runs the installer command of the request. 0, TASK_TRANSLATOR_FAILED (1008), TASK_TRANSLATOR_NOT_STARTED (1009),
/// TASK_INSTALL_NOT_STARTED (1030) or TASK_INSTALL_FAILED (1031). For the executor thread.
/// Not built yet: always TASK_INSTALL_NOT_STARTED.
TASK_RC install(TaskQueueElem& request);

/// Writes the script that outlives this agent, and turns `command` into the command that runs it. `translator` is the
/// command that follows a successful install, empty for none.
/// Not built yet: declared only.
void setupForRestart(VMQ::String& command, VMQ::String& translator, TaskQueueElem& request);

/// Reports what an install that restarted this agent came to. 0 or TASK_INSTALL_FAILED (1031). For the requester's
/// thread.
/// Not built yet: always TASK_INSTALL_FAILED.
TASK_RC completeInstallAfterRestart(TaskQueueElem& request);
