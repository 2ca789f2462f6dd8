// In place of the remote-procedure runtime's own: gives a call a megabyte at most, so that a count of 65535 blocks
// costs no quarter of a gigabyte each time, and lack of memory is met often.

#include <algorithm>
#include <cstdlib>

#include "fuzz/transfer_model.h"
#include "rpc.h"

#pragma GCC visibility push(default)
void* rpc__malloc(uint32_t bytes) {
  return bytes > fuzz::memoryForCalls ? nullptr : std::malloc(std::max(bytes, uint32_t{1}));
}
#pragma GCC visibility pop
