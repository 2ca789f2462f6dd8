// UTF-8, strict: no overlong forms, no surrogates, nothing above U+10FFFF.

#include <algorithm>

#include "nls2_ascii.h"
#include "nls2_converter.h"

namespace vmqhost {

namespace {

struct Decoded {
  char32_t character;
  size_t length;  // bytes; 0 when they are no character
};

/// REQUIRES: count > 0 and the first byte is not ASCII.
Decoded decode(const unsigned char* bytes, size_t count) {
  constexpr Decoded kInvalid{0, 0};
  const unsigned char lead = bytes[0];
  if (lead < 0xC2 || lead > 0xF4) return kInvalid;
  const size_t length = lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
  if (count < length) return kInvalid;
  // The second byte is where overlong forms, surrogates and what lies above the last plane are told.
  const unsigned char lowest = lead == 0xE0 ? 0xA0 : lead == 0xF0 ? 0x90 : 0x80;
  const unsigned char highest = lead == 0xED ? 0x9F : lead == 0xF4 ? 0x8F : 0xBF;
  if (bytes[1] < lowest || bytes[1] > highest) return kInvalid;
  char32_t character = lead & (0x7Fu >> length);
  for (size_t i = 1; i < length; ++i) {
    if ((bytes[i] & 0xC0) != 0x80) return kInvalid;
    character = character << 6 | (bytes[i] & 0x3Fu);
  }
  return {character, length};
}

/// REQUIRES: a character that is not ASCII. Stores 2 to 4 bytes and returns how many.
size_t encode(char32_t character, unsigned char* bytes) {
  const size_t length = character < 0x800 ? 2 : character < 0x10000 ? 3 : 4;
  for (size_t i = length; --i > 0; character >>= 6) bytes[i] = static_cast<unsigned char>(0x80 | (character & 0x3F));
  bytes[0] = static_cast<unsigned char>(0xF00u >> length | character);
  return length;
}

bool isHighSurrogate(Unit unit) {
  return (unit & 0xFC00) == 0xD800;
}
bool isLowSurrogate(Unit unit) {
  return (unit & 0xFC00) == 0xDC00;
}

class Utf8Converter : public Converter {
 public:
  Converted toUnits(const unsigned char* bytes, size_t count, Unit* units, size_t capacity) const override {
    size_t stored = 0;
    for (size_t at = 0; at < count;) {
      const size_t run = widenAscii(bytes + at, std::min(count - at, capacity - stored), units + stored);
      at += run;
      stored += run;
      if (at == count) break;
      if (stored == capacity) return {stored, true};
      auto [character, length] = decode(bytes + at, count - at);
      if (length == 0) {
        character = bytes[at];
        length = 1;
      }
      if (character < 0x10000) {
        units[stored++] = static_cast<Unit>(character);
      } else {
        if (capacity - stored < 2) return {stored, true};
        units[stored++] = static_cast<Unit>(0xD7C0 + (character >> 10));
        units[stored++] = static_cast<Unit>(0xDC00 + (character & 0x3FF));
      }
      at += length;
    }
    return {stored, false};
  }

  Converted fromUnits(const Unit* units, size_t count, unsigned char* bytes, size_t capacity) const override {
    size_t stored = 0;
    for (size_t at = 0; at < count;) {
      const size_t run = narrowAscii(units + at, std::min(count - at, capacity - stored), bytes + stored);
      at += run;
      stored += run;
      if (at == count) break;
      if (stored == capacity) return {stored, true};
      unsigned char encoded[4];
      size_t taken = 1;
      size_t length;
      if (isHighSurrogate(units[at]) && at + 1 < count && isLowSurrogate(units[at + 1])) {
        length = encode(0x10000 + ((units[at] & 0x3FFu) << 10) + (units[at + 1] & 0x3FFu), encoded);
        taken = 2;
      } else if (isHighSurrogate(units[at]) || isLowSurrogate(units[at])) {
        encoded[0] = byteForUnit(units[at]);
        length = 1;
      } else {
        length = encode(units[at], encoded);
      }
      if (capacity - stored < length) return {stored, true};
      std::copy_n(encoded, length, bytes + stored);
      stored += length;
      at += taken;
    }
    return {stored, false};
  }

  [[nodiscard]] uint32_t maximumBytesPerUnit() const override { return 3; }
};

}  // namespace

std::unique_ptr<Converter> newUtf8Converter() {
  return std::make_unique<Utf8Converter>();
}

}  // namespace vmqhost
