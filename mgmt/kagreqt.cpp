#include "mgmt/kagreqt.h"

#include <cstring>

#include "tasks/task_manager.h"

using VMQ::String;
using VMQ::Trace;

vmq_kagreqt_manager* vmq_kagreqt_static_manager = nullptr;

namespace {

RAS1_Unit traceUnit{"mgmt/kagreqt"};

/// The columns that a query may give a command's parameters in. The others are outputs, or this agent's own.
constexpr struct {
  const char* column;
  String TaskQueueElem::*parameter;
} kParameters[] = {
    {"TRANSID", &TaskQueueElem::transid},     {"COMMAND", &TaskQueueElem::command},
    {"PRODUCT", &TaskQueueElem::product},     {"CONTEXT", &TaskQueueElem::context},
    {"OPTIONAL", &TaskQueueElem::optional},   {"DACONFIG", &TaskQueueElem::daconfig},
    {"DASCRIPT", &TaskQueueElem::dascript},   {"VERSION", &TaskQueueElem::version},
    {"TARGETMSN", &TaskQueueElem::targetmsn},
};

}  // namespace

void vmq_kagreqt_agent::TakeSampleConstructor() {
  const Trace trace(traceUnit);
  element_.originnode = String(IRA_GetOriginnode());
  FLT1_FILTERINFO predicate;
  while (GetFilterInfo(&predicate) == 0) {
    for (const auto& [column, parameter] : kParameters) {
      if (std::strcmp(predicate.column, column) == 0)
        element_.*parameter = String(predicate.value, predicate.value_length);
    }
  }
}

void vmq_kagreqt_agent::TakeSample() {
  const Trace trace(traceUnit);
  try {
    (void)runTask(element_);  // the code is in the row
    vmq_kagreqt_data_t answer = element_.row;
    (void)AddData(&answer, 1);  // the framework knows what it could not insert
  } catch (...) {
    VMQ::traceCurrentException(trace, "answering a request");
  }
}

void vmq_kagreqt_agent::TakeSampleDestructor() {
  const Trace trace(traceUnit);
}

unsigned vmq_kagreqt_init() {
  const Trace trace(traceUnit);
  return VMQ::registerTable(vmq_kagreqt_static_manager, vmq_kagreqt_application, vmq_kagreqt_table);
}
