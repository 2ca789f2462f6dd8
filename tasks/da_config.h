#pragma once
// SETCONFIG for the data agent, and what its managed system names say: "instance:host:DA" or "host:DA".

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// Installs a model and scripts in the data agent. For the executor thread.
/// Not built yet: always TASK_TRANSLATOR_NOT_STARTED (1009).
TASK_RC setDaconfig(TaskQueueElem& request);

/// The instance of a managed system name; empty when it names none, or is of another form.
VMQ::String getDaInstanceName(const VMQ::String& managedSystemName);

/// The host of a managed system name; empty when it is of another form.
VMQ::String getDaHostName(const VMQ::String& managedSystemName);
