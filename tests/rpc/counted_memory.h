#pragma once
// Counts the memory that the component takes from the remote-procedure runtime. The test program is linked so that its
// calls come here first.

#include <cstdint>
#include <vector>

/// While it lives.
class CountedMemory {
 public:
  CountedMemory();
  ~CountedMemory();
  CountedMemory(const CountedMemory&) = delete;
  CountedMemory& operator=(const CountedMemory&) = delete;

  /// The bytes of each block that was asked for, in order.
  [[nodiscard]] std::vector<uint32_t> taken() const;
  /// How many of those that were given have not been given back.
  [[nodiscard]] int held() const;
};
