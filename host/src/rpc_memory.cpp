// Memory and packets of calls.

#include <malloc.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <new>

#include "rpc.h"
#include "seam.h"

namespace {

// A packet and its body are one block.
constexpr size_t bodyOffset = 16;
static_assert(sizeof(rpc__packet) <= bodyOffset);

// Of such a size, the block that was given back last waits for the next call: to get its pages from the system anew,
// for each piece of a pushed file, takes longer than to fill them.
constexpr size_t smallestSpareBytes = size_t{128} * 1024;
constexpr size_t largestSpareBytes = size_t{8} * 1024 * 1024;
constinit std::atomic<void*> spare = nullptr;

}  // namespace

void* rpc__malloc(uint32_t bytes) {
  if (int status; vmqhost::seam::fails("rpc__malloc", &status)) return nullptr;
  if (bytes >= smallestSpareBytes) {
    void* const block = spare.exchange(nullptr);
    if (malloc_usable_size(block) >= bytes) return block;
    std::free(block);
  }
  return std::malloc(std::max(bytes, uint32_t{1}));
}

void rpc__free(void* memory) {
  const size_t bytes = malloc_usable_size(memory);
  if (bytes >= smallestSpareBytes && bytes <= largestSpareBytes) memory = spare.exchange(memory);
  std::free(memory);
}

void rpc__block_copy(const void* from, void* to, uint32_t bytes) {
  if (bytes > 0) std::memcpy(to, from, bytes);  // nothing may come from nowhere
}

rpc__packet* rpc__alloc_pkt(uint32_t body_bytes) {
  if (int status; vmqhost::seam::fails("rpc__alloc_pkt", &status)) return nullptr;
  auto* const block = static_cast<unsigned char*>(std::malloc(bodyOffset + body_bytes));
  return block == nullptr ? nullptr : new (block) rpc__packet{block + bodyOffset, body_bytes};
}

void rpc__free_pkt(rpc__packet* packet) {
  std::free(packet);
}
