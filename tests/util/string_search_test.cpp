// Comparing, searching and slicing texts.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "range_error.h"
#include "test_seam.h"
#include "util/string.h"

using VMQ::String;

namespace {

constexpr unsigned int NPOS = String::NPOS;
constexpr unsigned short BACKSLASH = '\\';

String withZero(const char* before, const char* after) {
  String text(before);
  text.append(static_cast<unsigned short>(0));
  return text.append(String(after));
}

// ---- comparing ------------------------------------------------------------------------------------------------------

TEST(StringCompareTest, OrderIsThatOfTheUnits) {
  EXPECT_EQ(String::compare(String(), String()), 0);
  EXPECT_EQ(String::compare(String("ab"), String("ab")), 0);
  EXPECT_EQ(String::compare(String("b"), String("a")), 1);
  EXPECT_EQ(String::compare(String("a"), String("c")), -2);
  EXPECT_EQ(String::compare(String("B"), String("a")), 'B' - 'a');
}

TEST(StringCompareTest, ProperPrefixComesFirst) {
  EXPECT_EQ(String::compare(String("ab"), String("abc")), -1);
  EXPECT_EQ(String::compare(String("abc"), String("ab")), 1);
  EXPECT_EQ(String::compare(String(), String("a")), -1);
  EXPECT_EQ(String::compare(String("a"), String()), 1);
}

TEST(StringCompareTest, UnitsAreComparedUnsigned) {
  const unsigned short high[] = {0xFFFF, 0};
  const unsigned short low[] = {1, 0};
  EXPECT_EQ(String::compare(high, low), 0xFFFE);
  EXPECT_EQ(String::compare(low, high), -0xFFFE);
}

TEST(StringCompareTest, TextIsComparedUpToItsFirstZero) {
  EXPECT_EQ(String::compare(withZero("a", "x"), withZero("a", "y")), 0);
  EXPECT_TRUE(withZero("a", "x") == withZero("a", "y"));
  EXPECT_TRUE(withZero("a", "x") == String("a"));
  EXPECT_TRUE(withZero("", "x") == String());
  EXPECT_FALSE(withZero("a", "x") == String("b"));
  EXPECT_FALSE(withZero("ab", "x") == withZero("ac", "x"));
}

TEST(StringCompareTest, OperatorsTakeNarrowTextOnEitherSide) {
  const String text("abc");
  EXPECT_TRUE(text == String("abc"));
  EXPECT_TRUE(text == "abc");
  EXPECT_TRUE("abc" == text);
  EXPECT_FALSE(text == "ab");
  EXPECT_FALSE("abcd" == text);
  EXPECT_TRUE(text != String("abd"));
  EXPECT_TRUE(text != "ab");
  EXPECT_TRUE("ab" != text);
  EXPECT_FALSE(text != "abc");
  EXPECT_TRUE(String() == static_cast<const char*>(nullptr));
}

// ---- one character --------------------------------------------------------------------------------------------------

TEST(StringFindTest, CharacterIsFoundAtOrAfterTheStart) {
  const String text("abcabc");
  EXPECT_EQ(text.find('a', 0u), 0u);
  EXPECT_EQ(text.find('a', 1u), 3u);
  EXPECT_EQ(text.find('c', 5u), 5u);
  EXPECT_EQ(text.find('x', 0u), NPOS);
  EXPECT_EQ(text.find(static_cast<unsigned short>('b'), 2u), 4u);
  EXPECT_EQ(text.find(static_cast<unsigned short>(0), 0u), NPOS);
}

TEST(StringFindTest, SearchFromTheEndOrBeyondThrows) {
  const String text("abc");
  EXPECT_RANGE_ERROR(text.find('a', 3u));
  EXPECT_RANGE_ERROR(text.find('a', NPOS));
  EXPECT_RANGE_ERROR(text.find(static_cast<unsigned short>('a'), 3u));
  EXPECT_RANGE_ERROR(text.find(static_cast<unsigned short>('a'), BACKSLASH, 3u));
}

TEST(StringFindTest, SearchForACharacterInAnEmptyTextThrows) {
  const TEST_TraceCapture trace;
  EXPECT_RANGE_ERROR(String().find('x', 0u));
  EXPECT_RANGE_ERROR(String().find(static_cast<unsigned short>('x'), 0u));
  EXPECT_RANGE_ERROR(String().find(static_cast<unsigned short>('x'), BACKSLASH, 0u));
  EXPECT_EQ(trace.texts(RAS1_ERROR), std::vector<std::string>(3, "IndexOutOfBounds occurred, throwing exception"));
}

TEST(StringFindTest, CharFromTheUpperHalfNeverFindsALatinLetter) {
  String text;
  text.append(static_cast<unsigned short>(0x00E9)).append(static_cast<unsigned short>(0xFFE9));
  EXPECT_EQ(text.find('\xE9', 0u), 1u);
  EXPECT_EQ(text.find(static_cast<unsigned short>(0x00E9), 0u), 0u);
}

// ---- one character that is not escaped -----------------------------------------------------------------------------

struct Unescaped {
  const char* text;
  unsigned int start;
  unsigned int expected;
};

TEST(StringFindTest, EscapedCharacterIsPassedOver) {
  const Unescaped cases[] = {
      {"a,b", 0, 1},
      {"ab", 0, NPOS},
      {"\\,", 0, NPOS},
      {"\\,,", 0, 2},
      {"\\\\,", 0, 2},
      {"\\\\\\,", 0, NPOS},
      {"\\\\\\\\,", 0, 4},
      {"a\\,b,c", 0, 4},
      // What stands at the start counts, whatever precedes it ...
      {"a\\,b", 2, 2},
      // ... but behind the start the escapes before it count too.
      {"\\\\,", 1, 2},
      {"\\\\\\,", 2, NPOS},
      {",", 0, 0},
  };
  for (const Unescaped& c : cases) {
    EXPECT_EQ(String(c.text).find(static_cast<unsigned short>(','), BACKSLASH, c.start), c.expected)
        << c.text << " from " << c.start;
  }
}

// ---- a text ---------------------------------------------------------------------------------------------------------

TEST(StringFindTest, TextIsFoundAtOrAfterTheStart) {
  const String text("abcabcabd");
  EXPECT_EQ(text.find(String("abc"), 0), 0u);
  EXPECT_EQ(text.find(String("abc"), 1), 3u);
  EXPECT_EQ(text.find(String("abd"), 0), 6u);
  EXPECT_EQ(text.find(String("abd"), 6), 6u);
  EXPECT_EQ(text.find(String("abe"), 0), NPOS);
  EXPECT_EQ(text.find(text, 0), 0u);
  EXPECT_EQ(String("aaab").find(String("aab"), 0), 1u);
}

TEST(StringFindTest, SearchForATextNeverThrows) {
  EXPECT_EQ(String().find(String("x"), 0), NPOS);
  EXPECT_EQ(String("abc").find(String("abcd"), 0), NPOS);
  EXPECT_EQ(String("abc").find(String("c"), 3), NPOS);
  EXPECT_EQ(String("abc").find(String("c"), NPOS), NPOS);
  EXPECT_EQ(String("abc").find(String("abc"), 1), NPOS);
}

TEST(StringFindTest, EmptyTextIsNeverFound) {
  EXPECT_EQ(String("abc").find(String(), 0), NPOS);
  EXPECT_EQ(String().find(String(), 0), NPOS);
}

TEST(StringFindTest, TextIsFoundBehindAZero) {
  EXPECT_EQ(withZero("ab", "cd").find(String("cd"), 0), 3u);
  EXPECT_EQ(withZero("ab", "cd").find(withZero("b", "c"), 0), 1u);
}

// ---- from behind ----------------------------------------------------------------------------------------------------

TEST(StringFindTest, LastOccurrenceIsFoundButNeverTheFirstPosition) {
  EXPECT_EQ(String("abc").rfind('a'), NPOS);
  EXPECT_EQ(String("aba").rfind('a'), 2u);
  EXPECT_EQ(String("abc").rfind('b'), 1u);
  EXPECT_EQ(String("abc").rfind('x'), NPOS);
  EXPECT_EQ(String().rfind('a'), NPOS);
  EXPECT_EQ(String("abc").rfind(0), 3u);
}

// ---- slicing --------------------------------------------------------------------------------------------------------

TEST(StringSubstrTest, PieceIsANewText) {
  const String text("abcdef");
  EXPECT_EQ(text.substr(1u, 3u), "bcd");
  EXPECT_EQ(text.substr(0u, 6u), "abcdef");
  EXPECT_EQ(text.substr(5u, 1u), "f");
  EXPECT_EQ(text.substr(4u), "ef");
  EXPECT_EQ(text.substr(0u), "abcdef");
}

TEST(StringSubstrTest, PieceWithoutUnitsOrBeyondTheEndThrows) {
  const String text("abc");
  EXPECT_RANGE_ERROR(text.substr(0u, 0u));
  EXPECT_RANGE_ERROR(text.substr(3u, 0u));
  EXPECT_RANGE_ERROR(text.substr(3u, 1u));
  EXPECT_RANGE_ERROR(text.substr(1u, 3u));
  EXPECT_RANGE_ERROR(text.substr(1u, NPOS));
  EXPECT_RANGE_ERROR(text.substr(NPOS, 1u));
  EXPECT_RANGE_ERROR(text.substr(3u));
  EXPECT_RANGE_ERROR(text.substr(NPOS));
  EXPECT_RANGE_ERROR(String().substr(0u));
}

TEST(StringSubstrTest, PieceCanBeAssignedToItsText) {
  String text("abcdef");
  text = text.substr(2u, 3u);
  EXPECT_EQ(text, "cde");
}

// ---- replacing ------------------------------------------------------------------------------------------------------

struct Replacement {
  const char* text;
  const char* from;
  const char* to;
  const char* expected;
};

TEST(StringReplaceTest, OccurrencesAreReplacedFromLeftToRight) {
  const Replacement cases[] = {
      {"aaa", "a", "bb", "bbbbbb"}, {"abc", "", "x", "abc"},  {"", "a", "x", ""},       {"abc", "x", "y", "abc"},
      {"abcabc", "b", "", "acac"},  {"aaa", "aa", "b", "ba"}, {"abc", "abc", "", ""},   {"xaxbx", "x", "-", "-a-b-"},
      {"aa", "a", "aa", "aaaa"},    {"a.b", ".", ".", "a.b"}, {"abcd", "cd", "", "ab"},
  };
  for (const Replacement& c : cases) {
    EXPECT_EQ(String::replace(String(c.text), String(c.from), String(c.to)), c.expected)
        << c.text << ": " << c.from << " by " << c.to;
  }
}

TEST(StringReplaceTest, TracesWhatItIsGivenAndWhatItReturns) {
  const String first("the first conversion traces its code page");
  const TEST_TraceCapture trace;
  (void)String::replace(String("a-b"), String("-"), String("+"));
  EXPECT_EQ(trace.texts(RAS1_DETAIL), (std::vector<std::string>{"Str [a-b], replace [-] with [+]", "Returning [a+b]"}));
}

TEST(StringReplaceTest, TracesTooWhenThereIsNothingToReplace) {
  const String first("the first conversion traces its code page");
  const TEST_TraceCapture trace;
  (void)String::replace(String("ab"), String("-"), String("+"));
  EXPECT_EQ(trace.texts(RAS1_DETAIL), (std::vector<std::string>{"Str [ab], replace [-] with [+]", "Returning [ab]"}));
}

}  // namespace
