// The owning narrow copy of a text.
#include "util/char_star.h"

#include <gtest/gtest.h>

#include <cstring>

using VMQ::CharStar;

namespace {

TEST(CharStarTest, HoldsACopyOfItsOwn) {
  char text[] = "text";
  const CharStar copy(text);
  text[0] = 'n';
  EXPECT_STREQ(copy.get(), "text");
}

TEST(CharStarTest, ConvertsToItsBuffer) {
  CharStar text("text");
  const char* read = text;
  char* written = text;
  // cppcheck-suppress knownConditionTrueFalse ; that is what is tested
  EXPECT_EQ(read, written);
  EXPECT_EQ(read, text.get());
  written[0] = 'n';
  EXPECT_STREQ(text.get(), "next");
}

TEST(CharStarTest, CopiesAreDeep) {
  CharStar text("text");
  const CharStar copy(text);
  CharStar assigned("something longer");
  assigned = text;
  static_cast<char*>(text)[0] = 'n';
  EXPECT_STREQ(copy.get(), "text");
  EXPECT_STREQ(assigned.get(), "text");
}

TEST(CharStarTest, CanBeAssignedToItself) {
  CharStar text("text");
  const CharStar& same = text;
  text = same;
  EXPECT_STREQ(text.get(), "text");
}

TEST(CharStarTest, NullIsEmpty) {
  EXPECT_STREQ(CharStar(nullptr).get(), "");
}

}  // namespace
