#pragma once
// Configuration of standard products through the installation's two-way translator, and the instance names it knows.
// getConfig and getInstanceName may run on any thread.

#include "tasks/command_report.h"
#include "tasks/task_queue_elem.h"
#include "tasks/task_rc.h"
#include "util/string.h"

/// Finds the translator in the shared-library architecture directory. True with its path; false, and the text empty,
/// when it does not exist.
bool getTwoWayTranslator(VMQ::String& translator);

/// GETCONFIG: 0, 1007 (no translator), 1008 (it exited non-zero) or 1009 (it could not be started). On success CONTEXT
/// becomes the translator's output from "INSTANCE=" on; without that mark it stays.
TASK_RC getConfig(TaskQueueElem& request);

/// SETCONFIG: hands CONTEXT to the translator's standard input. Results as above.
TASK_RC setConfig(TaskQueueElem& request);

/// The instance name that belongs to a managed system name, trimmed; empty when there is none or on any failure, which
/// is only traced. Product "um" (exactly) takes it from the name itself.
VMQ::String getInstanceName(const VMQ::String& productCode, const VMQ::String& managedSystemName);

/// As getTwoWayTranslator; when there is none, the request gets the message of 1007.
bool findTranslatorFor(TaskQueueElem& request, VMQ::String& translator);

/// translator + " <option> " + name + " -pc " + product; an empty name leaves both blanks around it.
VMQ::String translatorCommand(const VMQ::String& translator, const char* option, const VMQ::String& name,
                              const VMQ::String& productCode);

/// What the translator's requests report: 1009 and 1008, named by COMMAND and PRODUCT.
extern const CommandReport TRANSLATOR_REPORT;
