#pragma once
// What has to become of a packet of BinaryDataTransfer, found out by a second reading, and a manager that checks that
// its arguments are what the packet says.

#include <cstdint>
#include <string_view>

#include "rpc.h"
#include "rpc/agent_interface.h"

namespace fuzz {

/// What fuzz/limited_memory.cpp gives a call at most.
constexpr uint32_t memoryForCalls = 1 << 20;

struct TransferModel {
  std::string_view packet;
  rpc__drep sender;
  uint32_t status;        ///< what the manager answers
  uint32_t managerFault;  ///< what it raises instead, unless 0
  bool called = false;    ///< the manager has been
};

/// The call under way.
extern TransferModel transfer;

/// Checks its arguments against `transfer`. Touches no file.
extern const QOR_Agent_v1_mgr_epv checkingManager;

/// The fault that the packet of `transfer` has to raise, 0 for none.
uint32_t expectedFault();
/// Whether the manager has to be called for it.
bool expectsCall();

}  // namespace fuzz
