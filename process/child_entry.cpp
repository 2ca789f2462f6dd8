// This code runs in the memory of a process whose other threads go on meanwhile. It may therefore take no lock,
// allocate nothing and call nothing but the kernel, and it does so by number: the sanitizers' versions of the C
// library's functions keep books about the process that the child must not touch. For the same reason it does not
// trace; the parent writes the child's lines.
#include "process/child_entry.h"

#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdint>

#if defined(__clang__)
#define CHILD_CODE __attribute__((disable_sanitizer_instrumentation))
#else
#define CHILD_CODE __attribute__((no_sanitize("address", "thread", "undefined")))
#endif

#ifndef SYS_close_range
#define SYS_close_range 436
#endif

namespace VMQ {
namespace {

/// A signal's handling as the kernel sees it. All zero is the default handling on every machine, and the first word
/// tells a handler from SIG_DFL and SIG_IGN on those we build for.
struct KernelSignalAction {
  uintptr_t handler;
  uint64_t rest[7];
};
constexpr KernelSignalAction kByDefault{};
constexpr uint64_t kNoSignals = 0;
constexpr int kSignals = 64;

/// A handler of the host must not run here, and exec would reset it anyway. Ignored signals stay ignored, as exec
/// leaves them, but for SIGPIPE: hosts ignore it for themselves, while scripts rely on it to end a pipeline.
CHILD_CODE void resetSignals() {
  for (int signal = 1; signal <= kSignals; ++signal) {
    KernelSignalAction action;
    action.handler = 0;
    if (syscall(SYS_rt_sigaction, signal, nullptr, &action, sizeof kNoSignals) != 0) continue;
    const bool isHandler = action.handler != reinterpret_cast<uintptr_t>(SIG_DFL) &&
                           action.handler != reinterpret_cast<uintptr_t>(SIG_IGN);
    if (!isHandler && signal != SIGPIPE) continue;
    (void)syscall(SYS_rt_sigaction, signal, &kByDefault, nullptr, sizeof kNoSignals);
  }
}

CHILD_CODE bool duplicate(int from, int to) {
  long rc;
  do {
    rc = syscall(SYS_dup3, from, to, 0);
  } while (rc < 0 && (errno == EINTR || errno == EBUSY));
  return rc == to;
}

/// The child must not hold the host's sockets and files.
CHILD_CODE void closeAllAboveStandard(int descriptorLimit) {
  if (syscall(SYS_close_range, STDERR_FILENO + 1, ~0U, 0) == 0) return;
  for (int descriptor = STDERR_FILENO + 1; descriptor < descriptorLimit; ++descriptor) {
    (void)syscall(SYS_close, descriptor);
  }
}

/// Tries the candidates like execvp. Returns only when none could be executed, with the errno that tells why.
CHILD_CODE int executeFirst(const ChildLaunch& launch) {
  bool denied = false;
  int error = ENOENT;
  for (const char* const* file = launch.candidates; *file != nullptr; ++file) {
    (void)syscall(SYS_execve, *file, launch.argv, launch.environment);
    if (errno == ENOEXEC) {
      launch.shellArgv[1] = const_cast<char*>(*file);
      (void)syscall(SYS_execve, launch.shellArgv[0], launch.shellArgv, launch.environment);
    }
    error = errno;
    if (error == EACCES) {
      denied = true;
    } else if (error != ENOENT && error != ENOTDIR && error != ESTALE && error != ENODEV && error != ETIMEDOUT) {
      return error;
    }
  }
  return denied ? EACCES : error;
}

}  // namespace

CHILD_CODE int runChild(void* argument) {
  auto& launch = *static_cast<ChildLaunch*>(argument);
  resetSignals();

  (void)syscall(SYS_close, launch.stdoutRead);
  (void)syscall(SYS_close, launch.stderrRead);
  (void)syscall(SYS_close, launch.stdinWrite);
  launch.stdoutFailed = !duplicate(launch.stdoutWrite, STDOUT_FILENO);
  launch.stderrFailed = !duplicate(launch.stderrWrite, STDERR_FILENO);
  launch.stdinFailed = !duplicate(launch.stdinRead, STDIN_FILENO);
  closeAllAboveStandard(launch.descriptorLimit);

  (void)syscall(SYS_rt_sigprocmask, SIG_SETMASK, &kNoSignals, nullptr, sizeof kNoSignals);
  launch.execError = executeFirst(launch);
  while (true) (void)syscall(SYS_exit_group, 0);
}

}  // namespace VMQ
