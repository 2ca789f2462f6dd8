#include "mgmt/kinagt.h"

using VMQ::Trace;

vmq_kinagt_manager* vmq_kinagt_static_manager = nullptr;

namespace {
RAS1_Unit traceUnit{"mgmt/kinagt"};
}

void vmq_kinagt_agent::TakeSampleConstructor() {
  const Trace trace(traceUnit);
}

void vmq_kinagt_agent::TakeSample() {
  const Trace trace(traceUnit);
}

void vmq_kinagt_agent::TakeSampleDestructor() {
  const Trace trace(traceUnit);
}

unsigned vmq_kinagt_init() {
  const Trace trace(traceUnit);
  return VMQ::registerTable(vmq_kinagt_static_manager, vmq_kinagt_application, vmq_kinagt_table);
}
