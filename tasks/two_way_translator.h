#pragma once
// GETCONFIG and SETCONFIG through the installation's two-way translator, and the instance names that it knows.

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// True, with its path in `translator`, when the translator exists; otherwise `translator` is empty. What it held
/// before does not matter. Not built yet: always false.
bool getTwoWayTranslator(VMQ::String& translator);

/// Both: 0, TASK_NO_TRANSLATOR (1007), TASK_TRANSLATOR_FAILED (1008) or TASK_TRANSLATOR_NOT_STARTED (1009). getConfig
/// is for the requester's thread, setConfig for the executor thread. Not built yet: always TASK_TRANSLATOR_NOT_STARTED.
TASK_RC getConfig(TaskQueueElem& request);
TASK_RC setConfig(TaskQueueElem& request);

/// The instance name that belongs to a managed system name, trimmed; empty when there is none or it cannot be found out
/// (traced). Product "um" (exactly so) is answered from the name itself, others by the translator.
/// Not built yet for the others: always empty.
VMQ::String getInstanceName(const VMQ::String& productCode, const VMQ::String& managedSystemName);
