#pragma once
// The packet side of BinaryDataTransfer.

#include "rpc.h"

/// Server stub of operation 0: takes the request apart, calls BinaryDataTransfer of the manager entry-point vector (a
/// QOR_Agent_v1_mgr_epv) and replies with its status. Raises rpc__fault_invalid_bound, without a call and before any
/// memory is taken, when the actual count exceeds the maximum count, when the last block index is not below the actual
/// count, and when the packet is shorter than its counts say; rpc__fault_no_memory without memory; and
/// rpc__fault_unspecified where the runtime's conversions cannot be made ready. The bytes of the blocks are never
/// translated, and what stands behind the last block is ignored.
rpc__reply BinaryDataTransfer_ssr(const rpc__call& call);
