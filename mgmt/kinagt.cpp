#include "mgmt/kinagt.h"

#include <cstring>

#include "mgmt/kinagt_sampling.h"
#include "util/string.h"

using VMQ::String;
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
  try {
    const String originNode(IRA_GetOriginnode());
    String prodDesc;
    FLT1_FILTERINFO predicate;
    while (GetFilterInfo(&predicate) == 0) {
      if (std::strcmp(predicate.column, "PRODDESC") != 0) continue;
      prodDesc = String(predicate.value, predicate.value_length);
      prodDesc.trim();
      TRACE_DETAIL(trace, "Product Description is: %s", prodDesc.c_str().get());
    }
    sampleInventory(originNode, prodDesc, [this](vmq_kinagt_data_t& row) {
      (void)AddData(&row, 1);  // the framework knows what it could not insert
    });
  } catch (...) {
    VMQ::traceCurrentException(trace, "listing the installed products");
  }
}

void vmq_kinagt_agent::TakeSampleDestructor() {
  const Trace trace(traceUnit);
}

unsigned vmq_kinagt_init() {
  const Trace trace(traceUnit);
  return VMQ::registerTable(vmq_kinagt_static_manager, vmq_kinagt_application, vmq_kinagt_table);
}
