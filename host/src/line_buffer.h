#pragma once
// Memory for one trace line: on the stack, and from malloc for long ones.

#include <cstdarg>
#include <cstddef>

namespace vmqhost {

class LineBuffer {
 public:
  // cppcheck-suppress uninitMemberVar ; size_ says how much of it is in use
  LineBuffer() = default;
  ~LineBuffer();
  LineBuffer(const LineBuffer&) = delete;
  LineBuffer& operator=(const LineBuffer&) = delete;

  /// Appends a formatted text; what there is no memory for is cut off. A format that the C library refuses is appended
  /// as it stands.
  [[gnu::format(printf, 2, 3)]] void append(const char* format, ...);
  [[gnu::format(printf, 2, 0)]] void append(const char* format, va_list arguments);

  /// Drops one line feed at the end of what follows `position`; each other control byte there becomes visible.
  void makeOneLine(size_t position);

  /// Appends a line feed. Cuts one byte off when there is no memory.
  void endLine();

  [[nodiscard]] const char* data() const { return data_; }
  [[nodiscard]] size_t size() const { return size_; }

 private:
  bool reserve(size_t capacity);

  char inline_[1024];
  char* data_ = inline_;
  size_t capacity_ = sizeof inline_;
  size_t size_ = 0;
};

}  // namespace vmqhost
