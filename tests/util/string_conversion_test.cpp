// Narrow text to units and back, in the locales that every machine has, and in code pages chosen by number.
#include <gtest/gtest.h>

#include <clocale>
#include <string>
#include <vector>

#include "test_seam.h"
#include "util/string.h"

using VMQ::String;

namespace {

using Units = std::vector<unsigned short>;

Units unitsOf(const String& text) {
  return {text.getData(), text.getData() + text.length()};
}

String textOf(const Units& units) {
  return String().assign(units.data(), static_cast<unsigned int>(units.size()));
}

/// The process's locale while it lives; the C locale afterwards.
class LocaleInEffect {
 public:
  explicit LocaleInEffect(const char* name) {
    EXPECT_NE(std::setlocale(LC_CTYPE, name), nullptr) << name;
    EXPECT_TRUE(String::initialize());
  }
  ~LocaleInEffect() {
    std::setlocale(LC_CTYPE, "C");
    String::initialize();
  }
};

/// Conversions in one code page while it lives, whatever the locale.
class CodePageInEffect {
 public:
  explicit CodePageInEffect(int32_t id) {
    const String first("later conversions keep the locale that is there");
    NLS2_ReleaseLocale(VMQ::glbLocale);
    VMQ::glbLocale = NLS2_GetLocale(NLS2_BY_CODEPAGE, id);
    EXPECT_NE(VMQ::glbLocale, nullptr);
  }
  ~CodePageInEffect() { String::initialize(); }
};

// ---- UTF-8 ----------------------------------------------------------------------------------------------------------

TEST(StringInUtf8Test, CharactersBecomeOneOrTwoUnits) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_EQ(unitsOf(String("a\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80z")),
            (Units{'a', 0x00E9, 0x20AC, 0xD83D, 0xDE00, 'z'}));
}

TEST(StringInUtf8Test, EveryCharacterComesBackWhole) {
  const LocaleInEffect utf8("C.UTF-8");
  const std::string narrow = "a\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80z";
  EXPECT_EQ(String(narrow.c_str()).toNarrow(), narrow);
}

TEST(StringInUtf8Test, ShortNarrowTextIsCutBeforeTheFirstCharacterThatDoesNotFit) {
  const LocaleInEffect utf8("C.UTF-8");
  const std::pair<const char*, const char*> cases[] = {
      {"abc", "abc"},
      // One byte for each unit and one for the terminator.
      {"\xC3\xA9", ""},
      {"\xC3\xA9\x61", "\xC3\xA9"},
      {"a\xC3\xA9", "a"},
      {"a\xC3\xA9\x62", "a\xC3\xA9"},
      {"\xE2\x82\xAC\x61\x62\x63", "\xE2\x82\xAC\x61"},
      {"\xF0\x9F\x98\x80", ""},
      {"\xF0\x9F\x98\x80\x61\x62", "\xF0\x9F\x98\x80"},
  };
  for (const auto& [narrow, cut] : cases) {
    EXPECT_STREQ(String(narrow).c_str().get(), cut) << narrow;
    EXPECT_EQ(String(narrow).toNarrow(), narrow);
  }
}

TEST(StringInUtf8Test, LargeTextNeverLosesItsTail) {
  const LocaleInEffect utf8("C.UTF-8");
  std::string narrow;
  for (int i = 0; i < 10000; ++i) narrow += "configuration \xE2\x82\xAC\n";
  narrow += "tail";
  EXPECT_EQ(String(narrow.c_str()).toNarrow(), narrow);
}

TEST(StringInUtf8Test, BytesThatAreNoCharacterBecomeUnitsOfTheSameValue) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_EQ(unitsOf(String("\xE9")), (Units{0x00E9}));
  EXPECT_EQ(unitsOf(String("a\xFF\x80z")), (Units{'a', 0x00FF, 0x0080, 'z'}));
  EXPECT_EQ(unitsOf(String("\xC3\xA9\xE9")), (Units{0x00E9, 0x00E9}));
}

TEST(StringInUtf8Test, CountedTextThatEndsWithinACharacterKeepsItsBytes) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_EQ(unitsOf(String("a\xC3\xA9", 2u)), (Units{'a', 0x00C3}));
  EXPECT_EQ(unitsOf(String("a\xC3\xA9", 3u)), (Units{'a', 0x00E9}));
}

