#include "tasks/start_stop.h"

#include <unistd.h>

#include <cstring>

#include "bss1.h"
#include "tasks/command_report.h"
#include "util/corvel_home.h"
#include "util/startup_db.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/start_stop"};

/// The user that the run-as database names for an instance; empty for none.
String runAsUser(const String& productCode, const String& instanceName) {
  const Trace trace(traceUnit);
  const VMQ::StartupDB database(String(VMQ_CORVELHOME) + "/config/" + VMQ::Util::getHostName() + "_vmqrunas.cfg");
  const VMQ::AgentEntry* const agent = database.getAgent(productCode);
  const VMQ::InstanceEntry* const instance = agent == nullptr ? nullptr : agent->getInstance(instanceName);
  return instance == nullptr ? String() : instance->getUser();
}

String controlScriptCommand(const String& action, const String& productCode, const String& instanceName) {
  const Trace trace(traceUnit);
  const String home(VMQ_CORVELHOME);
  const String user = runAsUser(productCode, instanceName);
  String command;
  if (user.length() > 0) command = String("/usr/bin/") + "su - " + user + " -c \"";
  // Two blanks follow the script's name. Kept on purpose.
  command = command + home + "/" + "bin" + "/" + "CorvelAgent " + " " + "-h " + home + " ";
  if (action == "STOP") command = command + "-c ";
  if (instanceName.length() > 0) command = command + "-o " + instanceName + " ";
  command = command + (action == "START" ? "start" : action == "STOP" ? "stop" : "oh-oh-not-supported");
  command = command + " " + productCode;
  if (user.length() > 0) command = command + "\"";
  return command;
}

constexpr CommandReport START_STOP_REPORT = {.not_started_rc = TASK_STARTSTOP_NOT_STARTED,
                                             .not_started_text = "Failed to start command",
                                             .failed_rc = TASK_STARTSTOP_FAILED,
                                             .failed_text = "Bad return code from start/stop command",
                                             .failed_source = nullptr,
                                             .return_code = ReturnCodeForm::kAbsent};

}  // namespace

TASK_RC startAgent(const String& productCode, const String& instanceName, TaskQueueElem* request) {
  const Trace trace(traceUnit);
  return startstopAgent("START", productCode, instanceName, request);
}

TASK_RC stopAgent(const String& productCode, const String& instanceName, TaskQueueElem* request) {
  const Trace trace(traceUnit);
  return startstopAgent("STOP", productCode, instanceName, request);
}

TASK_RC restartAgent(const String& productCode, const String& instanceName, TaskQueueElem* request) {
  const Trace trace(traceUnit);
  // An agent that could not be stopped, or did not run, is started all the same.
  (void)startstopAgent("STOP", productCode, instanceName, request);
  return startstopAgent("START", productCode, instanceName, request);
}

TASK_RC startstopAgent(const String& action, const String& productCode, const String& instanceName,
                       TaskQueueElem* request) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Attempting to [%s] product code [%s] instance [%s]", action.c_str().get(),
               productCode.c_str().get(), instanceName.c_str().get());
  const String command = controlScriptCommand(action, productCode, instanceName);

  // A started agent traces to where its own configuration says, and takes its host name from there.
  char noTraceLog[] = "KBB_RAS1_LOG=";
  char* startEnvironment[] = {noTraceLog, nullptr};
  char** environment = nullptr;
  if (action == "START") {
    environment = startEnvironment;
    TRACE_DETAIL(trace, "about to invoke unsetenv()");
    char hostName[] = "BXIRA_HOSTNAME";
    unsetEnv(hostName);
  }

  CommandOutput output;
  const TASK_RC rc =
      runAndReport(START_STOP_REPORT, command, String(""), /*nonBlocking=*/false, environment, request, output);
  TRACE_DETAIL(trace, "Exit with return code [%d]", rc);
  return rc;
}

void unsetEnv(char* name) {
  const Trace trace(traceUnit);
  BSS1_Lock* const lock = BSS1_EnvironmentLock();
  if (const int rc = BSS1_GetLock(lock); rc != 0) {
    TRACE_ERROR(trace, "Env variable [%s] stays, the environment lock could not be taken, return code %d", name, rc);
    return;
  }
  const size_t length = std::strlen(name);
  char** entry = environ;
  while (entry != nullptr && *entry != nullptr &&
         !(std::strncmp(*entry, name, length) == 0 && ((*entry)[length] == '=' || (*entry)[length] == '\0')))
    ++entry;
  if (entry != nullptr && *entry != nullptr) {
    // At the error level although nothing failed. Kept on purpose.
    TRACE_ERROR(trace, "found a match for env variable [%s] ", *entry);
    do {
      entry[0] = entry[1];
    } while (*entry++ != nullptr);
  }
  (void)BSS1_ReleaseLock(lock);  // held by this thread: nothing is left to do about a failure
}

void removeChar(String& text, char character) {
  const Trace trace(traceUnit);
  unsigned position = 0;
  while (position < text.length() && (position = text.find(character, position)) != String::NPOS)
    text.erase(position, 1);
}
