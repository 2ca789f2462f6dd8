#pragma once
// Tracing for every routine of the component: entry and exit by the life of an object, lines in between by macros that
// compute their arguments only when somebody wants the line.
//
//   namespace { RAS1_Unit traceUnit{"tasks/start_stop"}; }
//   ...
//   const Trace trace(traceUnit);
//   TRACE_DETAIL(trace, "Path [%s] exists", path.c_str().get());

#include <cerrno>

#include "ras1.h"

namespace VMQ {

class Trace {
 public:
  explicit Trace(RAS1_Unit& unit, const char* function = __builtin_FUNCTION(), int line = __builtin_LINE())
      : unit_(unit), function_(function), line_(line) {
    if (RAS1_Enabled(unit_, RAS1_EVENT)) RAS1_Event(&unit_, RAS1_ENTRY, line_, function_);
  }
  ~Trace() {
    if (!RAS1_Enabled(unit_, RAS1_EVENT)) return;
    const int error = errno;  // the result of many a routine
    RAS1_Event(&unit_, RAS1_EXIT, line_, function_);
    errno = error;
  }
  Trace(const Trace&) = delete;
  Trace& operator=(const Trace&) = delete;

  [[nodiscard]] RAS1_Unit& unit() const { return unit_; }
  [[nodiscard]] const char* function() const { return function_; }

 private:
  RAS1_Unit& unit_;
  const char* const function_;
  const int line_;
};

}  // namespace VMQ

// Macros, because the line number and the unevaluated arguments must come from the caller.
#define TRACE_AT_LEVEL(trace, level, ...)                                                                   \
  do {                                                                                                      \
    if (RAS1_Enabled((trace).unit(), level))                                                                \
      RAS1_Printf(&(trace).unit(), level, __LINE__, (trace).function(), __VA_ARGS__);                       \
  } while (false)
#define TRACE_DETAIL(trace, ...) TRACE_AT_LEVEL(trace, RAS1_DETAIL, __VA_ARGS__)
#define TRACE_ERROR(trace, ...) TRACE_AT_LEVEL(trace, RAS1_ERROR, __VA_ARGS__)
