#pragma once
// The remote interface QOR_Agent_v1, through which the management server pushes files to this machine.

#include <cstdint>

#include "rpc.h"
#include "rpc/data_block.h"

/// d98cf2a5-2fae-4d68-b005-646ff83eed82, version 1. Its one operation, number 0, is BinaryDataTransfer.
extern const rpc__if_spec QOR_Agent_v1_if_spec;

/// What the stubs of the interface call: by default rpc/binary_data_transfer.h.
struct QOR_Agent_v1_mgr_epv {
  void (*BinaryDataTransfer)(rpc__binding* caller, const char* firstText, const char* fileName, int32_t firstInteger,
                             int32_t chunkNumber, int32_t lastBlockIndex, const DataBlock* blocks, uint32_t* status);
};

/// The server stubs of the interface.
rpc__server_epv QOR_Agent_v1_server_epv_locator();

/// Registers the interface with the host's remote-procedure runtime. Returns the runtime's status, 0 on success. Once,
/// for the entry point.
uint32_t QOR_NCS_RegisterAgentInterface();
