// Names that would leave their directory.
#include "util/parent_component.h"

#include <gtest/gtest.h>

using VMQ::hasParentComponent;
using VMQ::String;

namespace {

TEST(ParentComponentTest, IsFoundWhereverItStands) {
  for (const char* const path : {"..", "../a", "a/..", "a/../b", "/..", "a//../b"}) {
    EXPECT_TRUE(hasParentComponent(String(path))) << path;
  }
}

TEST(ParentComponentTest, DotsThatAreNoComponentOfTheirOwnAreFine) {
  for (const char* const path : {"", ".", "...", "a..", "..a/b", "a/..b", "a/b../c", "./a"}) {
    EXPECT_FALSE(hasParentComponent(String(path))) << path;
  }
}

}  // namespace
