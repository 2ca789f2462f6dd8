#pragma once
// The command line.

#include <optional>
#include <string>

#include "apps/vmqctl/settings.h"

namespace vmqctl {

struct CommandLine {
  Settings settings;
  Action action;
};

/// Reads the command line. Returns the text to print when it asks for help or for the version; else fills result.
/// Throws a Failure of usage.
std::optional<std::string> parseCommandLine(int argc, const char* const* argv, CommandLine& result);

}  // namespace vmqctl
