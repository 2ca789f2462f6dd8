#pragma once
// The memory of another process of this user.

#include <sys/types.h>

#include <string>

/// Whether memory tells what the programs of this build hold: a sanitizer keeps what is freed.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
inline constexpr bool memoryTells = false;
#else
inline constexpr bool memoryTells = true;
#endif

/// In KiB, by its name in /proc/PID/status: "VmRSS" what it has now, "VmHWM" the most that it has had. Fails the
/// running test when there is no such process or name.
long memoryOf(pid_t process, const std::string& name);

/// How many pages it has asked the system for so far. Fails the running test when there is no such process.
long pageFaultsOf(pid_t process);
