#pragma once
// VMQ::Process: one child process with its three pipes, its waiter thread and its time-out.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "process/process_data.h"
#include "process/process_streams.h"
#include "process/user_token.h"
#include "util/string.h"

namespace VMQ {

/// Starts one child, once. The object belongs to one thread at a time; any number of them may be at work in different
/// threads. The host must neither ignore SIGCHLD nor reap children that it did not start.
///
/// The caller reads the child's standard output and error as they come (Util::runCommand does): a child whose pipe is
/// full stops until somebody reads.
class Process {
 public:
  /// `command` is split into words by MakeArgv. `env`: additions to the child's environment ("NAME=VALUE"; a name alone
  /// removes the variable). `second` and `third`: lists whose first entries name a user and a group for
  /// create_user_token; what it finds is kept with the process but the child runs as the host does. Each list ends with
  /// a null, may be null, and is copied.
  explicit Process(const String& command);
  Process(const String& command, const char** env);
  Process(const String& command, const char** env, const char** second, const char** third);
  /// A process of the same command and settings that has not been started.
  Process(const Process& other);
  Process& operator=(const Process&) = delete;
  /// Closes the streams. A child that still runs goes on; its waiter thread reaps it.
  ~Process();

  /// What the constructors do: takes the command and its settings, in place of those there were, and reads TIMEOUT.
  /// REQUIRES: not started.
  void init(String command, const char** env, const char** second, const char** third);
  /// What the constructors do: makes the streams, closed. REQUIRES: not started.
  void createStreams();

  /// Starts the child. False, with the trace "Unable to execute command: %s", when its first word is not an executable
  /// path, the line has more than 127 words, or the system refuses a pipe, a thread or the child; then nothing is left
  /// behind. The first word is not looked up in PATH by that check.
  /// Kept on purpose: a first word that passes the check but cannot be executed (a directory, a script whose
  /// interpreter is missing) counts as started, and as a run that ended with status 0.
  bool start();

  /// True from a successful start() until the child has ended and its waiter thread has reaped it.
  [[nodiscard]] bool running();

  /// Waits for the child to end, for at most the time-out from now rounded up to the next 10 seconds, then kills it
  /// (and the process group it leads, if it does). Stores in `*retCode`: the exit code, 128 + the signal that ended it,
  /// or 255 when it could not be reaped. False when the child had to be killed (`*retCode` is then never 0), or when
  /// there was nothing to wait for or no way to (`*retCode` is then left alone).
  bool wait(int* retCode);
  /// The same with the moment of BSS1_GetElapsed from which on the child is killed.
  bool waitUntil(int* retCode, int64_t killAtMilliseconds);

  /// The streams live as long as the object. They are closed (-1) until start() succeeds.
  ProcessOutputStream* getStdIn();
  ProcessInputStream* getStdOut();
  ProcessInputStream* getStdErr();

  /// Lets go of the child: the record shared with the waiter thread goes when that thread ends.
  void destroyProcessData();

  /// Seconds that wait() gives the child: 300, or the number in the environment variable TIMEOUT when the object was
  /// made. An empty TIMEOUT counts as unset.
  [[nodiscard]] int timeoutSeconds() const { return timeout_; }
  /// True when TIMEOUT gave it.
  [[nodiscard]] bool timeoutIsSet() const { return timeoutIsSet_; }
  /// When start() was called, in milliseconds of BSS1_GetElapsed.
  [[nodiscard]] int64_t startedAtMilliseconds() const { return startedAtMilliseconds_; }
  /// Becomes readable when running() becomes false. REQUIRES: started.
  [[nodiscard]] int completionDescriptor() const { return processData_->completion.get(); }

 private:
  bool startChild();
  bool waitForCompletion(int64_t killAtMilliseconds, bool* killed);
  bool killChild();

  struct FreeToken {
    void operator()(user_s_t* token) const;
  };

  String command_;
  std::vector<std::string> environment_;
  int timeout_ = 0;  ///< seconds
  bool timeoutIsSet_ = false;
  std::unique_ptr<user_s_t, FreeToken> userToken_;
  std::unique_ptr<ProcessOutputStream> stdIn_;
  std::unique_ptr<ProcessInputStream> stdOut_;
  std::unique_ptr<ProcessInputStream> stdErr_;
  std::shared_ptr<ProcessData> processData_;  ///< null until start() succeeds
  int64_t startedAtMilliseconds_ = 0;
};

/// The negated value, as kill takes a process group.
int neg(int value);

}  // namespace VMQ
