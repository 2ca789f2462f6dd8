#pragma once
// Fails the running test when what happened in a block has left descriptors, threads or children.

#include "tests/support/process_resources.h"

class NothingLeftBehind {
 public:
  NothingLeftBehind();
  /// Gives threads and children that are about to end a few seconds for it.
  ~NothingLeftBehind();
  NothingLeftBehind(const NothingLeftBehind&) = delete;
  NothingLeftBehind& operator=(const NothingLeftBehind&) = delete;

 private:
  ProcessResources before_;
};
