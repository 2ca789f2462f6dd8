#pragma once
// Where directories stand.

#include <string>

namespace vmqd {

/// True when the two paths are, or would be once they are made, on different file systems. False also when that cannot
/// be told.
bool onDifferentFileSystems(const std::string& one, const std::string& other);

}  // namespace vmqd
