// Memory and packets of calls.

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <new>

#include "rpc.h"
#include "seam.h"

namespace {

// A packet and its body are one block.
constexpr size_t bodyOffset = 16;
static_assert(sizeof(rpc__packet) <= bodyOffset);

}  // namespace

void* rpc__malloc(uint32_t bytes) {
  if (int status; vmqhost::seam::fails("rpc__malloc", &status)) return nullptr;
  return std::malloc(std::max(bytes, uint32_t{1}));
}

void rpc__free(void* memory) {
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
