#include "fuzz/support.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>

#include "ras1.h"

int LLVMFuzzerInitialize(int*, char***) {
  char error[256];
  setenv("KBB_RAS1", "none", /*overwrite=*/1);
  fuzz::require(RAS1_Configure(error, sizeof error), "the traces can be turned off");
  return 0;
}

namespace fuzz {

void require(bool holds, const char* promise) {
  if (holds) return;
  (void)std::fprintf(stderr, "Broken promise: %s\n", promise);
  std::abort();
}

std::string upToNull(const uint8_t* data, size_t size) {
  const std::string_view input(reinterpret_cast<const char*>(data), size);
  return std::string(input.substr(0, input.find('\0')));
}

uint8_t Input::byte() {
  const std::string_view one = take(1);
  return one.empty() ? 0 : static_cast<uint8_t>(one[0]);
}

unsigned Input::below(unsigned limit) {
  unsigned value = byte();
  if (limit > 256) value = value << 8 | byte();
  return value % limit;
}

std::string_view Input::take(size_t bytes) {
  const std::string_view taken = rest_.substr(0, bytes);
  rest_.remove_prefix(taken.size());
  return taken;
}

}  // namespace fuzz
