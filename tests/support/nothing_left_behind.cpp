#include "tests/support/nothing_left_behind.h"

#include <gtest/gtest.h>

#include "tests/support/eventually.h"

NothingLeftBehind::~NothingLeftBehind() {
  // A joined thread may still be listed for a moment.
  if (!eventually([this] { return ProcessResources::now() == before_; })) {
    EXPECT_EQ(ProcessResources::now(), before_);
  }
}
