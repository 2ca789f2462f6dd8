#pragma once
// SETCONFIG for the data agent, and what its managed system names say: "instance:host:DA" or "host:DA".

#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// SETCONFIG for product "um" (in any case): puts the model DACONFIG and the scripts DASCRIPT (joined by ",") from the
/// depot where the agent's configuration file wants them, makes the agent start the provider that the model needs, and
/// replaces the model in the running agent. With scripts alone it only copies them; with neither it does nothing.
/// CONTEXT may give "PORT=n" for the agent's console. For the executor thread.
/// 0, or the first failing step's code from 1011 to 1023 and 1026 to 1028, with the values of its message, joined by
/// ",", as the parameter. What earlier steps did stays.
TASK_RC setDaconfig(TaskQueueElem& request);

/// The instance of a managed system name; empty when it names none, or is of another form.
VMQ::String getDaInstanceName(const VMQ::String& managedSystemName);

/// The host of a managed system name; empty when it is of another form.
VMQ::String getDaHostName(const VMQ::String& managedSystemName);
