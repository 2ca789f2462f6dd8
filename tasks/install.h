#pragma once
// INSTALL and COMPLETE_INSTALL.

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// Runs the installer that CONTEXT names, once its placeholders are resolved. For the executor thread.
/// OPTIONAL "REQUIRES_RESTART": the installer may restart this very process, so it runs under a generated script that
/// outlives it; the status event of success is sent before the installer starts, and another one when the process
/// survives. Any other OPTIONAL that is not empty registers the product with its management server afterwards.
/// 0, 1008, 1009 (that registration), 1030 (not started) or 1031 (exited non-zero; no translator; a product code that
/// must not stand in the script). Kept on purpose: a restart install without a translator answers 1031 with the message
/// id of 1030, and a missing translator after an ordinary install leaves the message empty.
TASK_RC install(TaskQueueElem& request);

/// Writes the script for a restart install and puts its call in front of the command. An empty translator command
/// leaves the translator's step out. A failed write is only traced and leaves no script, so that its call fails.
void setupForRestart(VMQ::String& installCommand, VMQ::String& translatorCommand, TaskQueueElem& request);

/// After 10 seconds (the installer may still be writing), reports the exit code that the script left in rc.txt. 0, or
/// 1031 when the file cannot be read or holds another number than 0; text that is no number counts as 0. For any
/// thread.
TASK_RC completeInstallAfterRestart(TaskQueueElem& request);
