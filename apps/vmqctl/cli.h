#pragma once
// The command line of vmqctl.

#include <optional>
#include <string>

#include "apps/vmqctl/settings.h"

namespace vmqctl {

/// What a command line asks for.
struct Invocation {
  Settings settings;
  unsigned defaultTimeoutSeconds = 0;  ///< of the verb; 0 for no limit
  Action action;
};

/// Reads the command line. Returns the text to print when it asks for help or for the version; else fills result.
/// Throws a Failure of usage.
std::optional<std::string> parseCommandLine(int argc, const char* const* argv, Invocation& result);

}  // namespace vmqctl
