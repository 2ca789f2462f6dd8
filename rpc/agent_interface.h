#pragma once
// The remote interface through which the management server pushes files to this machine.

/// Registers the interface QOR_Agent_v1 with the host's remote-procedure runtime; 0 on success. Once, for the entry
/// point. Not built yet: traces that file transfer is not available and returns ENOSYS.
unsigned QOR_NCS_RegisterAgentInterface();
