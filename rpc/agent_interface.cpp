#include "rpc/agent_interface.h"

#include "rpc/binary_data_transfer.h"
#include "rpc/binary_data_transfer_stub.h"
#include "util/trace.h"

namespace {

RAS1_Unit traceUnit{"rpc/agent_interface"};

constexpr rpc__server_stub stubs[] = {BinaryDataTransfer_ssr};

constexpr QOR_Agent_v1_mgr_epv managerRoutines{BinaryDataTransfer};

}  // namespace

constinit const rpc__if_spec QOR_Agent_v1_if_spec{
    "QOR_Agent",
    {{0xd9, 0x8c, 0xf2, 0xa5, 0x2f, 0xae, 0x4d, 0x68, 0xb0, 0x05, 0x64, 0x6f, 0xf8, 0x3e, 0xed, 0x82}},
    /*version=*/1,
    QOR_Agent_v1_server_epv_locator};

rpc__server_epv QOR_Agent_v1_server_epv_locator() {
  return {stubs, sizeof stubs / sizeof *stubs};
}

uint32_t QOR_NCS_RegisterAgentInterface() {
  const VMQ::Trace trace(traceUnit);
  uint32_t status = 0;
  rpc__register_mgr(&rpc__nil_type, &QOR_Agent_v1_if_spec, &managerRoutines, &status);
  if (status != 0) TRACE_ERROR(trace, "Files cannot be pushed: the interface is not registered, status %u", status);
  return status;
}
