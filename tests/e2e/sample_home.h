#pragma once
// A copy of the sample installation home, whose agents serve on ports that were free, and who they are.

#include <sys/types.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

#include "tests/e2e/shell.h"
#include "tests/support/temporary_directory.h"

/// Ends every process whose command line names this copy when it goes; there are none but those that its tools started.
/// Fails the running test when there is no agent program to start.
/// An agent is named like its files: "ux", "ux_inst1", "um".
class SampleHome {
 public:
  SampleHome();
  ~SampleHome();
  SampleHome(const SampleHome&) = delete;
  SampleHome& operator=(const SampleHome&) = delete;

  [[nodiscard]] std::string path() const { return directory_ / "home"; }
  [[nodiscard]] std::string operator/(const std::string& name) const { return path() + "/" + name; }

  /// Where the agent will serve, or serves.
  [[nodiscard]] uint16_t port(const std::string& agent) const;
  /// Sets a line of the agent's configuration, KEY=value; the last one counts.
  void configure(const std::string& agent, const std::string& line) const;
  /// Writes an executable shell script for use as PROGRAM, and returns its path.
  std::string writeProgram(const std::string& name, const std::string& body) const;

  /// The process that the agent's pid file names; nothing without such a file.
  [[nodiscard]] std::optional<pid_t> pid(const std::string& agent) const;

  /// bin/CorvelAgent -h HOME and these arguments, as a shell reads them.
  [[nodiscard]] Outcome control(const std::string& arguments) const;

  /// Lets every user read the home and write its logs and run folders.
  void openToEveryUser() const;

 private:
  TemporaryDirectory directory_;
};

/// True while the process exists and is not only waiting to be reaped.
bool isRunning(pid_t pid);

/// Repeats the question, for ten seconds at most, until the answer is true.
bool soon(const std::function<bool()>& question);

/// Sends a signal to every process with this text in its command line, and returns how many there were. For texts that
/// nothing else can hold: paths of a temporary directory. Throws std::invalid_argument for any other.
unsigned signalEveryProcessNaming(const std::string& text, int signal);
