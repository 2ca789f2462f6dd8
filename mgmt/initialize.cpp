#include "mgmt/initialize.h"

#include "bss1.h"
#include "mgmt/kagdyst.h"
#include "mgmt/kagreqt.h"
#include "mgmt/kinagt.h"
#include "rpc/agent_interface.h"
#include "tasks/task_manager.h"
#include "util/corvel_home.h"
#include "util/current_exception.h"
#include "util/string.h"
#include "util/trace.h"

using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"mgmt/initialize"};

constexpr char kHomeVariable[] = "CORVELHOME";

/// Runs one step of the initialization; one that fails does not stop those after it.
template <class Step>
void attempt(const Trace& trace, const char* activity, Step step) {
  try {
    (void)step();  // a status is traced by whoever knows what it means; the entry point always succeeds
  } catch (...) {
    VMQ::traceCurrentException(trace, activity);
  }
}

/// Chooses the text conversions' locale while there is one thread only; later conversions just read it.
void convertFirstText() {
  (void)VMQ::String("first").c_str();
}

}  // namespace

const char* Initialize_Corvel_Home() {
  const Trace trace(traceUnit);
  VMQ_CORVELHOME = BSS1_GetEnv(kHomeVariable, nullptr);
  if (VMQ_CORVELHOME == nullptr) TRACE_ERROR(trace, "No value for %s - MANAGEMENT FUNCTIONS DISABLED", kHomeVariable);
  return VMQ_CORVELHOME;
}

unsigned Initialize_Mgmt_Functions() {
  const Trace trace(traceUnit);
  if (Initialize_Corvel_Home() == nullptr) return 0;
  attempt(trace, "converting the first text", convertFirstText);
  TRACE_DETAIL(trace, "Calling VMQ Table initialization");
  attempt(trace, "registering table KAGREQT", vmq_kagreqt_init);
  attempt(trace, "registering table KINAGT", vmq_kinagt_init);
  attempt(trace, "registering table KAGDYST", vmq_kagdyst_init);
  TRACE_DETAIL(trace, "Calling VMQ Task Manager initialization");
  attempt(trace, "initializing the task manager", vmq_taskmgr_init);
  TRACE_DETAIL(trace, "Calling VMQ RPC calls initialization");
  attempt(trace, "registering the file-transfer interface", QOR_NCS_RegisterAgentInterface);
  TRACE_DETAIL(trace, "Done calling VMQ initialization routines");
  return 0;
}
