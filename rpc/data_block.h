#pragma once
// A piece of a file as it travels.

#include <cstddef>
#include <cstdint>

struct DataBlock {
  int32_t length;  ///< valid bytes of `data`, from its start
  unsigned char data[4096];
};
static_assert(sizeof(DataBlock) == 4100 && offsetof(DataBlock, data) == 4);
