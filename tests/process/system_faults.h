#pragma once
// Makes system functions fail when the component calls them. The test program is linked so that the calls in its own
// objects come here first; the host library and the C library are not affected.

#include <sys/types.h>

#include <utility>
#include <vector>

enum class SystemCall {
  kPipe2,
  kMmap,
  kClone,
  kEventfd,
  kPthreadCreate,
  kPthreadMutexInit,
  kPthreadCondInit,
  kPthreadMutexLock,    ///< of the mutex initialised last
  kPthreadMutexUnlock,  ///< of the mutex initialised last; it is unlocked all the same
  kPthreadCondSignal,   ///< it is signalled all the same
  kKill,
  kWaitid,
  kWaitpid,
  kPoll,
  kRead,
  kWrite,
  kFcntl,
  kStrdup,
  kTimedWait,  ///< BSS1_TimedWait
  kDup3,       ///< these two between clone and exec
  kCloseRange,
  kCount
};

/// While it lives, calls `nth` to `nth + times - 1` of a function, counted from now, fail with `error`. One for each
/// function at a time.
class SystemFault {
 public:
  SystemFault(SystemCall call, int error, int nth = 1, int times = 1);
  ~SystemFault();
  SystemFault(const SystemFault&) = delete;
  SystemFault& operator=(const SystemFault&) = delete;
  [[nodiscard]] bool happened() const;

 private:
  const SystemCall call_;
};

/// Every kill of the component while it lives: target and signal, in order.
class KillRecord {
 public:
  KillRecord();
  ~KillRecord();
  KillRecord(const KillRecord&) = delete;
  KillRecord& operator=(const KillRecord&) = delete;
  [[nodiscard]] std::vector<std::pair<pid_t, int>> kills() const;
};
