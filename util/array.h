#pragma once
// The component's growable array.

#include <algorithm>
#include <climits>
#include <functional>
#include <utility>

#include "util/array_block.h"

namespace VMQ {

class String;

/// Writes the failure to standard output, then throws IndexOutOfBoundsException.
[[noreturn]] void throwArrayIndexOutOfBounds(int line);

/// A growable array. It grows to exactly what is asked, as far as getCapacity() shows; for plain elements the block
/// behind may hold more, so that appending stays linear in the whole.
/// Every range check throws IndexOutOfBoundsException and leaves the array unchanged; a sum that does not fit in 32
/// bits is out of range, it never wraps. Elements appended or inserted may be elements of the array itself. More than
/// 2^32 - 1 elements fail like an allocation that fails (std::bad_alloc). Not thread-safe.
template <typename T>
class Array {
 public:
  Array() noexcept = default;
  /// `n` elements, of which plain ones are uninitialised; room for 10 more.
  explicit Array(unsigned int n);
  /// A deep copy that shows the same capacity.
  Array(const Array& other) : Array() { init(other); }
  /// Leaves `other` as one that never held anything.
  Array(Array&& other) noexcept : Array() { swap(other); }
  Array& operator=(const Array& other);
  Array& operator=(Array&& other) noexcept;
  ~Array() { Block::free(data_); }

  void swap(Array& other) noexcept;
  /// Frees everything: size 0, capacity 8.
  void clear() noexcept { Array().swap(*this); }

  [[nodiscard]] unsigned int getSize() const { return size_; }
  [[nodiscard]] unsigned int getCapacity() const { return std::max(capacity_, size_); }
  /// Never null; valid until the array changes.
  [[nodiscard]] const T* getData() const { return data_; }

  /// Valid for i < getSize().
  T& operator[](unsigned int i) {
    if (i >= size_) [[unlikely]]
      throwArrayIndexOutOfBounds(__LINE__);
    return data_[i];
  }
  const T& operator[](unsigned int i) const {
    if (i >= size_) [[unlikely]]
      throwArrayIndexOutOfBounds(__LINE__);
    return data_[i];
  }

  void append(const T& x) {
    if (!hasRoom(1)) [[unlikely]]
      return append(&x, 1);
    data_[size_++] = x;
  }
  void append(const T* p, unsigned int n);
  void prepend(const T& x) { insert(0, &x, 1); }
  void prepend(const T* p, unsigned int n) { insert(0, p, n); }
  /// Inserts before element `i`; valid for i <= getSize().
  void insert(unsigned int i, const T& x) { insert(i, &x, 1); }
  void insert(unsigned int i, const T* p, unsigned int n);
  void remove(unsigned int i) { remove(i, 1); }
  /// Valid when i + n <= getSize(). The capacity stays.
  void remove(unsigned int i, unsigned int n);

  /// Makes the capacity at least `n`.
  void reserveCapacity(unsigned int n);
  /// Adds `n` elements at the end; plain ones are uninitialised, others hold whatever was there before.
  void grow(unsigned int n) {
    makeRoom(n);
    size_ += n;
  }

 private:
  using Block = ArrayBlock<T>;
  friend class String;

  /// One plain zero without memory of its own, for the empty String. REQUIRES: never written through.
  struct SharedZero {};
  explicit Array(SharedZero) noexcept : size_(1) { static_assert(Block::IS_PLAIN); }

  void init(const Array& other);
  /// Moves `count` elements by assignment, in the direction in which none is overwritten before it was moved.
  void shift(unsigned int to, unsigned int from, unsigned int count);
  /// Sees to room for `n` more elements.
  void makeRoom(unsigned int n) {
    if (!hasRoom(n)) [[unlikely]]
      relocateFor(n);
  }
  [[nodiscard]] bool hasRoom(unsigned int n) const {
    const unsigned int room = Block::capacity(data_);
    return size_ < room && n <= room - size_;
  }
  [[gnu::noinline]] void relocateFor(unsigned int n);
  /// Moves everything to a block for `capacity` elements, or more if they are plain.
  void relocate(unsigned int capacity);
  [[nodiscard]] bool isOwn(const T* p) const { return !std::less<>()(p, data_) && std::less<>()(p, data_ + size_); }

