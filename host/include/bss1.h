#pragma once
// Base services of the host agent: environment, locks, time and sleep, one-time initialisation.
// Every function may be called from any thread.

#include <pthread.h>

#include <cstdint>

extern "C" {

// ---- environment -----------------------------------------------------------------------------------------------

/// The value of an environment variable, or `defaultValue` (which may be null) when it is unset. The text stays valid
/// and unchanged for the life of the process, whatever happens to the variable afterwards.
const char* BSS1_GetEnv(const char* name, const char* defaultValue);

/// Sets a variable from "NAME=VALUE" (copied). Returns 0, or EINVAL when there is no "=" or no name, or ENOMEM.
int BSS1_PutEnv(const char* assignment);

/// The lock that guards the process's environment array; the two calls above take it. Hold it while `environ` is
/// copied or rewritten directly. It may be taken again by the thread that holds it.
struct BSS1_Lock* BSS1_EnvironmentLock(void);

// ---- locks -----------------------------------------------------------------------------------------------------

/// A new recursive lock, or null without memory. The caller frees it with BSS1_DeleteLock.
struct BSS1_Lock* BSS1_NewLock(void);
/// REQUIRES: held by nobody.
void BSS1_DeleteLock(struct BSS1_Lock* lock);

/// Waits for the lock. Returns 0, or an errno value.
int BSS1_GetLock(struct BSS1_Lock* lock);
/// Gives the lock back. Returns 0, or an errno value: EPERM when the calling thread does not hold it.
int BSS1_ReleaseLock(struct BSS1_Lock* lock);

// ---- time ------------------------------------------------------------------------------------------------------

/// Wall-clock time in seconds since 1970-01-01T00:00:00Z.
int64_t BSS1_GetTime(void);

/// Milliseconds since some fixed moment; never steps back. For time-outs.
int64_t BSS1_GetElapsed(void);

/// Sleeps for whole seconds.
void BSS1_Sleep(unsigned seconds);

/// Waits on `condition` (default attributes) with `mutex` held, for at most `milliseconds` of BSS1_GetElapsed.
/// Returns 0, ETIMEDOUT, or another errno value. May return 0 without a signal.
int BSS1_TimedWait(pthread_cond_t* condition, pthread_mutex_t* mutex, int64_t milliseconds);

// ---- one-time initialisation -----------------------------------------------------------------------------------

/// Static storage, initialised with BSS1_ONCE_INIT.
struct BSS1_Once {
  pthread_once_t once;
};
#define BSS1_ONCE_INIT \
  { PTHREAD_ONCE_INIT }

/// Runs `initialize` in exactly one of the threads that call this with the same `once`; the others wait for its end.
/// Returns 0, EINVAL for null, or ECANCELED when `initialize` threw in this call (it is not run again).
int BSS1_InitializeOnce(struct BSS1_Once* once, void (*initialize)(void));

}  // extern "C"
