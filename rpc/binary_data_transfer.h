#pragma once
// Stores pushed files under the agent depot.

#include <cstdint>

#include "rpc/data_block.h"

struct rpc__binding;

/// The manager routine of operation 0: stores one chunk of a file. `fileName` is the file's path relative to the depot,
/// of at most 255 characters, with "\" or "/" between its components; a text of 255 characters has no end. Chunk 1
/// makes the file anew, any other is appended. Of the blocks those from 0 to `lastBlockIndex` are written, none when it
/// is negative; REQUIRES: there are as many. The caller, `firstText` and `firstInteger` are not looked at.
///
/// `*status` becomes
///   0  stored, and readable, writable and executable for owner and group (where that, or the conversion of line ends,
///      has failed: stored all the same)
///   1  there is no usable depot
///   3  the path is longer than 1024 characters; its directory exists by then
///   4  the file could not be opened, or its name has a ".." component (then no directory has been made), or something
///      unexpected has happened
///   5  not everything could be written: the file has what came before. After a failed write it stays open, which is
///      kept on purpose; after a block of an impossible length it does not.
///   6  the directory could not be made
///
/// A file whose path holds "install.sh", "DeployLnk.sh" or ".mdl" anywhere is converted (rpc/dos_to_unix.h) after each
/// chunk. Never throws. For any thread; chunks of one file are sent one after the other.
void BinaryDataTransfer(rpc__binding* caller, const char* firstText, const char* fileName, int32_t firstInteger,
                        int32_t chunkNumber, int32_t lastBlockIndex, const DataBlock* blocks, uint32_t* status);
