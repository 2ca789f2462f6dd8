#pragma once
// What vmqd is told on its command line.

#include <optional>
#include <string>

namespace vmqd {

struct CommandLine {
  std::string config;
  bool check = false;
};

inline constexpr int exitUsage = 2;  ///< wrong command line or configuration

/// Reads the command line. Nothing when there is nothing left to do: help or the version has been printed (exit code
/// 0), or what is wrong has (exit code 2).
std::optional<CommandLine> readCommandLine(int count, char** arguments, int* exit_code);

}  // namespace vmqd
