#pragma once
// Command lines as a person types them.

#include <string>

struct Outcome {
  int exit_code = -1;  ///< 128 + signal when a signal ended the shell
  std::string output;  ///< standard output and standard error, in the order written
};

/// Runs a command line in /bin/sh and waits until everything that holds its output has let go of it: a call that comes
/// back has left nothing behind that could still write.
Outcome runShell(const std::string& command);

/// The text in single quotes, as one word of a command line.
std::string quoted(const std::string& text);
