#pragma once

#include <string>

namespace vmqctl {

/// The whole of a file, or of standard input for "-". Throws a Failure of usage when it cannot be read, is longer than
/// maximumValueBytes, or holds a NUL, which no parameter can.
std::string inputText(const std::string& file);

}  // namespace vmqctl
