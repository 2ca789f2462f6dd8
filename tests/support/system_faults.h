#pragma once
// Makes system functions fail when the component calls them. A test program that links vmq_system_faults has the calls
// in its own objects come here first; the host library and the C library are not affected.

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
  kWaitpid,  ///< with ECHILD the child is gone all the same, as when the host has reaped it
  kPoll,
  kRead,
  kWrite,
  kWritev,
  kWritevShort,  ///< it does not fail, but writes only half of its first piece, as the system may
  kFcntl,
  kTimedWait,  ///< BSS1_TimedWait
  kDup3,       ///< these three between clone and exec
  kCloseRange,
  kExecve,
  // Files and directories.
  kAccess,
  kStat,   ///< lstat and fstat too
  kMkdir,  ///< with EEXIST it is made all the same, as when somebody else was faster
  kChmod,
  kFchmod,
  kFchown,
  kUnlink,
  kLink,
  kRename,
  kRealpath,
  kMkostemp,
  kFsync,
  kUname,
  kOpen,
  kClose,  ///< it is closed all the same; so is a stream
  kFopen,
  kFdopen,
  kFseek,
  kFtell,
  kFread,   ///< reading a character too; what the stream has read ahead is gone. The error is EISDIR
  kFwrite,  ///< writing a character and flushing too. The error is ENOSPC
  kFclose,
  kAllocate,  ///< operator new throws; malloc, calloc and realloc give a null pointer
  kStrdup,
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

/// While it lives, calls of this thread neither fail nor count: those of the test itself.
class SparedThread {
 public:
  SparedThread();
  ~SparedThread();
  SparedThread(const SparedThread&) = delete;
  SparedThread& operator=(const SparedThread&) = delete;
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
