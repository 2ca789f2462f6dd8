#pragma once
// The trace line that tells what a failed system call said.

#include <system_error>

#include "util/trace.h"

// generic_category, because strerror shares one buffer among threads on some platforms.
#define TRACE_ERRNO(trace, error) \
  TRACE_ERROR(trace, "Error occurred. ERRNO:%d %s", error, std::generic_category().message(error).c_str())
