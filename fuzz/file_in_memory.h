#pragma once
// For what has to be a file.

#include <cstddef>
#include <cstdint>
#include <string>

namespace fuzz {

/// One file that holds one input after the other.
class FileInMemory {
 public:
  FileInMemory();
  void hold(const uint8_t* data, size_t size) const;
  [[nodiscard]] std::string path() const { return "/proc/self/fd/" + std::to_string(descriptor_); }

 private:
  const int descriptor_;
};

/// Without white space at both ends.
std::string trimmed(std::string text);

}  // namespace fuzz
