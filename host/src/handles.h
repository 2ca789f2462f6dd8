#pragma once
// Handles of requests and tables: which exist and how often each is in use.

#include "bxira.h"

namespace vmqhost {

/// A new handle, never 0 and never one that still names something. Throws std::bad_alloc.
RES1_Handle newHandle();

/// The named object is gone; its handle goes with its last use.
void retireHandle(RES1_Handle handle);

}  // namespace vmqhost
