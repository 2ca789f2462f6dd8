#pragma once
// UNINSTALL and REMOVEINSTANCE, and the placeholders of command lines that the management server sends.

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// The text with "|DEPLOYDIR|", "|CORVELHOME|" and "|DEPOTDIR|" replaced.
/// Not built yet: declared only.
VMQ::String replaceTokens(const VMQ::String& text, const VMQ::String& productCode, const VMQ::String& version);

/// Removes a product. 0, TASK_UNINSTALL_FAILED (1032), TASK_UNINSTALL_NOT_STARTED (1033) or
/// TASK_NO_PRODUCT_ARCHITECTURE (1034). For the executor thread.
/// Not built yet: always TASK_UNINSTALL_NOT_STARTED.
TASK_RC uninstall(TaskQueueElem& request);

/// Removes one configured instance of a product. 0, TASK_NO_TRANSLATOR (1007), TASK_TRANSLATOR_FAILED (1008) or
/// TASK_TRANSLATOR_NOT_STARTED (1009). For the executor thread.
/// Not built yet: always TASK_TRANSLATOR_NOT_STARTED.
TASK_RC removeInstance(TaskQueueElem& request);
