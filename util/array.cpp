#include "util/array.h"

#include <cstdio>

#include "util/index_out_of_bounds_exception.h"

namespace VMQ {

[[gnu::cold]] void throwArrayIndexOutOfBounds(int line) {
  constexpr const char* file = "vmqarryi";
  (void)std::printf("IndexOutOfBoundsException %s:%d\n", file, line);  // the exception says the same
  throw IndexOutOfBoundsException(line, file);
}

}  // namespace VMQ
