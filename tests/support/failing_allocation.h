#pragma once
// Makes one allocation of this process fail. The source stands in the list of the programs that want it: it replaces
// the program's operator new.

#include <cstddef>

/// While it lives, the next allocation of at least so many bytes on this thread fails, once.
class FailingAllocation {
 public:
  explicit FailingAllocation(size_t minimum_bytes);
  ~FailingAllocation();
  FailingAllocation(const FailingAllocation&) = delete;
  FailingAllocation& operator=(const FailingAllocation&) = delete;

  [[nodiscard]] bool happened() const;
};
