#pragma once
// UNINSTALL, REMOVEINSTANCE, and the placeholders of command lines that the management server sends.

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// Replaces "|DEPLOYDIR|" (depot + product code, and "/" + version unless the product is "ci"), "|CORVELHOME|" and
/// "|DEPOTDIR|", in this order; a replacement is not looked at again for the earlier ones.
VMQ::String replaceTokens(const VMQ::String& text, const VMQ::String& productCode, const VMQ::String& version);

/// Removes a product: with the installation's own script when the inventory knows it, else with the request's command.
/// 0, 1032 (exited non-zero), 1033 (not started) or 1034 (no architecture). For the executor thread.
/// Kept on purpose: the exit code in the message parameter is one character, not its digits.
TASK_RC uninstall(TaskQueueElem& request);

/// Removes the instance TARGETMSN through the two-way translator, which reads CONTEXT. 0, 1007, 1008 or 1009.
TASK_RC removeInstance(TaskQueueElem& request);
