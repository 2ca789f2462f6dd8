#pragma once
// A file that the C library has opened.

#include <cstdio>
#include <memory>

namespace VMQ {

/// For a stream that nobody has closed: whatever kept its owner from that counts, not how this one ends.
struct CloseStream {
  void operator()(FILE* stream) const { (void)std::fclose(stream); }
};

/// Closed when it goes, also by an exception. Who wants to know whether closing has worked releases it to `fclose`.
using Stream = std::unique_ptr<FILE, CloseStream>;

}  // namespace VMQ
