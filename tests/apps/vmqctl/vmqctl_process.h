#pragma once
// The built vmqctl as a child process, with pipes or a terminal of its own.

#include <sys/types.h>

#include <string>
#include <vector>

#include "tests/support/temporary_directory.h"

/// What the child writes goes to pipes, so that it sees no terminal, or to a terminal of 80 columns.
enum class Terminal {
  None,
  ForErrors,  ///< standard error only
  ForBoth,
};

struct VmqctlOptions {
  Terminal terminal = Terminal::None;
  unsigned short columns = 80;
  std::vector<std::string> environment =
      {};                       ///< added to a plain one (TERM=xterm, LANG=C.UTF-8, no NO_COLOR, no VMQ_SOCKET)
  std::string outputFile = {};  ///< standard output goes here instead
  std::string program = VMQCTL_PROGRAM;  ///< or a copy of it
  bool asNobody = false;                 ///< as a user that may nothing, when the test is run by root
};

struct VmqctlResult {
  int code = -1;    ///< exit code, or 128 + the signal that ended it
  std::string out;  ///< what it wrote to standard output, or to the terminal
  std::string err;  ///< standard error when that is not where `out` comes from
};

/// One run. One thread. Nothing here waits for longer than 30 seconds; the test fails then and the child is killed.
class VmqctlProcess {
 public:
  explicit VmqctlProcess(std::vector<std::string> arguments, VmqctlOptions options = {});
  ~VmqctlProcess();
  VmqctlProcess(const VmqctlProcess&) = delete;
  VmqctlProcess& operator=(const VmqctlProcess&) = delete;

  /// Waits until the text has been written, to standard output or standard error (or the terminal).
  void awaitOutput(const std::string& text);
  void awaitErrors(const std::string& text);

  void signal(int number) const;

  /// Everything read, and the child gone.
  VmqctlResult finish();

 private:
  /// Reads what comes next. False at the end of both, or when the time is over.
  bool read();
  void await(const std::string& stream, const std::string& text);

  pid_t pid_ = -1;
  int out_ = -1;
  int err_ = -1;
  VmqctlResult result_;
};

/// Runs it to its end.
VmqctlResult runVmqctl(std::vector<std::string> arguments, VmqctlOptions options = {});

/// Copies the program to where every user finds it: into this directory, which is opened for them. Its path.
std::string copyOfVmqctl(const TemporaryDirectory& directory);
