#pragma once
// What the fuzz targets share.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "util/index_out_of_bounds_exception.h"

/// The entry of each target, called with one input after the other. 0: the input may be kept.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

/// Called once before: turns the traces off.
extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv);

namespace fuzz {

/// Ends the process, which makes the input a finding, when a promise of the code under test is broken.
void require(bool holds, const char* promise);

/// The operation throws a range error, unless it is `valid`; its `valid` is returned.
template <typename Operation>
bool happens(bool valid, Operation operation) {
  try {
    operation();
    require(valid, "what is out of range throws");
  } catch (const VMQ::IndexOutOfBoundsException&) {
    require(!valid, "what is in range does not throw");
  }
  return valid;
}

/// The input as far as C reads it, to its first null.
std::string upToNull(const uint8_t* data, size_t size);

/// Takes an input apart. Behind its end come zeros and empty texts.
class Input {
 public:
  Input(const uint8_t* data, size_t size) : rest_(reinterpret_cast<const char*>(data), size) {}

  [[nodiscard]] bool empty() const { return rest_.empty(); }
  uint8_t byte();
  /// From 0 to limit - 1, of at most 65536.
  unsigned below(unsigned limit);
  std::string_view take(size_t bytes);
  /// The length, below `limit`, is in front.
  std::string_view text(unsigned limit) { return take(below(limit)); }
  std::string_view rest() { return take(rest_.size()); }

 private:
  std::string_view rest_;
};

}  // namespace fuzz
