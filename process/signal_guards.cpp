#include "process/signal_guards.h"

#include <cerrno>
#include <ctime>

namespace VMQ {
namespace {

sigset_t onlySigpipe() {
  sigset_t set;
  sigemptyset(&set);
  sigaddset(&set, SIGPIPE);
  return set;
}

}  // namespace

// pthread_sigmask fails only for an unknown `how`, so its results are not looked at.

AllSignalsBlocked::AllSignalsBlocked() {
  sigset_t all;
  sigfillset(&all);
  (void)pthread_sigmask(SIG_SETMASK, &all, &previous_);
}

AllSignalsBlocked::~AllSignalsBlocked() {
  (void)pthread_sigmask(SIG_SETMASK, &previous_, nullptr);
}

SigpipeSuppressed::SigpipeSuppressed() {
  sigset_t pending;
  wasPending_ = sigpending(&pending) == 0 && sigismember(&pending, SIGPIPE) == 1;
  const sigset_t pipe = onlySigpipe();
  (void)pthread_sigmask(SIG_BLOCK, &pipe, &previous_);
}

SigpipeSuppressed::~SigpipeSuppressed() {
  const int error = errno;
  if (!wasPending_) {
    const sigset_t pipe = onlySigpipe();
    const timespec atOnce{};
    while (sigtimedwait(&pipe, nullptr, &atOnce) < 0 && errno == EINTR) {
    }
  }
  (void)pthread_sigmask(SIG_SETMASK, &previous_, nullptr);
  errno = error;
}

}  // namespace VMQ
