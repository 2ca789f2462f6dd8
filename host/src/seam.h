#pragma once
// Where the services ask whether a test has taken their place (test_seam.h). One relaxed load when none has.

#include <atomic>
#include <cstdarg>
#include <cstdint>

#include "ras1.h"

namespace vmqhost::seam {

// ---- trace -----------------------------------------------------------------------------------------------------

extern constinit std::atomic<bool> captureActive;

/// Keeps a line when a capture is active.
[[gnu::format(printf, 4, 0)]] void captureLine(const RAS1_Unit& unit, RAS1_Level level, const char* function,
                                               const char* format, va_list arguments);

// ---- passing of time -------------------------------------------------------------------------------------------

extern constinit std::atomic<bool> sleepsRecorded;
extern constinit std::atomic<bool> waitsRecorded;
/// How far the clocks have been moved forward, in milliseconds.
extern constinit std::atomic<int64_t> wallClockAhead;
extern constinit std::atomic<int64_t> elapsedClockAhead;  ///< never taken back, because that clock never steps back

void recordSleep(unsigned seconds);
void recordTimedOutWait(int64_t milliseconds);

// ---- failing calls ---------------------------------------------------------------------------------------------

extern constinit std::atomic<bool> failureArmed;
bool takeFailure(const char* service, int* status);

/// True when this call of the service is the one that shall fail, with `*status`.
inline bool fails(const char* service, int* status) {
  if (!failureArmed.load(std::memory_order_relaxed)) [[likely]]
    return false;
  return takeFailure(service, status);
}

}  // namespace vmqhost::seam
