#pragma once
// The few steps that a new child takes in our memory, between clone and exec.

#include <sys/types.h>

#include <cstddef>

namespace VMQ {

/// What the child needs, all prepared by the parent, and what it reports. Plain data: parent and child share the memory
/// and the parent waits meanwhile.
struct ChildLaunch {
  // In.
  int stdinRead = -1, stdoutWrite = -1, stderrWrite = -1;  ///< the child's ends
  int stdinWrite = -1, stdoutRead = -1, stderrRead = -1;   ///< the parent's ends
  const char* const* candidates = nullptr;                 ///< files to execute, the first that can be; null-terminated
  char* const* argv = nullptr;
  char** shellArgv = nullptr;  ///< for a file that is no binary and names no interpreter; the child stores it at [1]
  char* const* environment = nullptr;
  int descriptorLimit = 0;  ///< descriptors are below it; for kernels that cannot close a range

  // Out.
  bool stdoutFailed = false, stderrFailed = false, stdinFailed = false;  ///< could not be put onto its descriptor
  int execError = 0;                                                     ///< errno, when nothing could be executed
};

/// Entry of the child (for clone); `argument` is a ChildLaunch. Runs with every signal blocked. Does not return when a
/// program was executed; otherwise it ends the child with status 0, on purpose: a program that could not be executed
/// looks like a successful run.
int runChild(void* argument);

}  // namespace VMQ
