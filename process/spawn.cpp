#include "process/spawn.h"

#include <sched.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <utility>

#include "process/child_entry.h"
#include "process/signal_guards.h"
#include "process/trace_errno.h"
#include "util/trace.h"

// The C library's clone by its other name, which its headers do not declare.
extern "C" int __clone(int (*entry)(void*), void* stack, int flags, void* argument, ...);

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/spawn"};

// ThreadSanitizer has a clone of its own, which takes the child for a forked one and stops watching the parent, whose
// memory it shares.
#if defined(__SANITIZE_THREAD__)
#define VMQ_CLONE __clone
#elif defined(__has_feature)
#if __has_feature(thread_sanitizer)
#define VMQ_CLONE __clone
#endif
#endif
#ifndef VMQ_CLONE
#define VMQ_CLONE clone
#endif

constexpr char kShell[] = "/bin/sh";
constexpr size_t kChildStackBytes = size_t{64} * 1024;    // runChild calls nothing but the kernel
constexpr size_t kWaiterStackBytes = size_t{256} * 1024;  // the waiter waits and traces

/// The stack of a child that shares our memory: it must not be the caller's, which is in use.
class ChildStack {
 public:
  ChildStack()
      : memory_(
            mmap(nullptr, kChildStackBytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_STACK, -1, 0)) {}
  ~ChildStack() {
    if (exists()) (void)munmap(memory_, kChildStackBytes);  // fails only for an address that is not ours
  }
  ChildStack(const ChildStack&) = delete;
  ChildStack& operator=(const ChildStack&) = delete;

  [[nodiscard]] bool exists() const { return memory_ != MAP_FAILED; }
  [[nodiscard]] void* top() const { return static_cast<char*>(memory_) + kChildStackBytes; }

 private:
  void* const memory_;
};

/// Starts the child and returns when it has executed its program or ended. Its pid, or -1 with `errno`.
/// vfork would do the same on the caller's stack, where compilers and thread checkers cannot follow it.
pid_t launchChild(ChildLaunch& launch) {
  const ChildStack stack;
  if (!stack.exists()) return -1;
  // A handler of the host that ran in the child would run in our memory, on the wrong stack.
  const AllSignalsBlocked blocked;
  return VMQ_CLONE(runChild, stack.top(), CLONE_VM | CLONE_VFORK | SIGCHLD, &launch);
}

/// The child's own lines, in its order: it cannot trace while it shares our memory.
void traceChild(const Trace& trace, pid_t pid, const ChildLaunch& launch) {
  TRACE_DETAIL(trace, "Entering child process to launch command. PID: %d", static_cast<int>(pid));
  if (launch.stdoutFailed) TRACE_ERROR(trace, "error on dup2 for stdout");
  if (launch.stderrFailed) TRACE_ERROR(trace, "error on dup2 for stderr");
  if (launch.stdinFailed) TRACE_ERROR(trace, "error on dup2 for stdin");
  TRACE_DETAIL(trace, "Calling execvp");
  if (launch.execError != 0) {
    TRACE_ERROR(trace, "Unable to launch the executable, rc=%d", /*what exec returns=*/-1);
    TRACE_ERRNO(trace, launch.execError);
  }
}

/// Gives the waiter thread its share of the record. 0, or an errno value.
int startWaiter(std::unique_ptr<std::shared_ptr<ProcessData>> share) {
  ProcessData& processData = **share;
  pthread_attr_t attributes;
  int rc = pthread_attr_init(&attributes);
  if (rc != 0) return rc;
  (void)pthread_attr_setstacksize(&attributes, kWaiterStackBytes);  // refused where it is too small: then the default
  {
    // The host's signals are for the host's threads.
    const AllSignalsBlocked blocked;
    rc = pthread_create(&processData.thread, &attributes, ProcTerminateThreadFunc, share.get());
  }
  (void)pthread_attr_destroy(&attributes);
  if (rc != 0) return rc;
  (void)share.release();  // the waiter's from now on
  return 0;
}

void killAndReap(pid_t pid) {
  (void)kill(pid, SIGKILL);  // it is ours and not reaped, so there is nothing to fail
  while (waitpid(pid, nullptr, 0) < 0 && errno == EINTR) {
  }
}

}  // namespace

std::vector<std::string> execCandidates(const char* file, const ChildEnvironment& environment) {
  const Trace trace(traceUnit);
  if (strchr(file, '/') != nullptr) return {file};
  const char* const path = environment.get("PATH");
  const std::string directories = path != nullptr ? path : "/bin:/usr/bin";
  std::vector<std::string> candidates;
  for (size_t begin = 0; begin <= directories.size();) {
    const size_t end = std::min(directories.find(':', begin), directories.size());
    const std::string directory = directories.substr(begin, end - begin);
    candidates.push_back(directory.empty() ? file : directory + "/" + file);
    begin = end + 1;
  }
  return candidates;
}

bool forkAndExecute(char** argv, const char* const* env, const std::shared_ptr<ProcessData>& processData,
                    Pipe& stdinPipe, Pipe& stdoutPipe, Pipe& stderrPipe, const user_s_t* /*userToken*/,
                    const Process* /*process*/) {
  const Trace trace(traceUnit);

  ChildEnvironment environment;
  const std::string traceSetting = childTraceSetting();
  if (!traceSetting.empty()) environment.put(traceSetting.c_str());
  setEnv(environment, env);

  const std::vector<std::string> files = execCandidates(argv[0], environment);
  std::vector<const char*> candidates;
  candidates.reserve(files.size() + 1);
  for (const std::string& file : files) candidates.push_back(file.c_str());
  candidates.push_back(nullptr);

  // {shell, file, words behind the first}, as execvp runs a file that names no interpreter.
  std::vector<char*> shellArgv{const_cast<char*>(kShell), nullptr};
  for (char** word = argv + 1; *word != nullptr; ++word) shellArgv.push_back(*word);
  shellArgv.push_back(nullptr);

  ChildLaunch launch;
  launch.stdinRead = stdinPipe.readEnd.get();
  launch.stdinWrite = stdinPipe.writeEnd.get();
  launch.stdoutRead = stdoutPipe.readEnd.get();
  launch.stdoutWrite = stdoutPipe.writeEnd.get();
  launch.stderrRead = stderrPipe.readEnd.get();
  launch.stderrWrite = stderrPipe.writeEnd.get();
  launch.candidates = candidates.data();
  launch.argv = argv;
  launch.shellArgv = shellArgv.data();
  launch.environment = environment.entries();
  launch.descriptorLimit = static_cast<int>(sysconf(_SC_OPEN_MAX));

  // Made before there is a child that nothing would wait for if this failed.
  auto share = std::make_unique<std::shared_ptr<ProcessData>>(processData);
  const pid_t pid = launchChild(launch);
  if (pid < 0) {
    const int error = errno;
    TRACE_ERROR(trace, "failed to fork child process");
    TRACE_ERRNO(trace, error);
    return false;
  }
  processData->pid = pid;
  traceChild(trace, pid, launch);

  stdinPipe.readEnd.reset();
  stdoutPipe.writeEnd.reset();
  stderrPipe.writeEnd.reset();

  const int error = startWaiter(std::move(share));
  if (error != 0) {
    TRACE_ERROR(trace, "Error creating thread to wait on process");
    TRACE_ERRNO(trace, error);
    killAndReap(pid);
    return false;
  }
  processData->joinable = true;
  return true;
}

}  // namespace VMQ
