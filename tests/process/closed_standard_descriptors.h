#pragma once
// A host that was started without standard descriptors.

#include <fcntl.h>
#include <unistd.h>

/// Closes 0, 1 and 2 and brings them back. What is opened meanwhile at these numbers is closed.
class ClosedStandardDescriptors {
 public:
  ClosedStandardDescriptors() {
    for (int i = 0; i < 3; ++i) {
      saved_[i] = fcntl(i, F_DUPFD_CLOEXEC, 10);
      close(i);
    }
  }
  ~ClosedStandardDescriptors() {
    for (int i = 0; i < 3; ++i) {
      dup2(saved_[i], i);
      close(saved_[i]);
    }
  }
  ClosedStandardDescriptors(const ClosedStandardDescriptors&) = delete;
  ClosedStandardDescriptors& operator=(const ClosedStandardDescriptors&) = delete;

 private:
  int saved_[3];
};
