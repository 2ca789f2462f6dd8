#pragma once
// Loads the component and calls its entry point.

#include <string>

namespace vmqd {

/// Where this program's own libvmq.so is: the same way from its folder, installed and in the build tree.
std::string defaultLibrary();

/// Loads the library, for the life of the process, and calls Initialize_Mgmt_Functions. Throws std::runtime_error.
/// The environment is set before.
void loadComponent(const std::string& library);

}  // namespace vmqd
