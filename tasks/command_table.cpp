#include "tasks/command_table.h"

#include <iterator>

#include "tasks/da_config.h"
#include "tasks/install.h"
#include "tasks/start_stop.h"
#include "tasks/two_way_translator.h"
#include "tasks/uninstall.h"
#include "util/current_exception.h"
#include "util/trace.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/command_table"};

// ---- what a row runs, where it takes more than a task's name ------------------------------------------------------

// Only START takes the instance name as it is; STOP and RESTART always look it up. Kept on purpose.
TASK_RC start(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  const String instance =
      request.optional == "INSTANCE" ? request.targetmsn : getInstanceName(request.product, request.targetmsn);
  return startAgent(request.product, instance, &request);
}

TASK_RC stop(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  return stopAgent(request.product, getInstanceName(request.product, request.targetmsn), &request);
}

TASK_RC restart(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  return restartAgent(request.product, getInstanceName(request.product, request.targetmsn), &request);
}

TASK_RC configure(TaskQueueElem& request) {
  const Trace trace(traceUnit);
  return isDataAgent(request.product) ? setDaconfig(request) : setConfig(request);
}

// ---- the table -----------------------------------------------------------------------------------------------------

constexpr RequiredParameter kProduct{"PRODUCT", &TaskQueueElem::product, TASK_NO_PRODUCT};
constexpr RequiredParameter kVersion{"VERSION", &TaskQueueElem::version, TASK_NO_VERSION};
constexpr RequiredParameter kContext{"CONTEXT", &TaskQueueElem::context, TASK_NO_CONTEXT};
constexpr RequiredParameter kTargetmsn{"TARGETMSN", &TaskQueueElem::targetmsn, TASK_NO_TARGETMSN};

constexpr auto kQueued = Command::kQueued;
constexpr auto kAtOnce = Command::kAtOnce;
constexpr auto kNothing = ForDataAgent::kNothing;
constexpr auto kNoChecks = ForDataAgent::kNoChecks;
constexpr auto kRefused = ForDataAgent::kRefused;

// clang-format off
constexpr Command kCommands[] = {
    {"START",            kQueued, kNothing,  {kProduct},                     start,                       TASK_STARTSTOP_NOT_STARTED},
    {"STOP",             kQueued, kNothing,  {kProduct},                     stop,                        TASK_STARTSTOP_NOT_STARTED},
    {"RESTART",          kQueued, kNothing,  {kProduct},                     restart,                     TASK_STARTSTOP_NOT_STARTED},
    {"INSTALL",          kQueued, kNothing,  {kProduct, kVersion, kContext}, install,                     TASK_INSTALL_NOT_STARTED},
    {"UNINSTALL",        kQueued, kNothing,  {kProduct},                     uninstall,                   TASK_UNINSTALL_NOT_STARTED},
    {"GETCONFIG",        kAtOnce, kNothing,  {kProduct},                     getConfig,                   TASK_TRANSLATOR_NOT_STARTED},
    {"SETCONFIG",        kQueued, kNoChecks, {kProduct, kContext},           configure,                   TASK_TRANSLATOR_NOT_STARTED},
    // It has no code for a task that could not start: whatever went wrong, the install is not known to be complete.
    {"COMPLETE_INSTALL", kAtOnce, kNothing,  {},                             completeInstallAfterRestart, TASK_INSTALL_FAILED},
    {"REMOVEINSTANCE",   kQueued, kRefused,  {kProduct, kTargetmsn},         removeInstance,              TASK_TRANSLATOR_NOT_STARTED},
};
// clang-format on
static_assert(std::size(kCommands) == 9);

}  // namespace

std::span<const Command> commandTable() {
  return kCommands;
}

const Command* findCommand(const String& name) {
  const Trace trace(traceUnit);
  for (const Command& command : kCommands) {
    if (name == command.name) return &command;
  }
  return nullptr;
}

bool isDataAgent(const String& productCode) {
  const Trace trace(traceUnit);
  String lowerCase(productCode);
  lowerCase.toLower();
  return lowerCase == "um";
}

TASK_RC runCommandTask(const Command& command, TaskQueueElem& request) {
  const Trace trace(traceUnit);
  try {
    return command.run(request);
  } catch (...) {
    VMQ::traceCurrentException(trace, command.name);
  }
  try {
    request.retmsgparm = request.command + "," + request.product;
    request.retmsgid = String(rcToMsgId(command.couldNotStart));
  } catch (...) {
    // Without memory the code alone must do.
    VMQ::traceCurrentException(trace, "writing the message of a failed task");
  }
  return command.couldNotStart;
}
