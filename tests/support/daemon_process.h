#pragma once
// One run of the real vmqd. Needs no test framework, so that benchmarks can use it too.

#include <sys/types.h>

#include <chrono>
#include <optional>
#include <string>
#include <vector>

/// Starts vmqd and speaks the service manager's side of the readiness protocol with it. Kills it when the object goes.
/// The process also ends with the thread that started it. Everything throws std::runtime_error when the system fails,
/// and when the daemon does not do within 60 seconds what is waited for.
class DaemonProcess {
 public:
  /// Its standard output and standard error are written to the file `log`, after what is there.
  DaemonProcess(const std::vector<std::string>& arguments, const std::string& log);
  ~DaemonProcess();
  DaemonProcess(const DaemonProcess&) = delete;
  DaemonProcess& operator=(const DaemonProcess&) = delete;

  /// Waits for READY=1. False when the process has ended instead.
  bool waitUntilReady();
  /// Waits for the next datagram of the protocol; nothing when the process has ended instead.
  std::optional<std::string> nextNotification();

  void signal(int number) const;
  /// Waits for its end: the exit code, or 128 + signal.
  int wait();
  /// SIGTERM and wait().
  int stop();

  [[nodiscard]] pid_t pid() const { return pid_; }
  [[nodiscard]] bool ended() const { return exit_code_.has_value(); }

 private:
  int notifications_;
  pid_t pid_ = -1;
  int process_ = -1;  // readable once it has ended
  std::optional<int> exit_code_;
};
