// Latin-1: a byte is a unit.

#include <algorithm>

#include "nls2_ascii.h"
#include "nls2_converter.h"

namespace vmqhost {

namespace {

class Latin1Converter : public Converter {
 public:
  Converted toUnits(const unsigned char* bytes, size_t count, Unit* units, size_t capacity) const override {
    const size_t fitting = std::min(count, capacity);
    for (size_t done = 0; done < fitting;) {
      done += widenAscii(bytes + done, fitting - done, units + done);
      for (; done < fitting && bytes[done] >= 0x80; ++done) units[done] = bytes[done];
    }
    return {fitting, fitting < count};
  }

  Converted fromUnits(const Unit* units, size_t count, unsigned char* bytes, size_t capacity) const override {
    const size_t fitting = std::min(count, capacity);
    for (size_t done = 0; done < fitting;) {
      done += narrowAscii(units + done, fitting - done, bytes + done);
      for (; done < fitting && units[done] >= 0x80; ++done) bytes[done] = byteForUnit(units[done]);
    }
    return {fitting, fitting < count};
  }

  [[nodiscard]] uint32_t maximumBytesPerUnit() const override { return 1; }
};

}  // namespace

std::unique_ptr<Converter> newLatin1Converter() {
  return std::make_unique<Latin1Converter>();
}

}  // namespace vmqhost
