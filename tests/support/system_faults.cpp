#include "tests/support/system_faults.h"

#include <fcntl.h>
#include <poll.h>
#include <pthread.h>
#include <sched.h>
#include <signal.h>
#include <stdio_ext.h>
#include <sys/eventfd.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <sys/utsname.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <new>

// The faults of dup3, close_range and execve strike in a child that shares our memory: see process/child_entry.cpp.
#if defined(__clang__)
#define CHILD_CODE __attribute__((disable_sanitizer_instrumentation))
#else
#define CHILD_CODE __attribute__((no_sanitize("address", "thread", "undefined")))
#endif

namespace {

struct Plan {
  int first = 0;  ///< the calls from `first` to below `end` fail; none when `end` is 0
  int end = 0;
  int error = 0;
  int calls = 0;
};
Plan plans[static_cast<int>(SystemCall::kCount)];
constinit thread_local bool spared = false;

/// The error of this call, or 0 when it is not to fail.
CHILD_CODE int strike(SystemCall call) {
  Plan& plan = plans[static_cast<int>(call)];
  if (__atomic_load_n(&plan.end, __ATOMIC_ACQUIRE) == 0 || spared) return 0;
  const int number = __atomic_add_fetch(&plan.calls, 1, __ATOMIC_ACQ_REL);
  return number >= plan.first && number < plan.end ? plan.error : 0;
}

/// For the functions that set errno.
template <typename Real, typename Result>
Result orErrno(SystemCall call, Result failure, Real real) {
  const int error = strike(call);
  if (error == 0) return real();
  errno = error;
  return failure;
}

/// What has happened all the same when it is told to have failed.
template <typename Result>
Result failAfterwards(SystemCall call, Result failure, Result result) {
  const int error = strike(call);
  if (error == 0) return result;
  errno = error;
  return failure;
}

/// What a stream does while its descriptor leads elsewhere: the C library then finds and remembers a true error.
template <typename Real>
auto onBrokenStream(FILE* stream, const char* elsewhere, int flags, Real real) {
  const int descriptor = fileno(stream);
  const int closed_on_exec = (fcntl(descriptor, F_GETFD) & FD_CLOEXEC) != 0 ? O_CLOEXEC : 0;
  const int kept = dup(descriptor);
  const int broken = open(elsewhere, flags | O_CLOEXEC);
  (void)dup2(broken, descriptor);
  const auto result = real();
  const int error = errno;
  (void)dup3(kept, descriptor, closed_on_exec);
  for (const int extra : {kept, broken}) (void)close(extra);
  errno = error;
  return result;
}

/// Reading, which finds a directory. A small file has been read ahead by whoever looked for its end.
template <typename Real>
auto orUnreadable(FILE* stream, Real real) {
  if (strike(SystemCall::kFread) == 0) return real();
  __fpurge(stream);
  return onBrokenStream(stream, "/", O_RDONLY | O_DIRECTORY, real);
}

/// Writing, which finds a full device.
template <typename Real>
auto orFull(FILE* stream, Real real) {
  if (stream == nullptr || strike(SystemCall::kFwrite) == 0) return real();
  return onBrokenStream(stream, "/dev/full", O_WRONLY, [&] {
    const auto result = real();
    (void)fflush(stream);
    return result;
  });
}

std::atomic<pthread_mutex_t*> lastMutex;

std::mutex& killMutex = *new std::mutex;
std::vector<std::pair<pid_t, int>>* recordedKills = nullptr;  // guarded by killMutex

}  // namespace

SystemFault::SystemFault(SystemCall call, int error, int nth, int times) : call_(call) {
  Plan& plan = plans[static_cast<int>(call)];
  plan.first = nth;
  plan.error = error;
  __atomic_store_n(&plan.calls, 0, __ATOMIC_RELAXED);
  __atomic_store_n(&plan.end, nth + times, __ATOMIC_RELEASE);
}

SystemFault::~SystemFault() {
  __atomic_store_n(&plans[static_cast<int>(call_)].end, 0, __ATOMIC_RELEASE);
}

bool SystemFault::happened() const {
  const Plan& plan = plans[static_cast<int>(call_)];
  return __atomic_load_n(&plan.calls, __ATOMIC_ACQUIRE) >= plan.first;
}

SparedThread::SparedThread() {
  spared = true;
}

SparedThread::~SparedThread() {
  spared = false;
}

KillRecord::KillRecord() {
  const std::lock_guard lock(killMutex);
  recordedKills = new std::vector<std::pair<pid_t, int>>;
}

