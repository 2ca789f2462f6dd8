#pragma once
// One code page: bytes to UTF-16 code units and back.

#include <cstddef>
#include <cstdint>
#include <memory>

#include "nls2_ascii.h"

namespace vmqhost {

struct Converted {
  size_t stored;
  bool cut;  ///< before the first character that did not fit
};

/// Thread-safe.
class Converter {
 public:
  virtual ~Converter() = default;
  /// Bytes that mean nothing become the unit of the same value.
  virtual Converted toUnits(const unsigned char* bytes, size_t count, Unit* units, size_t capacity) const = 0;
  /// Units that mean nothing go through byteForUnit.
  virtual Converted fromUnits(const Unit* units, size_t count, unsigned char* bytes, size_t capacity) const = 0;
  [[nodiscard]] virtual uint32_t maximumBytesPerUnit() const = 0;
};

/// What a unit becomes that the code page cannot encode.
inline unsigned char byteForUnit(Unit unit) {
  return unit < 0x100 ? static_cast<unsigned char>(unit) : '?';
}

/// Latin-1, and ASCII with its upper half read as Latin-1, so that nothing is lost in the plain C locale.
std::unique_ptr<Converter> newLatin1Converter();
std::unique_ptr<Converter> newUtf8Converter();
/// A code page of the C library, by the name that iconv knows. Null when iconv does not know it.
std::unique_ptr<Converter> newIconvConverter(const char* name, uint32_t maximumBytesPerUnit);

}  // namespace vmqhost
