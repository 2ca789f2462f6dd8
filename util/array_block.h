#pragma once
// The memory behind an Array: a header that says how many elements fit, then the elements, every one of them
// constructed. Used by util/array.h only.
//
// Large blocks of plain elements come from malloc, because realloc moves their pages instead of copying them, and ask for
// huge pages: without both, collecting 64 MiB of a command's output is mostly touching fresh pages, over and over.

#include <malloc.h>
#include <sys/mman.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
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
    const size_t size = sizeOf(capacity);
    void* const memory = isLarge(capacity) ? preferHugePages(checked(std::malloc(size))) : ::operator new(size);
    T* elements = begin(memory, capacity);
    std::uninitialized_default_construct_n(elements, capacity);
    return elements;
  }

  /// A block of another capacity in place of this one, its elements kept; null, and nothing changed, when only a new
  /// block and copying will do.
  static T* resize(T* elements, unsigned int to) {
    if (elements == none() || !isLarge(capacity(elements)) || !isLarge(to)) return nullptr;
    return begin(preferHugePages(checked(std::realloc(memoryOf(elements), sizeOf(to)))), to);
  }

  static void free(T* elements) noexcept {
    if (elements == none()) return;
    std::destroy_n(elements, capacity(elements));
    if (isLarge(capacity(elements))) {
      std::free(memoryOf(elements));
    } else {
      ::operator delete(memoryOf(elements));
    }
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
  static constexpr size_t LARGE = size_t{1} << 20;
  static constexpr uintptr_t PAGE = 4096;

  static bool isLarge(unsigned int capacity) noexcept { return IS_PLAIN && capacity >= LARGE / sizeof(T); }
  static size_t sizeOf(unsigned int capacity) {
    if (capacity > (SIZE_MAX - OFFSET) / sizeof(T)) throw std::bad_array_new_length();
    return OFFSET + capacity * sizeof(T);
  }
  static void* memoryOf(T* elements) noexcept { return reinterpret_cast<char*>(elements) - OFFSET; }
  static T* begin(void* memory, unsigned int capacity) noexcept {
    new (memory) Header{capacity};
    return reinterpret_cast<T*>(static_cast<char*>(memory) + OFFSET);
  }
  static void* preferHugePages(void* memory) noexcept {
    // The whole mapping or nothing: one that only partly wants huge pages cannot be moved any more.
    const uintptr_t start = reinterpret_cast<uintptr_t>(memory);
    const uintptr_t first = start / PAGE * PAGE;
    const uintptr_t end = (start + malloc_usable_size(memory) + PAGE - 1) / PAGE * PAGE;
    (void)madvise(reinterpret_cast<void*>(first), end - first, MADV_HUGEPAGE);  // NOLINT(*-int-to-ptr): a mere wish
    return memory;
  }
  static void* checked(void* memory) {
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
  }

  static_assert(alignof(T) <= __STDCPP_DEFAULT_NEW_ALIGNMENT__);
  static_assert(offsetof(None, element) == OFFSET);
  static_assert(std::is_nothrow_default_constructible_v<T> && std::is_nothrow_move_assignable_v<T>,
                "a block is filled and moved without a way back");

  inline static constinit const None none_{};
};

}  // namespace VMQ
