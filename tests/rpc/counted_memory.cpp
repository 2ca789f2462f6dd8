#include "tests/rpc/counted_memory.h"

#include <mutex>

#include "rpc.h"

namespace {

std::mutex& mutex = *new std::mutex;
std::vector<uint32_t>& sizes = *new std::vector<uint32_t>;  // guarded by mutex, like what follows
int blocksHeld = 0;
bool counting = false;

}  // namespace

CountedMemory::CountedMemory() {
  const std::lock_guard held(mutex);
  sizes.clear();
  blocksHeld = 0;
  counting = true;
}

CountedMemory::~CountedMemory() {
  const std::lock_guard held(mutex);
  counting = false;
}

std::vector<uint32_t> CountedMemory::taken() const {
  const std::lock_guard held(mutex);
  return sizes;
}

int CountedMemory::held() const {
  const std::lock_guard held(mutex);
  return blocksHeld;
}

#pragma GCC visibility push(default)
extern "C" {

void* __real_rpc__malloc(uint32_t);
void __real_rpc__free(void*);

void* __wrap_rpc__malloc(uint32_t bytes) {
  void* const block = __real_rpc__malloc(bytes);
  const std::lock_guard held(mutex);
  if (!counting) return block;
  sizes.push_back(bytes);
  if (block != nullptr) ++blocksHeld;
  return block;
}

void __wrap_rpc__free(void* block) {
  {
    const std::lock_guard held(mutex);
    if (counting && block != nullptr) --blocksHeld;
  }
  __real_rpc__free(block);
}

}  // extern "C"
#pragma GCC visibility pop
