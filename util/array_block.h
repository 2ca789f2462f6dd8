#pragma once
// The memory behind an Array: a header that says how many elements fit, then the elements, every one of them
// constructed. Used by util/array.h only.

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>
#include <type_traits>

namespace VMQ {

template <typename T>
class ArrayBlock {
 public:
  static constexpr bool IS_PLAIN = std::is_trivially_copyable_v<T> && std::is_trivially_default_constructible_v<T>;

  /// The block of arrays that never held anything: no room, never written, never freed. When T is plain, one zero can
  /// be read from it.
  static T* none() noexcept { return reinterpret_cast<T*>(const_cast<Element*>(&none_.element)); }

  /// How many elements fit.
  static unsigned int capacity(const T* elements) noexcept {
    return reinterpret_cast<const Header*>(reinterpret_cast<const char*>(elements) - OFFSET)->capacity;
  }

  /// Plain elements are left uninitialised.
  static T* allocate(unsigned int capacity) {
    if (capacity > (SIZE_MAX - OFFSET) / sizeof(T)) throw std::bad_array_new_length();
    char* memory = static_cast<char*>(::operator new(OFFSET + capacity * sizeof(T)));
    new (memory) Header{capacity};
    T* elements = reinterpret_cast<T*>(memory + OFFSET);
    std::uninitialized_default_construct_n(elements, capacity);
    return elements;
  }

  static void free(T* elements) noexcept {
    if (elements == none()) return;
    std::destroy_n(elements, capacity(elements));
    ::operator delete(reinterpret_cast<char*>(elements) - OFFSET);
  }

 private:
  struct alignas(8) Header {
    unsigned int capacity;
  };
  // A static object with a destructor could go before its last user; elements that have one are never read from here.
  struct alignas(T) Bytes {
    unsigned char bytes[sizeof(T)];
  };
  using Element = std::conditional_t<IS_PLAIN, T, Bytes>;
  struct None {
    Header header;
    Element element;
  };
  static constexpr size_t OFFSET = std::max(sizeof(Header), alignof(T));

  static_assert(alignof(T) <= __STDCPP_DEFAULT_NEW_ALIGNMENT__);
  static_assert(offsetof(None, element) == OFFSET);
  static_assert(std::is_nothrow_default_constructible_v<T> && std::is_nothrow_move_assignable_v<T>,
                "a block is filled and moved without a way back");

  inline static constinit const None none_{};
};

}  // namespace VMQ
