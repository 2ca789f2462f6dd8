#pragma once
// Starting a child: what is prepared for it, the start itself, and the thread that waits for it.

#include <memory>
#include <string>
#include <vector>

#include "process/child_environment.h"
#include "process/pipes.h"
#include "process/process_data.h"
#include "process/user_token.h"

namespace VMQ {

class Process;

/// Starts `argv[0]` with the words of `argv`, in the host's environment changed by, first, KBB_RAS1_LOG for the child's
/// own trace log and then `env` (as setEnv does), and starts its waiter thread. The child gets the other ends of the
/// three pipes as its standard descriptors and no other descriptor of the host, an empty signal mask, and the default
/// handling of SIGPIPE; it stays in the host's process group, user and directory. Closes the child's ends of the pipes
/// here.
///
/// True once a program is running or none could be executed: that child has ended with status 0 (see Process), with the
/// trace "Unable to launch the executable, rc=%d". False, with a trace, when there is no child; one that nothing could
/// wait for has been killed and reaped.
///
/// The cost does not grow with the memory of the host: the child shares it until it executes, and only the calling
/// thread waits for that. For any thread. `userToken` and `process` change nothing for the child.
bool forkAndExecute(char** argv, const char* const* env, const std::shared_ptr<ProcessData>& processData,
                    Pipe& stdinPipe, Pipe& stdoutPipe, Pipe& stderrPipe, const user_s_t* userToken,
                    const Process* process);

/// The setting that gives a child a trace log of its own: "KBB_RAS1_LOG=" and the path of a log named by the second in
/// the installation's logs directory, from which the oldest such log is removed when there are ten. Without a path when
/// the installation is unknown. Empty when the host does not trace (KBB_RAS1 unset or empty).
std::string childTraceSetting();

/// The files that execvp would try for `file` in this environment, in order.
std::vector<std::string> execCandidates(const char* file, const ChildEnvironment& environment);

}  // namespace VMQ
