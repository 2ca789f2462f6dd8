#pragma once
// What a process takes.

#include <sys/types.h>

struct Footprint {
  double requests = 0;  ///< that it has answered until then
  long resident_kib = 0;
  unsigned threads = 0;
  unsigned descriptors = 0;
  unsigned children = 0;

  static Footprint of(pid_t process);
};
