#pragma once

#include <string>

namespace vmqctl {

/// The most that one parameter of a request can hold, in bytes.
inline constexpr std::size_t maximumParameterBytes = 65535;

/// The whole of a file, or of standard input for "-". Throws a Failure of usage when it cannot be read, is longer than
/// maximumParameterBytes, or holds a NUL, which no parameter can.
std::string inputText(const std::string& file);

}  // namespace vmqctl
