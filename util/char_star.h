#pragma once
// The narrow copy of a text that String::c_str() hands out.

#include <cstring>

namespace VMQ {

class String;

/// Owns one NUL-terminated narrow text. Meant to live only as long as the expression or block that uses the text.
class CharStar {
 public:
  /// Copies the text; null counts as empty.
  explicit CharStar(const char* text) : text_(copyOf(text)) {}
  CharStar(const CharStar& other) : text_(copyOf(other.text_)) {}
  CharStar& operator=(const CharStar& other) {
    if (this != &other) {
      char* copy = copyOf(other.text_);
      delete[] text_;
      text_ = copy;
    }
    return *this;
  }
  ~CharStar() { delete[] text_; }

  // NOLINTBEGIN(google-explicit-constructor): converting silently is what it is for
  operator const char*() const { return text_; }
  operator char*() const { return text_; }
  // NOLINTEND(google-explicit-constructor)
  /// For calls with "...", where nothing converts.
  [[nodiscard]] const char* get() const { return text_; }

 private:
  friend class String;
  struct Adopt {};
  /// Takes a text allocated with new[].
  CharStar(Adopt, char* text) : text_(text) {}

  static char* copyOf(const char* text) {
    if (!text) text = "";
    const size_t size = std::strlen(text) + 1;
    return static_cast<char*>(std::memcpy(new char[size], text, size));
  }

  char* text_;
};

}  // namespace VMQ
