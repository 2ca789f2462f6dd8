#include "rpc/agent_interface.h"

#include <cerrno>

#include "util/trace.h"

namespace {
RAS1_Unit traceUnit{"rpc/agent_interface"};
}

unsigned QOR_NCS_RegisterAgentInterface() {
  const VMQ::Trace trace(traceUnit);
  TRACE_ERROR(trace, "File transfer is not available: interface %s is not built yet", "QOR_Agent_v1");
  return ENOSYS;
}
