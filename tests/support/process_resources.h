#pragma once
// What this process holds, to show that a piece of work leaves nothing behind.

#include <ostream>

struct ProcessResources {
  unsigned descriptors = 0;
  unsigned threads = 0;
  unsigned children = 0;  ///< running or not yet reaped

  static ProcessResources now();
  bool operator==(const ProcessResources&) const = default;
};

std::ostream& operator<<(std::ostream& out, const ProcessResources& resources);
