#pragma once
// The environment that the component finds, and its trace.

#include "apps/vmqd/config.h"

namespace vmqd {

/// Puts the configured variables into the environment of this process and configures the trace by them. Throws
/// ConfigurationError when KBB_RAS1 or KBB_RAS1_LOG is not accepted. REQUIRES: no other threads yet.
void applyEnvironment(const Configuration& configuration);

/// Checks the same without opening the trace's log.
void checkEnvironment(const Configuration& configuration);

/// The value of a variable, "" when it is unset.
std::string environmentValue(const char* name);

}  // namespace vmqd
