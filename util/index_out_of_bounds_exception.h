#pragma once
// What every range check of the texts and arrays throws.

#include <cstdio>

namespace VMQ {

/// Says where a range check failed: "line: <n>, file: <name>". The name is a short one of the component's own
/// ("vmqstr", "vmqarryi"), not a path. A longer text than the buffer holds is cut.
class IndexOutOfBoundsException {
 public:
  IndexOutOfBoundsException(int line, const char* file) {
    (void)std::snprintf(text_, sizeof text_, "line: %d, file: %s", line, file);  // a cut text still says enough
  }
  ~IndexOutOfBoundsException() = default;

  /// The text, terminated; lives as long as the exception.
  [[nodiscard]] const char* getText() const { return text_; }

 private:
  char text_[512];
};

}  // namespace VMQ