TEST(StringInUtf8Test, HalfOfASurrogatePairIsNeverInvalidUtf8) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_EQ(textOf({'a', 0xD83D, 'z'}).toNarrow(), "a?z");
}

TEST(StringInUtf8Test, LettersHaveCaseAndSpacesAreWhite) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_EQ(unitsOf(textOf({0x00E9, 'a'}).toUpper()), (Units{0x00C9, 'A'}));
  EXPECT_EQ(unitsOf(textOf({0x0416}).toLower()), (Units{0x0436}));
  EXPECT_EQ(unitsOf(textOf({0x2003, 'a', 0x3000}).trim()), (Units{'a'}));
}

TEST(StringInUtf8Test, NumberFollowedByALetterIsNoNumber) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_FALSE(String::isNumber(textOf({'1', '2', 0x00E9})));
}

TEST(StringInUtf8Test, ZeroUnitsWithinATextAreData) {
  const LocaleInEffect utf8("C.UTF-8");
  EXPECT_EQ(textOf({'a', 0, 0x00E9}).toNarrow(), std::string("a\0\xC3\xA9", 4));
  EXPECT_STREQ(textOf({'a', 0, 'b'}).c_str().get(), "a");
}

// ---- the C locale --------------------------------------------------------------------------------------------------

TEST(StringInTheCLocaleTest, EveryByteBecomesOneUnitAndComesBack) {
  const LocaleInEffect c("C");
  std::string narrow;
  Units units;
  for (int byte = 1; byte < 256; ++byte) {
    narrow += static_cast<char>(byte);
    units.push_back(static_cast<unsigned short>(byte));
  }
  const String text(narrow.c_str());
  EXPECT_EQ(unitsOf(text), units);
  EXPECT_EQ(text.toNarrow(), narrow);
  EXPECT_EQ(std::string(text.c_str().get()), narrow);
}

TEST(StringInTheCLocaleTest, UnitWithoutAPlaceBecomesAQuestionMark) {
  const LocaleInEffect c("C");
  EXPECT_EQ(textOf({'a', 0x20AC, 'z'}).toNarrow(), "a?z");
  EXPECT_STREQ(textOf({'a', 0x20AC, 'z'}).c_str().get(), "a?z");
}

// ---- a double-byte code page ---------------------------------------------------------------------------------------

TEST(StringInCodePage932Test, NameIsCutButDataIsNot) {
  const CodePageInEffect japanese(NLS2_CP932);
  const char* narrow = "\x93\xFA\x96\x7B";
  const String text(narrow);
  EXPECT_EQ(unitsOf(text), (Units{0x65E5, 0x672C}));
  EXPECT_STREQ(text.c_str().get(), "\x93\xFA");
  EXPECT_EQ(text.toNarrow(), narrow);
}

// ---- lengths -------------------------------------------------------------------------------------------------------

TEST(StringConversionTest, AsciiOfEveryLengthIsTheSameBothWays) {
  for (const char* locale : {"C", "C.UTF-8"}) {
    const LocaleInEffect in_effect(locale);
    std::string narrow;
    for (unsigned int length = 0; length < 100; ++length) {
      const String text(narrow.c_str());
      ASSERT_EQ(text.length(), length);
      ASSERT_EQ(text.toNarrow(), narrow);
      ASSERT_EQ(std::string(text.c_str().get()), narrow);
      narrow += static_cast<char>('!' + length % 90);
    }
  }
}

// ---- the choice of the locale --------------------------------------------------------------------------------------

TEST(StringConversionTest, ChosenCodePageIsTraced) {
  std::setlocale(LC_CTYPE, "C.UTF-8");
  {
    const TEST_TraceCapture trace;
    EXPECT_TRUE(String::initialize());
    EXPECT_EQ(trace.texts(RAS1_DETAIL), (std::vector<std::string>{"codepage=1208"}));
  }
  std::setlocale(LC_CTYPE, "C");
  String::initialize();
}

TEST(StringConversionTest, WithoutALocaleTextIsConvertedAsLatin1) {
  const String first("later conversions make do with what there is");
  {
    const TEST_FailCall failing("NLS2_GetLocale", 1, 0);
    EXPECT_FALSE(String::initialize());
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(VMQ::glbLocale, nullptr);
  EXPECT_EQ(unitsOf(String("\xE9")), (Units{0x00E9}));
  EXPECT_EQ(textOf({0x00E9}).toNarrow(), "\xE9");
  EXPECT_TRUE(String::initialize());
}

}  // namespace
