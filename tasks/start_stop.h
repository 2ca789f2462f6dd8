#pragma once
// START, STOP and RESTART: runs the installation's agent control script for one product and, when named, one instance.
// For the executor thread (see unsetEnv).

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// All three: 0 on success, TASK_STARTSTOP_NOT_STARTED (1025) when the control script could not be started,
/// TASK_STARTSTOP_FAILED (1024) when it exited non-zero. On failure the request, which may be null, gets the message id
/// and the whole command line as its parameter; on success it is not touched.
TASK_RC startAgent(const VMQ::String& productCode, const VMQ::String& instanceName, TaskQueueElem* request);
TASK_RC stopAgent(const VMQ::String& productCode, const VMQ::String& instanceName, TaskQueueElem* request);

/// Stops, then starts; the result is that of the start. Kept on purpose: a failed stop's message stays in the request
/// even when the start succeeds.
TASK_RC restartAgent(const VMQ::String& productCode, const VMQ::String& instanceName, TaskQueueElem* request);

/// `action` is "START" or "STOP". Kept on purpose: any other action runs the script with the verb
/// "oh-oh-not-supported".
TASK_RC startstopAgent(const VMQ::String& action, const VMQ::String& productCode, const VMQ::String& instanceName,
                       TaskQueueElem* request);

/// Removes the first entry of that name from this process's environment, under the host's environment lock.
void unsetEnv(char* name);

/// Removes every occurrence of the character.
void removeChar(VMQ::String& text, char character);
