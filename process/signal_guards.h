#pragma once
// What this thread keeps away from itself for the length of a block.

#include <pthread.h>
#include <signal.h>

namespace VMQ {

/// Blocks every signal in the calling thread; the destructor restores the mask. `errno` is left alone.
class AllSignalsBlocked {
 public:
  AllSignalsBlocked();
  ~AllSignalsBlocked();
  AllSignalsBlocked(const AllSignalsBlocked&) = delete;
  AllSignalsBlocked& operator=(const AllSignalsBlocked&) = delete;

 private:
  sigset_t previous_;
};

/// Lets the calling thread write to a pipe that nobody reads: SIGPIPE is blocked, and one that a write has raised is
/// consumed before the mask is restored. One that was pending before is left. The handling that the host has set for
/// SIGPIPE is never changed, since it belongs to all its threads.
class SigpipeSuppressed {
 public:
  SigpipeSuppressed();
  ~SigpipeSuppressed();
  SigpipeSuppressed(const SigpipeSuppressed&) = delete;
  SigpipeSuppressed& operator=(const SigpipeSuppressed&) = delete;

 private:
  sigset_t previous_;
  bool wasPending_ = false;
};

}  // namespace VMQ
