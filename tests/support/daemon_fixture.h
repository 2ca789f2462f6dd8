#pragma once
// A real vmqd on a scratch home, with a socket of its own.

#include <memory>
#include <string>
#include <vector>

#include "tests/support/daemon_process.h"
#include "tests/support/temporary_directory.h"

class DaemonFixture {
 public:
  struct Options {
    std::string home;     ///< an existing installation home; empty: one in the scratch directory with nothing but "tmp"
    std::string library;  ///< the component; empty: the project's own
    std::vector<std::string> lines;  ///< further lines of the configuration file
    bool start = true;
  };
  static constexpr const char* node = "testnode";

  /// Writes the configuration, starts the daemon and waits until it is ready. Throws std::runtime_error, with what it
  /// has written, when it does not get ready.
  DaemonFixture() : DaemonFixture(Options{}) {}
  explicit DaemonFixture(Options options);
  /// Stops it. Fails the running test when it does not exit with 0 then (nothing is checked once stop(), kill() or
  /// process().wait() have been called).
  ~DaemonFixture();
  DaemonFixture(const DaemonFixture&) = delete;
  DaemonFixture& operator=(const DaemonFixture&) = delete;

  /// Starts it (again) and waits until it is ready. REQUIRES: not running.
  void start();
  /// Starts it without waiting for anything.
  void launch();
  /// SIGTERM; the exit code.
  int stop() { return process().stop(); }
  /// SIGKILL.
  void kill();

  [[nodiscard]] DaemonProcess& process() { return *process_; }
  [[nodiscard]] const TemporaryDirectory& directory() const { return directory_; }
  [[nodiscard]] std::string socket() const { return directory_ / "vmqd.sock"; }
  [[nodiscard]] std::string config() const { return directory_ / "vmqd.conf"; }
  [[nodiscard]] std::string depot() const { return directory_ / "depot"; }
  [[nodiscard]] const std::string& home() const { return home_; }
  /// What it has written to standard output and standard error so far.
  [[nodiscard]] std::string log() const;

 private:
  const TemporaryDirectory directory_;
  const std::string home_;
  std::unique_ptr<DaemonProcess> process_;
};
