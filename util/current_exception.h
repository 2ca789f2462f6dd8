#pragma once
// What is said about an exception that must not go any further.

#include <exception>

#include "util/index_out_of_bounds_exception.h"
#include "util/trace.h"

namespace VMQ {

/// Traces, at the error level, the exception being handled and what was being done. REQUIRES: called from a catch
/// block. Never throws.
inline void traceCurrentException(const Trace& trace, const char* activity) noexcept {
  try {
    throw;
  } catch (const std::exception& exception) {
    TRACE_ERROR(trace, "Exception while %s: %s", activity, exception.what());
  } catch (const IndexOutOfBoundsException& exception) {
    TRACE_ERROR(trace, "Exception while %s: %s", activity, exception.getText());
  } catch (...) {
    TRACE_ERROR(trace, "Exception of unknown kind while %s", activity);
  }
}

}  // namespace VMQ