KillRecord::~KillRecord() {
  const std::lock_guard lock(killMutex);
  delete recordedKills;
  recordedKills = nullptr;
}

std::vector<std::pair<pid_t, int>> KillRecord::kills() const {
  const std::lock_guard lock(killMutex);
  return *recordedKills;
}

// The linker takes shared libraries for users of these too, and hidden ones would not do for them.
#pragma GCC visibility push(default)
extern "C" {

// What the linker's --wrap makes of each function: the real one, and the one that is called.
#define WRAP(result, name, ...)      \
  result __real_##name(__VA_ARGS__); \
  result __wrap_##name(__VA_ARGS__)

WRAP(int, pipe2, int ends[2], int flags) {
  return orErrno(SystemCall::kPipe2, -1, [&] { return __real_pipe2(ends, flags); });
}

WRAP(void*, mmap, void* address, size_t length, int protection, int flags, int descriptor, off_t offset) {
  return orErrno(SystemCall::kMmap, MAP_FAILED,
                 [&] { return __real_mmap(address, length, protection, flags, descriptor, offset); });
}

WRAP(int, clone, int (*entry)(void*), void* stack, int flags, void* argument, ...) {
  return orErrno(SystemCall::kClone, -1, [&] { return __real_clone(entry, stack, flags, argument); });
}

WRAP(int, __clone, int (*entry)(void*), void* stack, int flags, void* argument, ...) {
  return orErrno(SystemCall::kClone, -1, [&] { return __real___clone(entry, stack, flags, argument); });
}

WRAP(int, eventfd, unsigned initial, int flags) {
  return orErrno(SystemCall::kEventfd, -1, [&] { return __real_eventfd(initial, flags); });
}

WRAP(int, pthread_create, pthread_t* thread, const pthread_attr_t* attributes, void* (*entry)(void*), void* argument) {
  const int error = strike(SystemCall::kPthreadCreate);
  return error != 0 ? error : __real_pthread_create(thread, attributes, entry, argument);
}

WRAP(int, pthread_mutex_init, pthread_mutex_t* mutex, const pthread_mutexattr_t* attributes) {
  lastMutex = mutex;
  const int error = strike(SystemCall::kPthreadMutexInit);
  return error != 0 ? error : __real_pthread_mutex_init(mutex, attributes);
}

WRAP(int, pthread_cond_init, pthread_cond_t* condition, const pthread_condattr_t* attributes) {
  const int error = strike(SystemCall::kPthreadCondInit);
  return error != 0 ? error : __real_pthread_cond_init(condition, attributes);
}

WRAP(int, pthread_mutex_lock, pthread_mutex_t* mutex) {
  const int error = mutex == lastMutex ? strike(SystemCall::kPthreadMutexLock) : 0;
  return error != 0 ? error : __real_pthread_mutex_lock(mutex);
}

WRAP(int, pthread_mutex_unlock, pthread_mutex_t* mutex) {
  const int error = mutex == lastMutex ? strike(SystemCall::kPthreadMutexUnlock) : 0;
  const int rc = __real_pthread_mutex_unlock(mutex);
  return error != 0 ? error : rc;
}

WRAP(int, pthread_cond_signal, pthread_cond_t* condition) {
  const int error = strike(SystemCall::kPthreadCondSignal);
  const int rc = __real_pthread_cond_signal(condition);
  return error != 0 ? error : rc;
}

WRAP(int, kill, pid_t target, int signal) {
  {
    const std::lock_guard lock(killMutex);
    if (recordedKills != nullptr) recordedKills->emplace_back(target, signal);
  }
  return orErrno(SystemCall::kKill, -1, [&] { return __real_kill(target, signal); });
}

WRAP(int, waitid, idtype_t type, id_t id, siginfo_t* info, int options) {
  return orErrno(SystemCall::kWaitid, -1, [&] { return __real_waitid(type, id, info, options); });
}

WRAP(pid_t, waitpid, pid_t pid, int* status, int options) {
  const int error = strike(SystemCall::kWaitpid);
  if (error == 0) return __real_waitpid(pid, status, options);
  int lost = 0;
  if (error == ECHILD) (void)__real_waitpid(pid, &lost, options);
  errno = error;
  return -1;
}

WRAP(int, poll, pollfd* events, nfds_t count, int timeout) {
  return orErrno(SystemCall::kPoll, -1, [&] { return __real_poll(events, count, timeout); });
}

WRAP(ssize_t, read, int descriptor, void* buffer, size_t length) {
  return orErrno(SystemCall::kRead, ssize_t{-1}, [&] { return __real_read(descriptor, buffer, length); });
}

WRAP(ssize_t, write, int descriptor, const void* buffer, size_t length) {
  return orErrno(SystemCall::kWrite, ssize_t{-1}, [&] { return __real_write(descriptor, buffer, length); });
}

WRAP(ssize_t, writev, int descriptor, const iovec* pieces, int count) {
  if (strike(SystemCall::kWritevShort) != 0) return __real_write(descriptor, pieces->iov_base, pieces->iov_len / 2);
  return orErrno(SystemCall::kWritev, ssize_t{-1}, [&] { return __real_writev(descriptor, pieces, count); });
}

WRAP(int, fcntl, int descriptor, int command, ...) {
  va_list arguments;
  va_start(arguments, command);
  const long argument = va_arg(arguments, long);
  va_end(arguments);
  if (command == F_SETPIPE_SZ) return __real_fcntl(descriptor, command, argument);  // a wish, which may fail unseen
  return orErrno(SystemCall::kFcntl, -1, [&] { return __real_fcntl(descriptor, command, argument); });
}

// ---- files and directories ----------------------------------------------------------------------------------------

WRAP(int, access, const char* path, int mode) {
  return orErrno(SystemCall::kAccess, -1, [&] { return __real_access(path, mode); });
}

WRAP(int, stat, const char* path, struct stat* status) {
  return orErrno(SystemCall::kStat, -1, [&] { return __real_stat(path, status); });
}

WRAP(int, lstat, const char* path, struct stat* status) {
  return orErrno(SystemCall::kStat, -1, [&] { return __real_lstat(path, status); });
}

WRAP(int, fstat, int descriptor, struct stat* status) {
  return orErrno(SystemCall::kStat, -1, [&] { return __real_fstat(descriptor, status); });
}

WRAP(int, mkdir, const char* path, mode_t mode) {
  const int error = strike(SystemCall::kMkdir);
  if (error == 0) return __real_mkdir(path, mode);
  if (error == EEXIST) (void)__real_mkdir(path, mode);
  errno = error;
  return -1;
}

WRAP(int, chmod, const char* path, mode_t mode) {
  return orErrno(SystemCall::kChmod, -1, [&] { return __real_chmod(path, mode); });
}

WRAP(int, fchmod, int descriptor, mode_t mode) {
  return orErrno(SystemCall::kFchmod, -1, [&] { return __real_fchmod(descriptor, mode); });
}

WRAP(int, fchown, int descriptor, uid_t owner, gid_t group) {
  return orErrno(SystemCall::kFchown, -1, [&] { return __real_fchown(descriptor, owner, group); });
}

WRAP(int, unlink, const char* path) {
  return orErrno(SystemCall::kUnlink, -1, [&] { return __real_unlink(path); });
}

WRAP(int, link, const char* from, const char* to) {
  return orErrno(SystemCall::kLink, -1, [&] { return __real_link(from, to); });
}

WRAP(int, rename, const char* from, const char* to) {
  return orErrno(SystemCall::kRename, -1, [&] { return __real_rename(from, to); });
}

WRAP(char*, realpath, const char* path, char* resolved) {
  return orErrno(SystemCall::kRealpath, static_cast<char*>(nullptr), [&] { return __real_realpath(path, resolved); });
}

WRAP(int, mkostemp, char* path, int flags) {
  return orErrno(SystemCall::kMkostemp, -1, [&] { return __real_mkostemp(path, flags); });
}

WRAP(int, fsync, int descriptor) {
  return orErrno(SystemCall::kFsync, -1, [&] { return __real_fsync(descriptor); });
}

WRAP(int, uname, utsname* names) {
  return orErrno(SystemCall::kUname, -1, [&] { return __real_uname(names); });
}

WRAP(int, open, const char* path, int flags, ...) {
  va_list arguments;
  va_start(arguments, flags);
  const mode_t mode = (flags & O_CREAT) != 0 ? va_arg(arguments, mode_t) : 0;
  va_end(arguments);
  return orErrno(SystemCall::kOpen, -1, [&] { return __real_open(path, flags, mode); });
}

WRAP(int, close, int descriptor) {
  return failAfterwards(SystemCall::kClose, -1, __real_close(descriptor));
}

WRAP(FILE*, fopen, const char* path, const char* mode) {
  return orErrno(SystemCall::kFopen, static_cast<FILE*>(nullptr), [&] { return __real_fopen(path, mode); });
}

WRAP(FILE*, fdopen, int descriptor, const char* mode) {
  return orErrno(SystemCall::kFdopen, static_cast<FILE*>(nullptr), [&] { return __real_fdopen(descriptor, mode); });
}

WRAP(int, fseek, FILE* stream, long offset, int from) {
  return orErrno(SystemCall::kFseek, -1, [&] { return __real_fseek(stream, offset, from); });
}

WRAP(long, ftell, FILE* stream) {
  return orErrno(SystemCall::kFtell, -1L, [&] { return __real_ftell(stream); });
}

WRAP(size_t, fread, void* buffer, size_t size, size_t count, FILE* stream) {
  return orUnreadable(stream, [&] { return __real_fread(buffer, size, count, stream); });
}

WRAP(int, getc_unlocked, FILE* stream) {
  return orUnreadable(stream, [&] { return __real_getc_unlocked(stream); });
}

WRAP(size_t, fwrite, const void* data, size_t size, size_t count, FILE* stream) {
  return orFull(stream, [&] { return __real_fwrite(data, size, count, stream); });
}

WRAP(int, putc_unlocked, int character, FILE* stream) {
  const int put = orFull(stream, [&] { return __real_putc_unlocked(character, stream); });
  return ferror(stream) != 0 ? EOF : put;
}

WRAP(int, fflush, FILE* stream) {
  return orFull(stream, [&] { return __real_fflush(stream); });
}

WRAP(int, fclose, FILE* stream) {
  return failAfterwards(SystemCall::kFclose, EOF, __real_fclose(stream));
}

// ---- memory -------------------------------------------------------------------------------------------------------

WRAP(void*, malloc, size_t bytes) {
  return orErrno(SystemCall::kAllocate, static_cast<void*>(nullptr), [&] { return __real_malloc(bytes); });
}

WRAP(void*, calloc, size_t count, size_t bytes) {
  return orErrno(SystemCall::kAllocate, static_cast<void*>(nullptr), [&] { return __real_calloc(count, bytes); });
}

WRAP(void*, realloc, void* block, size_t bytes) {
  return orErrno(SystemCall::kAllocate, static_cast<void*>(nullptr), [&] { return __real_realloc(block, bytes); });
}

// The names of operator new and new[], those that throw and those that do not.
WRAP(void*, _Znwm, size_t bytes) {
  return strike(SystemCall::kAllocate) == 0 ? __real__Znwm(bytes) : throw std::bad_alloc();
}

WRAP(void*, _Znam, size_t bytes) {
  return strike(SystemCall::kAllocate) == 0 ? __real__Znam(bytes) : throw std::bad_alloc();
}

WRAP(void*, _ZnwmRKSt9nothrow_t, size_t bytes, const std::nothrow_t& nothrow) {
  return strike(SystemCall::kAllocate) == 0 ? __real__ZnwmRKSt9nothrow_t(bytes, nothrow) : nullptr;
}

WRAP(void*, _ZnamRKSt9nothrow_t, size_t bytes, const std::nothrow_t& nothrow) {
  return strike(SystemCall::kAllocate) == 0 ? __real__ZnamRKSt9nothrow_t(bytes, nothrow) : nullptr;
}

WRAP(char*, strdup, const char* text) {
  return orErrno(SystemCall::kStrdup, static_cast<char*>(nullptr), [&] { return __real_strdup(text); });
}

WRAP(int, BSS1_TimedWait, pthread_cond_t* condition, pthread_mutex_t* mutex, int64_t milliseconds) {
  const int error = strike(SystemCall::kTimedWait);
  return error != 0 ? error : __real_BSS1_TimedWait(condition, mutex, milliseconds);
}

long __real_syscall(long number, ...);
CHILD_CODE long __wrap_syscall(long number, ...) {
  va_list arguments;
  va_start(arguments, number);
  long a[6];
  for (long& argument : a) argument = va_arg(arguments, long);
  va_end(arguments);
  const int error = number == SYS_dup3          ? strike(SystemCall::kDup3)
                    : number == SYS_close_range ? strike(SystemCall::kCloseRange)
                    : number == SYS_execve      ? strike(SystemCall::kExecve)
                                                : 0;
  if (error == 0) return __real_syscall(number, a[0], a[1], a[2], a[3], a[4], a[5]);
  errno = error;
  return -1;
}

}  // extern "C"
#pragma GCC visibility pop
