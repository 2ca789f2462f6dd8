// Formatting of one trace line.

#include "line_buffer.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace vmqhost {

namespace {

bool isControl(unsigned char byte) {
  return byte < 0x20 || byte == 0x7F;
}

/// Bytes of a control byte made visible: "\n" or "\xNN".
size_t visibleSize(char byte) {
  return byte == '\n' ? 2 : 4;
}

void storeVisible(char byte, char* out) {
  constexpr char kDigits[] = "0123456789ABCDEF";
  const auto value = static_cast<unsigned char>(byte);
  *out++ = '\\';
  if (byte == '\n') {
    *out = 'n';
    return;
  }
  *out++ = 'x';
  *out++ = kDigits[value >> 4];
  *out = kDigits[value & 15];
}

}  // namespace

LineBuffer::~LineBuffer() {
  if (data_ != inline_) std::free(data_);
}

bool LineBuffer::reserve(size_t capacity) {
  if (capacity <= capacity_) return true;
  capacity = std::max(capacity, 2 * capacity_);
  char* const grown = static_cast<char*>(data_ == inline_ ? std::malloc(capacity) : std::realloc(data_, capacity));
  if (grown == nullptr) return false;
  if (data_ == inline_) std::memcpy(grown, inline_, size_);
  data_ = grown;
  capacity_ = capacity;
  return true;
}

void LineBuffer::append(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  append(format, arguments);
  va_end(arguments);
}

void LineBuffer::append(const char* format, va_list arguments) {
  va_list again;
  va_copy(again, arguments);
  const int wanted = std::vsnprintf(data_ + size_, capacity_ - size_, format, arguments);
  if (wanted < 0) {
    const size_t length = std::strlen(format);
    const size_t stored = reserve(size_ + length + 1) ? length : std::min(length, capacity_ - size_ - 1);
    std::memcpy(data_ + size_, format, stored);
    size_ += stored;
  } else if (const auto length = static_cast<size_t>(wanted); length < capacity_ - size_) {
    size_ += length;
  } else if (reserve(size_ + length + 1)) {
    (void)std::vsnprintf(data_ + size_, capacity_ - size_, format, again);  // succeeded above
    size_ += length;
  } else {
    size_ = capacity_ - 1;
  }
  va_end(again);
}

void LineBuffer::makeOneLine(size_t position) {
  if (size_ > position && data_[size_ - 1] == '\n') --size_;
  size_t grown = size_;
  for (size_t i = position; i < size_; ++i) {
    if (isControl(static_cast<unsigned char>(data_[i]))) grown += visibleSize(data_[i]) - 1;
  }
  if (grown == size_) return;
  if (!reserve(grown + 1)) {
    std::replace_if(
        data_ + position, data_ + size_, [](char c) { return isControl(static_cast<unsigned char>(c)); }, '?');
    return;
  }
  // From the end, so that nothing is overwritten before it has moved.
  size_t to = grown;
  for (size_t from = size_; from-- > position;) {
    if (isControl(static_cast<unsigned char>(data_[from]))) {
      const char byte = data_[from];
      to -= visibleSize(byte);
      storeVisible(byte, data_ + to);
    } else {
      data_[--to] = data_[from];
    }
  }
  size_ = grown;
}

void LineBuffer::endLine() {
  if (!reserve(size_ + 1)) --size_;
  data_[size_++] = '\n';
}

}  // namespace vmqhost
