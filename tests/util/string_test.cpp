// Building, reading and changing texts.
#include "util/string.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "range_error.h"
#include "test_seam.h"
#include "tests/support/failing_allocation.h"

using VMQ::String;

namespace {

using Units = std::vector<unsigned short>;

/// The units, after a look at the terminator behind them.
Units unitsOf(const String& text) {
  EXPECT_EQ(text.getData()[text.length()], 0);
  return {text.getData(), text.getData() + text.length()};
}

String textOf(const Units& units) {
  String text;
  for (const unsigned short unit : units) text.append(unit);
  return text;
}

// ---- building -----------------------------------------------------------------------------------------------------

TEST(StringTest, NewTextIsEmptyAndTerminated) {
  const String text;
  EXPECT_EQ(text.length(), 0u);
  EXPECT_EQ(text.size(), 0u);
  ASSERT_NE(text.getData(), nullptr);
  EXPECT_EQ(text.getData()[0], 0);
}

TEST(StringTest, NarrowTextBecomesUnits) {
  const String text("abc");
  EXPECT_EQ(text.length(), 3u);
  EXPECT_EQ(text.size(), 3u);
  EXPECT_EQ(unitsOf(text), (Units{'a', 'b', 'c'}));
}

TEST(StringTest, CountedNarrowTextEndsAtItsCountOrItsNul) {
  EXPECT_EQ(String("abcdef", 3u), "abc");
  EXPECT_EQ(String("abc", 100u), "abc");
  EXPECT_EQ(String("abc", String::NPOS), "abc");
  EXPECT_EQ(String("abc", 0u), "");
  const char unterminated[] = {'x', 'y'};
  EXPECT_EQ(String(unterminated, 2u), "xy");
}

TEST(StringTest, UnitsAreCopiedUpToTheirZero) {
  const unsigned short units[] = {'a', 0x00E9, 0xD83D, 0xDE00, 0, 'z'};
  EXPECT_EQ(unitsOf(String(units)), (Units{'a', 0x00E9, 0xD83D, 0xDE00}));
}

TEST(StringTest, CopyOfTheFirstUnitsIsNeverLongerThanTheText) {
  const String text("abc");
  EXPECT_EQ(String(text, 2u), "ab");
  EXPECT_EQ(String(text, 0u), "");
  EXPECT_EQ(String(text, 4u), "abc");
  EXPECT_EQ(String(text, String::NPOS), "abc");
  EXPECT_EQ(String().assign(text, String::NPOS), "abc");
}

TEST(StringTest, NullIsTheEmptyText) {
  EXPECT_EQ(String(nullptr).length(), 0u);
  EXPECT_EQ(String(static_cast<const char*>(nullptr)).length(), 0u);
  EXPECT_EQ(String(static_cast<const char*>(nullptr), 3u).length(), 0u);
  EXPECT_EQ(String(static_cast<const unsigned short*>(nullptr)).length(), 0u);
  String text("abc");
  EXPECT_EQ(unitsOf(text.assign(static_cast<const char*>(nullptr))), Units());
  text = "abc";
  EXPECT_EQ(unitsOf(text.assign(static_cast<const char*>(nullptr), 2u)), Units());
  text = "abc";
  EXPECT_EQ(unitsOf(text.assign(static_cast<const unsigned short*>(nullptr))), Units());
  text = "abc";
  EXPECT_EQ(unitsOf(text.assign(static_cast<const unsigned short*>(nullptr), 2u)), Units());
  text = "abc";
  text = static_cast<const unsigned short*>(nullptr);
  EXPECT_EQ(unitsOf(text), Units());
}

template <class Text>
concept ConstructibleFromZero = requires {
  Text(0);
};

TEST(StringTest, ZeroIsNoText) {
  // Neither a unit, nor a null pointer of one kind: the caller has to say which.
  EXPECT_FALSE(ConstructibleFromZero<String>);
}

TEST(StringTest, AssignmentReplacesTheText) {
  const unsigned short units[] = {'x', 'y', 0, 'z'};
  String text("before");
  text = String("after");
  EXPECT_EQ(text, "after");
  text = units;
  EXPECT_EQ(text, "xy");
  EXPECT_EQ(text.assign("narrow"), "narrow");
  EXPECT_EQ(text.assign("narrow", 3u), "nar");
  EXPECT_EQ(text.assign(units), "xy");
  EXPECT_EQ(text.assign(String("another")), "another");
  EXPECT_EQ(&text.assign("same object"), &text);
}

TEST(StringTest, CountedUnitsAreAssignedWithTheirZeros) {
  const unsigned short units[] = {'x', 0, 'z'};
  String text;
  EXPECT_EQ(unitsOf(text.assign(units, 3u)), (Units{'x', 0, 'z'}));
}

TEST(StringTest, AssigningATextToItselfDoesNothing) {
  String text("abc");
  const String& same = text;
  text = same;
  EXPECT_EQ(text, "abc");
  EXPECT_EQ(text.assign(text), "abc");
  String empty;
  const String& same_empty = empty;
  empty = same_empty;
  EXPECT_EQ(empty, "");
}

TEST(StringTest, PieceOfATextCanBeAssignedToIt) {
  String text("abcdef");
  EXPECT_EQ(text.assign(text.getData() + 2), "cdef");
  EXPECT_EQ(text.assign(text.getData() + 1, 2u), "de");
  EXPECT_EQ(unitsOf(text.assign(text.getData(), 3u)), (Units{'d', 'e', 0}));
  String full(String("abcdef"), 6u);
  full = String(full);  // a copy has no room to spare
  EXPECT_EQ(unitsOf(full.assign(full.getData(), 7u)), (Units{'a', 'b', 'c', 'd', 'e', 'f', 0}));
  String large;
  for (int i = 0; i < 10000; ++i) large.append(static_cast<unsigned short>('a' + i % 26));
  EXPECT_EQ(large.assign(large.getData() + 26, 3u), "abc");
}

TEST(StringTest, TextThatShrinksALotCanGrowAgain) {
  String text;
  for (int i = 0; i < 10000; ++i) text.append('x');
  text = "short";
  EXPECT_EQ(text, "short");
  text.append(String(" again"));
  EXPECT_EQ(text, "short again");
}

TEST(StringTest, ClearedTextIsEmptyAndCanBeUsedAgain) {
  String text("abc");
  text.clear();
  EXPECT_EQ(unitsOf(text), Units());
  text.append('x');
  EXPECT_EQ(text, "x");
}

TEST(StringTest, MovedFromTextIsEmptyAndTerminated) {
  String text("abc");
  String taken(std::move(text));
  EXPECT_EQ(taken, "abc");
  EXPECT_EQ(unitsOf(text), Units());  // NOLINT(bugprone-use-after-move): what it is now is what is tested
  text.append('x');
  taken = std::move(text);
  EXPECT_EQ(taken, "x");
  EXPECT_EQ(unitsOf(text), Units());  // NOLINT(bugprone-use-after-move)
  String& same = taken;
  taken = std::move(same);
  EXPECT_EQ(taken, "x");
}

TEST(StringTest, EmptyTextsDoNotShareWhatIsAppendedToOne) {
  String one;
  const String another;
  one.append('x');
  EXPECT_EQ(one, "x");
  EXPECT_EQ(another.getData()[0], 0);
  EXPECT_EQ(String().getData()[0], 0);
}

TEST(StringTest, HoldsNothingButItsArray) {
  EXPECT_TRUE(std::has_virtual_destructor_v<String>);
  EXPECT_EQ(sizeof(String), sizeof(void*) + sizeof(VMQ::Array<unsigned short>));
}

// ---- reading ------------------------------------------------------------------------------------------------------

TEST(StringTest, IndexReachesTheTerminatorAndNoFurther) {
  String text("abc");
  EXPECT_EQ(text[0], 'a');
  EXPECT_EQ(text[3], 0);
  EXPECT_EQ(std::as_const(text)[3], 0);
  EXPECT_RANGE_ERROR(text[4]);
  EXPECT_RANGE_ERROR(std::as_const(text)[4]);
  EXPECT_RANGE_ERROR(text[String::NPOS]);
  EXPECT_EQ(String()[0], 0);
  EXPECT_RANGE_ERROR(String()[1]);
}

TEST(StringTest, IndexGivesAValueThatCannotChangeTheText) {
  EXPECT_TRUE((std::is_same_v<decltype(std::declval<String&>()[0]), unsigned short>));
}

TEST(StringTest, RangeErrorIsTracedAndNamesTheFile) {
  const TEST_TraceCapture trace;
  const String text("abc");
  const std::string error = rangeErrorOf([&] { (void)text[4]; });
  int line = 0;
  ASSERT_EQ(std::sscanf(error.c_str(), "line: %d", &line), 1) << error;
  EXPECT_GT(line, 0);
  EXPECT_EQ(error, "line: " + std::to_string(line) + ", file: vmqstr");
  EXPECT_EQ(trace.texts(RAS1_ERROR), (std::vector<std::string>{"IndexOutOfBounds occurred, throwing exception"}));
}

// ---- appending and erasing ------------------------------------------------------------------------------------------

TEST(StringTest, UnitsAndTextsAreAppended) {
  String text;
  EXPECT_EQ(&text.append('a'), &text);
  text.append(String("bc")).append(String("defg"), 2u).append(String()).append(String("x"), 0u);
  EXPECT_EQ(text, "abcde");
  EXPECT_EQ(unitsOf(text.append(static_cast<unsigned short>(0x20AC))), (Units{'a', 'b', 'c', 'd', 'e', 0x20AC}));
}

TEST(StringTest, ZeroUnitCanBeAppended) {
  EXPECT_EQ(unitsOf(textOf({'a', 0, 'b'})), (Units{'a', 0, 'b'}));
}

TEST(StringTest, AppendingMoreThanATextHasThrows) {
  String text("abc");
  EXPECT_RANGE_ERROR(text.append(String("xy"), 3u));
  EXPECT_RANGE_ERROR(text.append(String("xy"), String::NPOS));
  EXPECT_RANGE_ERROR(text.append(String(), 1u));
  EXPECT_EQ(text, "abc");
}

TEST(StringTest, TextIsAppendedToItselfAsIfCopiedFirst) {
  String text("abc");
  text.append(text);
  EXPECT_EQ(text, "abcabc");
  text.append(text, 2u);
  EXPECT_EQ(text, "abcabcab");
  for (int i = 0; i < 10; ++i) text.append(text);
  EXPECT_EQ(text.length(), 8u * 1024);
  EXPECT_EQ(text.substr(8u * 1023), "abcabcab");
}

TEST(StringTest, TextWhoseGrowthFailsStaysAsItWas) {
  String text("abc");
  String large;
  for (int i = 0; i < 1000; ++i) large.append('x');
  {
    const FailingAllocation failing(1000);
    EXPECT_THROW(text.append(large), std::bad_alloc);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(unitsOf(text), (Units{'a', 'b', 'c'}));
  const FailingAllocation failing(1000);
  EXPECT_THROW(text = large, std::bad_alloc);
  EXPECT_EQ(unitsOf(text), (Units{'a', 'b', 'c'}));
}

TEST(StringTest, ErasedUnitsAreGone) {
  EXPECT_EQ(String("abcdef").erase(2u), "ab");
  EXPECT_EQ(String("abcdef").erase(0u), "");
  EXPECT_EQ(String("abcdef").erase(1u, 2u), "adef");
  EXPECT_EQ(String("abcdef").erase(5u, 1u), "abcde");
  EXPECT_EQ(unitsOf(String("abc").erase(0u, 3u)), Units());
}

TEST(StringTest, ErasingNothingOrBeyondTheEndThrowsAndChangesNothing) {
  String text("abc");
  EXPECT_RANGE_ERROR(text.erase(0u, 0u));
  EXPECT_RANGE_ERROR(text.erase(3u));
  EXPECT_RANGE_ERROR(text.erase(4u));
  EXPECT_RANGE_ERROR(text.erase(String::NPOS));
  EXPECT_RANGE_ERROR(text.erase(3u, 0u));
  EXPECT_RANGE_ERROR(text.erase(1u, 3u));
  EXPECT_RANGE_ERROR(text.erase(1u, String::NPOS));
  EXPECT_RANGE_ERROR(text.erase(String::NPOS, 2u));
  EXPECT_RANGE_ERROR(String().erase(0u));
  EXPECT_EQ(text, "abc");
}

TEST(StringTest, SumOfTwoTextsIsANewOne) {
  const String left("ab");
  EXPECT_EQ(left + String("cd"), "abcd");
  EXPECT_EQ(left + "cd", "abcd");
  EXPECT_EQ("cd" + left, "cdab");
  EXPECT_EQ(left + String(), "ab");
  EXPECT_EQ(left, "ab");
}

// ---- trimming and case ----------------------------------------------------------------------------------------------

TEST(StringTest, WhiteSpaceIsTrimmedAtBothEnds) {
  EXPECT_EQ(unitsOf(String("  ").trim()), Units());
  EXPECT_EQ(unitsOf(String().trim()), Units());
  EXPECT_EQ(String(" a b ").trim(), "a b");
  EXPECT_EQ(String("a b").trim(), "a b");
  EXPECT_EQ(String("\t\r\n\v\f a").trim(), "a");
  EXPECT_EQ(String("a \t\r\n\v\f").trim(), "a");
  EXPECT_EQ(String("x").trim(), "x");
}

TEST(StringTest, WhiteSpaceIsWhatTheLocaleSays) {
  EXPECT_TRUE(String::isWhiteSpace(' '));
  EXPECT_TRUE(String::isWhiteSpace('\n'));
  EXPECT_FALSE(String::isWhiteSpace('a'));
  EXPECT_FALSE(String::isWhiteSpace(0));
  EXPECT_FALSE(String::isWhiteSpace(0xD83D));
}

TEST(StringTest, CaseIsChangedInPlace) {
  String text("aBc-1");
  EXPECT_EQ(&text.toUpper(), &text);
  EXPECT_EQ(text, "ABC-1");
  EXPECT_EQ(text.toLower(), "abc-1");
  EXPECT_EQ(unitsOf(String().toUpper().toLower()), Units());
}

// ---- escapes --------------------------------------------------------------------------------------------------------

TEST(StringTest, EscapesAreInsertedAndRemovedAgain) {
  String text("a\"b");
  EXPECT_EQ(text.insertEscapes('\\', String("\"")), "a\\\"b");
  EXPECT_EQ(text.length(), 4u);
  EXPECT_EQ(text.removeEscapes('\\'), "a\"b");
  EXPECT_EQ(text.length(), 3u);
}

struct Escapes {
  const char* text;
  const char* chars;
  const char* escaped;
};

TEST(StringTest, EveryListedCharacterIsEscaped) {
  const Escapes cases[] = {
      {"", "\"", ""},         {"abc", "", "abc"},       {"\"\"", "\"", "\\\"\\\""},   {"a b,c", " ,", "a\\ b\\,c"},
      {"a\\b", "\"", "a\\b"}, {"a\\b", "\\", "a\\\\b"}, {"\\\"", "\"\\", "\\\\\\\""},
  };
  for (const Escapes& c : cases) EXPECT_EQ(String(c.text).insertEscapes('\\', String(c.chars)), c.escaped) << c.text;
}

TEST(StringTest, TextCanBeEscapedByItsOwnCharacters) {
  String text("ab");
  EXPECT_EQ(text.insertEscapes('\\', text), "\\a\\b");
}

TEST(StringTest, LoneEscapeDisappearsAndOfTwoTheSecond) {
  const std::pair<const char*, const char*> cases[] = {
      {"", ""},
      {"abc", "abc"},
      {"\\a", "a"},
      {"a\\", "a"},
      {"\\", ""},
      {"\\\\", "\\"},
      {"a\\\\b", "a\\b"},
      {"\\a\\b", "ab"},
      // The unit that takes the place of a removed one is not looked at, so of three, and of four, two remain.
      {"\\\\\\", "\\\\"},
      {"\\\\\\\\", "\\\\"},
      {"a\\\\\\b", "a\\\\b"},
      {"a\\\\\\\\b", "a\\\\b"},
  };
  for (const auto& [text, expected] : cases) EXPECT_EQ(String(text).removeEscapes('\\'), expected) << text;
}

TEST(StringTest, TerminatorIsNoEscape) {
  EXPECT_EQ(unitsOf(String("abc").removeEscapes(0)), (Units{'a', 'b', 'c'}));
  EXPECT_EQ(unitsOf(String("abc").insertEscapes('x', textOf({0}))), (Units{'a', 'b', 'c'}));
}

// ---- diagnostic output ----------------------------------------------------------------------------------------------

std::string streamed(const String& text) {
  std::ostringstream out;
  out << text;
  return out.str();
}

TEST(StringTest, AsciiIsStreamedAsItIs) {
  EXPECT_EQ(streamed("a\tb\n\x7F"), "a\tb\n\x7F");
}

TEST(StringTest, EverythingElseIsStreamedAsHexadecimal) {
  EXPECT_EQ(streamed(textOf({0x00E9})), "\\x00E9");
  EXPECT_EQ(streamed(textOf({'a', 0x0080, 0xFFFF, 0, 'b'})), "a\\x0080\\xFFFF\\x0000b");
}

TEST(StringTest, StreamedNumbersAreNotAffected) {
  std::ostringstream out;
  out << std::hex << textOf({0x00E9}) << 255;
  EXPECT_EQ(out.str(), "\\x00E9ff");
}

// ---- buffers of units -----------------------------------------------------------------------------------------------

TEST(StringTest, UnicodeBuffersAreCreatedCopiedAndReleased) {
  unsigned short* whole = String::createUnicodeString("abc");
  unsigned short* part = String::createUnicodeString("abc", 2u);
  unsigned short* copy = String::copyUnicodeString(whole);
  EXPECT_EQ(String(whole), "abc");
  EXPECT_EQ(String(part), "ab");
  EXPECT_EQ(String(copy), "abc");
  EXPECT_NE(copy, whole);
  unsigned short* empty = String::createUnicodeString("");
  ASSERT_NE(empty, nullptr);
  EXPECT_EQ(empty[0], 0);
  for (unsigned short* buffer : {whole, part, copy, empty}) String::releaseUnicodeString(buffer);
}

TEST(StringTest, NullHasNoUnicodeBuffer) {
  EXPECT_EQ(String::createUnicodeString(nullptr), nullptr);
  EXPECT_EQ(String::createUnicodeString(nullptr, 3u), nullptr);
  EXPECT_EQ(String::copyUnicodeString(nullptr), nullptr);
  String::releaseUnicodeString(nullptr);
}

}  // namespace
