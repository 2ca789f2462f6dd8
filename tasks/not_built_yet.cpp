// Tasks that are not built yet. Each answers that it could not start, so that a request for it fails plainly.

#include "tasks/da_config.h"
#include "tasks/install.h"
#include "tasks/two_way_translator.h"
#include "tasks/uninstall.h"
#include "util/trace.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/not_built_yet"};

TASK_RC notBuiltYet(TaskQueueElem& request, TASK_RC rc) {
  const Trace trace(traceUnit);
  TRACE_ERROR(trace, "%s Command [%s] is not built yet", rcToMsgId(rc), request.command.c_str().get());
  request.retmsgid = String(rcToMsgId(rc));
  request.retmsgparm = request.command + " is not built yet";
  return rc;
}

}  // namespace

TASK_RC install(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_INSTALL_NOT_STARTED);
}

TASK_RC completeInstallAfterRestart(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_INSTALL_FAILED);
}

TASK_RC uninstall(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_UNINSTALL_NOT_STARTED);
}

TASK_RC removeInstance(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_TRANSLATOR_NOT_STARTED);
}

TASK_RC getConfig(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_TRANSLATOR_NOT_STARTED);
}

TASK_RC setConfig(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_TRANSLATOR_NOT_STARTED);
}

TASK_RC setDaconfig(TaskQueueElem& request) {
  return notBuiltYet(request, TASK_TRANSLATOR_NOT_STARTED);
}

bool getTwoWayTranslator(String& translator) {
  const Trace trace(traceUnit);
  translator = String();
  return false;
}

String getInstanceName(const String& productCode, const String& managedSystemName) {
  const Trace trace(traceUnit);
  String instance;
  if (managedSystemName.length() > 0) {
    if (productCode == "um")
      instance = getDaInstanceName(managedSystemName);
    else
      TRACE_ERROR(trace, "No two-way translator found for product code [%s]", productCode.c_str().get());
  }
  instance.trim();
  TRACE_DETAIL(trace, "Returning instance [%s] for managed system name [%s]", instance.c_str().get(),
               managedSystemName.c_str().get());
  return instance;
}
