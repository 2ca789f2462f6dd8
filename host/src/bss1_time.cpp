// Clocks, sleep and timed waits.

#include <time.h>

#include <algorithm>
#include <cerrno>

#include "bss1.h"
#include "seam.h"

namespace {

namespace seam = vmqhost::seam;

constexpr int64_t kMillisecondsPerSecond = 1000;
constexpr int64_t kNanosecondsPerMillisecond = 1'000'000;
/// Longer waits are cut to this (about 30 years), so that a deadline never overflows.
constexpr int64_t kLongestWaitMilliseconds = int64_t{1'000'000} * 1'000'000;
/// What a wait gets of real time while waits are recorded.
constexpr int64_t kRecordedWaitMilliseconds = 5;

/// REQUIRES: a clock that every supported system has, so that reading it cannot fail.
timespec now(clockid_t clock) {
  timespec time{};
  (void)clock_gettime(clock, &time);
  return time;
}

int64_t toMilliseconds(const timespec& time) {
  return time.tv_sec * kMillisecondsPerSecond + time.tv_nsec / kNanosecondsPerMillisecond;
}

timespec monotonicDeadline(int64_t milliseconds) {
  timespec deadline = now(CLOCK_MONOTONIC);
  deadline.tv_sec += milliseconds / kMillisecondsPerSecond;
  deadline.tv_nsec += milliseconds % kMillisecondsPerSecond * kNanosecondsPerMillisecond;
  if (deadline.tv_nsec >= kMillisecondsPerSecond * kNanosecondsPerMillisecond) {
    ++deadline.tv_sec;
    deadline.tv_nsec -= kMillisecondsPerSecond * kNanosecondsPerMillisecond;
  }
  return deadline;
}

/// Against the monotonic clock: a wall clock that is set must neither end nor prolong a wait.
int waitOnce(pthread_cond_t* condition, pthread_mutex_t* mutex, int64_t milliseconds) {
  const timespec deadline = monotonicDeadline(std::clamp<int64_t>(milliseconds, 0, kLongestWaitMilliseconds));
  return pthread_cond_clockwait(condition, mutex, CLOCK_MONOTONIC, &deadline);
}

}  // namespace

int64_t BSS1_GetTime() {
  const int64_t ahead = seam::wallClockAhead.load(std::memory_order_relaxed);
  return (toMilliseconds(now(CLOCK_REALTIME)) + ahead) / kMillisecondsPerSecond;
}

int64_t BSS1_GetElapsed() {
  return toMilliseconds(now(CLOCK_MONOTONIC)) + seam::elapsedClockAhead.load(std::memory_order_relaxed);
}

void BSS1_Sleep(unsigned seconds) {
  if (seam::sleepsRecorded.load(std::memory_order_relaxed)) [[unlikely]]
    return seam::recordSleep(seconds);
  const timespec deadline = monotonicDeadline(int64_t{seconds} * kMillisecondsPerSecond);
  while (clock_nanosleep(CLOCK_MONOTONIC, TIMER_ABSTIME, &deadline, nullptr) == EINTR) {
  }
}

int BSS1_TimedWait(pthread_cond_t* condition, pthread_mutex_t* mutex, int64_t milliseconds) {
  if (!seam::waitsRecorded.load(std::memory_order_relaxed)) [[likely]]
    return waitOnce(condition, mutex, milliseconds);
  const int result = waitOnce(condition, mutex, std::min(milliseconds, kRecordedWaitMilliseconds));
  if (result == ETIMEDOUT) seam::recordTimedOutWait(milliseconds);
  return result;
}