  T* data_ = Block::none();
  unsigned int size_ = 0;
  unsigned int capacity_ = 8;  ///< as shown, or less when size_ has grown beyond it: appending leaves it alone
};

template <typename T>
Array<T>::Array(unsigned int n) : Array() {
  if (n > UINT_MAX - 10) throw std::bad_array_new_length();
  reserveCapacity(n + 10);
  size_ = n;
}

template <typename T>
Array<T>& Array<T>::operator=(const Array& other) {
  if (this != &other) Array(other).swap(*this);
  return *this;
}

template <typename T>
Array<T>& Array<T>::operator=(Array&& other) noexcept {
  Array(std::move(other)).swap(*this);  // cppcheck-suppress accessMoved ; sees copies where there is none
  return *this;
}

template <typename T>
void Array<T>::swap(Array& other) noexcept {
  std::swap(data_, other.data_);
  std::swap(size_, other.size_);
  std::swap(capacity_, other.capacity_);
}

template <typename T>
void Array<T>::init(const Array& other) {
  capacity_ = other.getCapacity();
  if (other.data_ != Block::none()) {
    data_ = Block::allocate(Block::IS_PLAIN ? other.size_ : capacity_);
    std::copy_n(other.data_, other.size_, data_);
  }
  size_ = other.size_;
}

template <typename T>
void Array<T>::append(const T* p, unsigned int n) {
  if (n == 0) return;
  const bool own = isOwn(p);
  const size_t offset = own ? p - data_ : 0;
  makeRoom(n);
  std::copy_n(own ? data_ + offset : p, n, data_ + size_);
  size_ += n;
}

template <typename T>
void Array<T>::insert(unsigned int i, const T* p, unsigned int n) {
  if (i > size_) throwArrayIndexOutOfBounds(__LINE__);
  if (n == 0) return;
  if (isOwn(p)) {
    Array piece;
    piece.append(p, n);
    return insert(i, piece.data_, n);
  }
  makeRoom(n);
  if (i < size_) shift(i + n, i, size_ - i);
  std::copy_n(p, n, data_ + i);
  size_ += n;
}

template <typename T>
void Array<T>::remove(unsigned int i, unsigned int n) {
  if (i > size_ || n > size_ - i) throwArrayIndexOutOfBounds(__LINE__);
  capacity_ = getCapacity();
  if (i + n < size_) shift(i, i + n, size_ - (i + n));
  size_ -= n;
}

template <typename T>
void Array<T>::reserveCapacity(unsigned int n) {
  if (n <= getCapacity()) return;
  if (n > Block::capacity(data_)) relocate(n);
  capacity_ = n;
}

template <typename T>
void Array<T>::shift(unsigned int to, unsigned int from, unsigned int count) {
  if (to < from) {
    std::move(data_ + from, data_ + from + count, data_ + to);
  } else if (to > from) {
    std::move_backward(data_ + from, data_ + from + count, data_ + to + count);
  }
}

template <typename T>
void Array<T>::relocateFor(unsigned int n) {
  if (n > UINT_MAX - size_) throw std::bad_array_new_length();
  relocate(Block::IS_PLAIN ? size_ + n : std::max(size_ + n, capacity_));
}

template <typename T>
void Array<T>::relocate(unsigned int capacity) {
  if (Block::IS_PLAIN) {
    const unsigned int room = Block::capacity(data_);
    capacity = std::max({capacity, room <= UINT_MAX / 2 ? room * 2 : UINT_MAX, 16u});
  }
  if (T* const resized = Block::resize(data_, capacity)) {
    data_ = resized;
    return;
  }
  T* data = Block::allocate(capacity);
  std::move(data_, data_ + size_, data);
  Block::free(std::exchange(data_, data));
}

}  // namespace VMQ
