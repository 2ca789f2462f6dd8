#pragma once
// Line ends of pushed scripts and model files.

#include <cstdint>

#include "util/string.h"

/// Removes every carriage return and every control-Z from a file, wherever they stand. The file gets mode 0770. 0, or
/// -1 when that fails, with a trace of the reason: the file is then as it was. Two failures come later: after that of
/// the hard link the file is missing, and its converted contents are in the work file; after that of removing the work
/// file the file is converted, and the work file a second name of it.
///
/// The work file is "/tmp/.vmqtemp" in the installation home, or ".vmqtemp" in the current directory when there is no
/// home. It has to be on the file system of the converted file, since it becomes that file. One conversion runs at a
/// time; others wait for it.
int32_t convertDOS2Unix(VMQ::String path);
