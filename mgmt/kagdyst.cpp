#include "mgmt/kagdyst.h"

using VMQ::Trace;

vmq_kagdyst_manager* vmq_kagdyst_static_manager = nullptr;

namespace {
RAS1_Unit traceUnit{"mgmt/kagdyst"};
}

void vmq_kagdyst_agent::TakeSampleConstructor() {
  const Trace trace(traceUnit);
}

void vmq_kagdyst_agent::TakeSample() {
  const Trace trace(traceUnit);
}

void vmq_kagdyst_agent::TakeSampleDestructor() {
  const Trace trace(traceUnit);
}

unsigned vmq_kagdyst_init() {
  const Trace trace(traceUnit);
  return VMQ::registerTable(vmq_kagdyst_static_manager, vmq_kagdyst_application, vmq_kagdyst_table);
}
