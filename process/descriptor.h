#pragma once
// One file descriptor and whoever closes it.

#include <unistd.h>

#include <utility>

namespace VMQ {

/// Owns a descriptor (-1: none) and closes it. Belongs to one thread at a time.
class Descriptor {
 public:
  Descriptor() = default;
  explicit Descriptor(int descriptor) : descriptor_(descriptor) {}
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  Descriptor(Descriptor&& other) noexcept : descriptor_(other.release()) {}
  Descriptor& operator=(Descriptor&& other) noexcept {
    reset(other.release());
    return *this;
  }
  ~Descriptor() { reset(); }

  [[nodiscard]] int get() const { return descriptor_; }
  [[nodiscard]] bool isOpen() const { return descriptor_ >= 0; }
  /// Hands the descriptor to the caller, who closes it.
  [[nodiscard]] int release() { return std::exchange(descriptor_, -1); }
  void reset(int descriptor = -1) {
    const int old = std::exchange(descriptor_, descriptor);
    // Nothing that is kept here has written data that a close could still lose, and the number is free either way.
    if (old >= 0) (void)::close(old);
  }

 private:
  int descriptor_ = -1;
};

}  // namespace VMQ
