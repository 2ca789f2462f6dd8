// One-time initialisation.

#include <cerrno>

#include "bss1.h"
#include "seam.h"

namespace {

// pthread_once passes no argument and cannot let an exception through.
thread_local void (*pendingInitialize)() = nullptr;
thread_local bool initializeThrew = false;

void runPending() {
  try {
    pendingInitialize();
  } catch (...) {
    initializeThrew = true;
  }
}

}  // namespace

int BSS1_InitializeOnce(BSS1_Once* once, void (*initialize)(void)) {
  if (int status; vmqhost::seam::fails("BSS1_InitializeOnce", &status)) return status;
  if (once == nullptr || initialize == nullptr) return EINVAL;
  void (*const outer)() = pendingInitialize;  // an initialisation may itself need another
  pendingInitialize = initialize;
  initializeThrew = false;
  const int error = pthread_once(&once->once, runPending);
  pendingInitialize = outer;
  const bool threw = initializeThrew;
  initializeThrew = false;
  return threw ? ECANCELED : error;
}
