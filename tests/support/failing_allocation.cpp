#include "tests/support/failing_allocation.h"

#include <cstdint>
#include <cstdlib>
#include <new>

namespace {

constexpr size_t kNothingFails = SIZE_MAX;
thread_local size_t smallestToFail = kNothingFails;

void* allocate(size_t bytes) {
  if (bytes >= smallestToFail) {
    smallestToFail = kNothingFails;
    return nullptr;
  }
  return std::malloc(bytes == 0 ? 1 : bytes);
}

}  // namespace

void* operator new(size_t bytes) {
  void* const block = allocate(bytes);
  if (block == nullptr) throw std::bad_alloc();
  return block;
}
void* operator new(size_t bytes, const std::nothrow_t&) noexcept {
  return allocate(bytes);
}
// The forms for arrays call the ones above by default, but not in the sanitizers' libraries.
void* operator new[](size_t bytes) {
  return operator new(bytes);
}
void* operator new[](size_t bytes, const std::nothrow_t&) noexcept {
  return allocate(bytes);
}
void operator delete(void* block) noexcept {
  std::free(block);
}
void operator delete[](void* block) noexcept {
  std::free(block);
}
void operator delete[](void* block, size_t) noexcept {
  std::free(block);
}
void operator delete[](void* block, const std::nothrow_t&) noexcept {
  std::free(block);
}
void operator delete(void* block, size_t) noexcept {
  std::free(block);
}
void operator delete(void* block, const std::nothrow_t&) noexcept {
  std::free(block);
}

FailingAllocation::FailingAllocation(size_t minimum_bytes) {
  smallestToFail = minimum_bytes;
}

FailingAllocation::~FailingAllocation() {
  smallestToFail = kNothingFails;
}

bool FailingAllocation::happened() const {
  return smallestToFail == kNothingFails;
}
