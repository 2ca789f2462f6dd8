#pragma once
// The fast path of every code page: runs of ASCII.

#include <cstddef>

namespace vmqhost {

/// A UTF-16 code unit, of the type that the interface has: char16_t would be another type to the compiler.
using Unit = unsigned short;

/// Widens the ASCII characters that `bytes` begins with, up to `count`. Returns how many.
size_t widenAscii(const unsigned char* bytes, size_t count, Unit* units);

/// Narrows the ASCII characters that `units` begins with, up to `count`. Returns how many.
size_t narrowAscii(const Unit* units, size_t count, unsigned char* bytes);

}  // namespace vmqhost
