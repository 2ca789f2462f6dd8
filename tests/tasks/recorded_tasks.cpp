#include "tests/tasks/recorded_tasks.h"

using VMQ::String;

namespace {

RecordedTasks* tasks = nullptr;

TASK_RC called(const std::string& call, TaskQueueElem& request) {
  tasks->calls.push_back(call);
  return tasks->behaviour ? tasks->behaviour(request) : TASK_OK;
}

TASK_RC agentCalled(const char* name, const String& product, const String& instance, TaskQueueElem* request) {
  return called(name + (" " + product.toNarrow()) + " [" + instance.toNarrow() + "]", *request);
}

}  // namespace

RecordedTasks::RecordedTasks() {
  tasks = this;
}

RecordedTasks::~RecordedTasks() {
  tasks = nullptr;
}

// The assembler names are the linker's, for the functions of the same name in tasks/.
#define WRAPPED(symbol) asm("__wrap_" symbol)
#define WRAPPED_TASK(name, symbol)                      \
  TASK_RC name(TaskQueueElem& request) WRAPPED(symbol); \
  TASK_RC name(TaskQueueElem& request) {                \
    return called(#name, request);                      \
  }
#define WRAPPED_AGENT_TASK(name, symbol)                                                               \
  TASK_RC name(const String& product, const String& instance, TaskQueueElem* request) WRAPPED(symbol); \
  TASK_RC name(const String& product, const String& instance, TaskQueueElem* request) {                \
    return agentCalled(#name, product, instance, request);                                             \
  }

WRAPPED_TASK(install, "_Z7installRN3VMQ13TaskQueueElemE")
WRAPPED_TASK(uninstall, "_Z9uninstallRN3VMQ13TaskQueueElemE")
WRAPPED_TASK(removeInstance, "_Z14removeInstanceRN3VMQ13TaskQueueElemE")
WRAPPED_TASK(getConfig, "_Z9getConfigRN3VMQ13TaskQueueElemE")
WRAPPED_TASK(setConfig, "_Z9setConfigRN3VMQ13TaskQueueElemE")
WRAPPED_TASK(setDaconfig, "_Z11setDaconfigRN3VMQ13TaskQueueElemE")
WRAPPED_TASK(completeInstallAfterRestart, "_Z27completeInstallAfterRestartRN3VMQ13TaskQueueElemE")
WRAPPED_AGENT_TASK(startAgent, "_Z10startAgentRKN3VMQ6StringES2_PNS_13TaskQueueElemE")
WRAPPED_AGENT_TASK(stopAgent, "_Z9stopAgentRKN3VMQ6StringES2_PNS_13TaskQueueElemE")
WRAPPED_AGENT_TASK(restartAgent, "_Z12restartAgentRKN3VMQ6StringES2_PNS_13TaskQueueElemE")

String getInstanceName(const String& product, const String& managedSystemName)
    WRAPPED("_Z15getInstanceNameRKN3VMQ6StringES2_");
String getInstanceName(const String& product, const String& managedSystemName) {
  tasks->calls.push_back("getInstanceName " + product.toNarrow() + " [" + managedSystemName.toNarrow() + "]");
  return String("instance of ") + managedSystemName;
}
