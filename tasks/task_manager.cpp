#include "tasks/task_manager.h"

#include <pthread.h>

#include <algorithm>
#include <optional>

#include "tasks/command_table.h"
#include "tasks/task_queue.h"
#include "util/current_exception.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;

// NOLINTNEXTLINE(cert-err58-cpp): without that little memory the host had better not load the component
String& depotDir = *new String();

namespace {

RAS1_Unit traceUnit{"tasks/task_manager"};

// The commands offered: none until the task manager is initialized, then those of the command table. Written by
// vmq_taskmgr_init only, before any request.
// NOLINTNEXTLINE(cert-err58-cpp): without that little memory the host had better not load the component
std::vector<String>& commands = *new std::vector<String>();
unsigned char initialized = 0;

void startExecutor() {
  const Trace trace(traceUnit);
  pthread_t thread;
  if (const int rc = pthread_create(&thread, nullptr, executor_thread, nullptr); rc != 0) {
    TRACE_ERROR(trace, "Unable to create executor thread, return code %d\n", rc);
    return;
  }
  (void)pthread_detach(thread);  // just created and joinable: cannot fail; nobody ever joins it
}

/// Refuses the request's command.
TASK_RC notSupported(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  request.retmsgid = String(rcToMsgId(TASK_COMMAND_NOT_SUPPORTED));
  request.retmsgparm = request.command;
  return TASK_COMMAND_NOT_SUPPORTED;
}

TASK_RC checkParameters(const Command& command, TaskQueueElem& request) {
  const Trace trace(traceUnit);
  TASK_RC rc = TASK_OK;
  for (const RequiredParameter& parameter : command.required) {
    if (parameter.name != nullptr)
      rc = requiredParameterOk(parameter.name, request.*parameter.value, request, rc, parameter.missing);
  }
  return rc;
}

/// Checks the parameters of a supported command, then runs or queues it.
TASK_RC dispatch(const Command& command, TaskQueueElem& request) {
  const Trace trace(traceUnit);
  const ForDataAgent different = isDataAgent(request.product) ? command.forDataAgent : ForDataAgent::kNothing;
  if (different == ForDataAgent::kRefused) {
    TRACE_ERROR(trace, "%s Command [%s] is not a supported command for DA", rcToMsgId(TASK_COMMAND_NOT_SUPPORTED),
                request.command.c_str().get());
    return notSupported(request);
  }
  if (different != ForDataAgent::kNoChecks) {
    if (const TASK_RC rc = checkParameters(command, request); rc != TASK_OK) return rc;
  }
  if (command.answer == Command::kAtOnce) return runCommandTask(command, request);
  queueTask(request);
  return TASK_OK;
}

}  // namespace

void vmq_taskmgr_init() {
  const Trace trace(traceUnit);
  if (initialized == 1) return;
  if (!VMQ::Util::getAgentDepotDir(depotDir)) {
    TRACE_ERROR(trace, "%s No Agent Depot directory set", rcToMsgId(TASK_NO_DEPOT));
    return;
  }
  TRACE_DETAIL(trace, "Command vector being initialized");
  initialized = 1;
  for (const Command& command : commandTable()) {
    const String name(command.name);
    if (std::find(commands.begin(), commands.end(), name) == commands.end()) commands.push_back(name);
  }
  initializeTaskQueue();
  startExecutor();
}

bool isSupportedTask(String name) {  // NOLINT(performance-unnecessary-value-param): the interface
  const Trace trace(traceUnit);
  if (std::find(commands.begin(), commands.end(), name) == commands.end()) {
    TRACE_ERROR(trace, "Command %s is NOT supported", name.c_str().get());
    return false;
  }
  TRACE_DETAIL(trace, "Command %s is supported", name.c_str().get());
  return true;
}

std::vector<String> getSupportedTasks() {
  const Trace trace(traceUnit);
  String text("Commands supported are: ");
  for (size_t i = 0; i < commands.size(); ++i) {
    if (i > 0) text.append(String(","));
    text.append(commands[i]);
  }
  TRACE_DETAIL(trace, "%s\n", text.c_str().get());
  return commands;
}

TASK_RC requiredParameterOk(const String& name, const String& value, TaskQueueElem& request, TASK_RC rc,
                            TASK_RC errorRc) {
  const Trace trace(traceUnit);
  if (value.length() > 0) return rc;
  TRACE_ERROR(trace, "%s No [%s] specified, it is a required parameter", rcToMsgId(errorRc), name.c_str().get());
  request.retmsgid = String(rcToMsgId(errorRc));
  request.retmsgparm = String();
  return errorRc;
}

int runTask(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  request.retmsgid = String();
  request.retmsgparm = String();
  TASK_RC rc = requiredParameterOk("COMMAND", request.command, request, TASK_OK, TASK_NO_COMMAND);
  rc = requiredParameterOk("TRANSID", request.transid, request, rc, TASK_NO_TRANSID);
  const Command* command = nullptr;
  if (rc == TASK_OK) {
    if (isSupportedTask(request.command)) command = findCommand(request.command);
    if (command == nullptr) {
      (void)getSupportedTasks();  // for its trace line
      TRACE_ERROR(trace, "%s Command [%s] is not a supported command", rcToMsgId(TASK_COMMAND_NOT_SUPPORTED),
                  request.command.c_str().get());
      rc = notSupported(request);
    }
  }
  if (command != nullptr) {
    TRACE_DETAIL(trace, "Going to run command %s", request.command.c_str().get());
    rc = dispatch(*command, request);
  }
  request.ReturnStatus(rc);
  return rc;
}

TASK_RC processAsyncTask(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  const Command* const command = findCommand(request.command);
  const TASK_RC rc =
      command != nullptr && command->answer == Command::kQueued ? runCommandTask(*command, request) : TASK_OK;
  TRACE_DETAIL(trace, "Return code is %d", rc);
  return rc;
}

void* executor_thread(void*) {
  const Trace trace(traceUnit);
  for (;;) {
    std::optional<TaskQueueElem> request = takeTask();
    if (!request) continue;
    try {
      const TASK_RC rc = processAsyncTask(*request);
      request->returnAsyncStatus(rc);
    } catch (...) {
      VMQ::traceCurrentException(trace, "reporting the end of a task");
    }
  }
}

void TEST_resetTaskManager() {
  initialized = 0;
  commands.clear();
  depotDir = String();
}
