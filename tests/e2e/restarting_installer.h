#pragma once
// An install that ends the daemon which runs it, starts another one, and goes on.

#include <sys/types.h>

#include "tests/e2e/deployment.h"

/// A daemon that an installer has started. Nobody's child here, so it is known by the file that names its process.
class SuccessorDaemon {
 public:
  explicit SuccessorDaemon(const std::string& pid_file);
  ~SuccessorDaemon();
  SuccessorDaemon(const SuccessorDaemon&) = delete;
  SuccessorDaemon& operator=(const SuccessorDaemon&) = delete;

  [[nodiscard]] pid_t pid() const { return pid_; }
  /// SIGTERM, and waits for its end. False when it does not end within a minute, or there is none.
  bool stop();

 private:
  pid_t pid_ = -1;
  int process_ = -1;  // readable once it has ended
};

/// Waits until the script that outlives the daemon has kept the exit code of its installer.
bool exitCodeIsKept(const DaemonFixture& daemon);

/// Puts an installer into the depot beside the bundle of ux, restart.sh HOME RESPONSES, that runs the bundle's own one,
/// ends the daemon, starts its successor with the same settings and waits until that answers. `then` are further lines.
/// Returns the file that names the successor's process.
std::string stageRestartingInstaller(DaemonFixture& daemon, const SampleHome& home, const std::string& then = "");
