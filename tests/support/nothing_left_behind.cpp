#include "tests/support/nothing_left_behind.h"

#include <gtest/gtest.h>

#include <thread>

#include "tests/support/eventually.h"

namespace {

/// ThreadSanitizer starts a thread of its own with the first that the program starts.
void startHiddenThread() {
  [[maybe_unused]] static const bool once = [] {
    std::thread([] {}).join();
    return true;
  }();
}

bool leavesNothing(const ProcessResources& before, const ProcessResources& now) {
  // A thread that was just about to go when the block began may be counted before it.
  return now.descriptors == before.descriptors && now.threads <= before.threads && now.children == before.children;
}

}  // namespace

NothingLeftBehind::NothingLeftBehind() {
  startHiddenThread();
  before_ = ProcessResources::now();
}

NothingLeftBehind::~NothingLeftBehind() {
  if (!eventually([this] { return leavesNothing(before_, ProcessResources::now()); })) {
    EXPECT_EQ(ProcessResources::now(), before_);
  }
}
