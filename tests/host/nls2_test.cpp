// Code pages: what each byte and each unit becomes.

#include "nls2.h"

#include <gtest/gtest.h>
#include <iconv.h>

#include <cerrno>
#include <clocale>
#include <random>

#include "tests/host/code_page.h"

namespace {

using namespace std::string_literals;

std::string everyByte() {
  std::string bytes;
  for (int byte = 0; byte < 256; ++byte) bytes += static_cast<char>(byte);
  return bytes;
}

std::u16string everyLatin1Unit() {
  std::u16string units;
  for (char16_t unit = 0; unit < 256; ++unit) units += unit;
  return units;
}

/// The process's locale, for a while.
class CurrentLocale {
 public:
  explicit CurrentLocale(const char* name) { EXPECT_NE(setlocale(LC_CTYPE, name), nullptr) << name; }
  ~CurrentLocale() { setlocale(LC_CTYPE, "C"); }
  CurrentLocale(const CurrentLocale&) = delete;
  CurrentLocale& operator=(const CurrentLocale&) = delete;
};

// ---- handles -----------------------------------------------------------------------------------------------------

TEST(CodePage, OfTheCLocaleIsAscii) {
  const CurrentLocale c("C");
  const Locale locale(NLS2_GetLocale(NLS2_CURRENT_LOCALE, 943));
  ASSERT_NE(locale, nullptr);
  EXPECT_EQ(NLS2_GetLocaleCodepageId(locale.get()), NLS2_CP_ASCII);
}

TEST(CodePage, OfAUtf8LocaleIs1208) {
  const CurrentLocale utf8("C.UTF-8");
  const Locale locale(NLS2_GetLocale(NLS2_CURRENT_LOCALE, 0));
  ASSERT_NE(locale, nullptr);
  EXPECT_EQ(NLS2_GetLocaleCodepageId(locale.get()), NLS2_CP_UTF8);
  EXPECT_EQ(toUnits(locale.get(), "\xC3\xA9"), (Units{u"\u00E9", 0}));
}

TEST(CodePage, StaysWhatItWasWhenTheProcessChangesItsLocale) {
  const CurrentLocale utf8("C.UTF-8");
  const Locale locale(NLS2_GetLocale(NLS2_CURRENT_LOCALE, 0));
  const CurrentLocale c("C");
  EXPECT_EQ(toUnits(locale.get(), "\xC3\xA9"), (Units{u"\u00E9", 0}));
}

TEST(CodePage, MayBeChosenByNumber) {
  const struct {
    int32_t id;
    uint32_t maximum_bytes;
  } kCases[] = {{367, 1}, {819, 1}, {932, 2}, {943, 2}, {1208, 3}, {33722, 3}};
  for (const auto& each : kCases) {
    SCOPED_TRACE(each.id);
    const Locale locale = byCodePage(each.id);
    ASSERT_NE(locale, nullptr);
    EXPECT_EQ(NLS2_GetLocaleCodepageId(locale.get()), each.id);
    EXPECT_EQ(NLS2_MaximumBytesPerUnit(locale.get()), each.maximum_bytes);
  }
}

TEST(CodePage, ThatIsUnknownGivesNoLocale) {
  EXPECT_EQ(byCodePage(1), nullptr);
  EXPECT_EQ(byCodePage(0), nullptr);
  EXPECT_EQ(NLS2_GetLocale(7, NLS2_CP_UTF8), nullptr);
  NLS2_ReleaseLocale(nullptr);
}

TEST(CodePage, OfNoLocaleIsLatin1WithoutANumber) {
  EXPECT_EQ(NLS2_GetLocaleCodepageId(nullptr), 0);
  EXPECT_EQ(NLS2_MaximumBytesPerUnit(nullptr), 1u);
  EXPECT_EQ(toUnits(nullptr, everyByte()), (Units{everyLatin1Unit(), 0}));
  EXPECT_EQ(fromUnits(nullptr, everyLatin1Unit()), (Bytes{everyByte(), 0}));
}

// ---- all code pages ----------------------------------------------------------------------------------------------

class EveryCodePage : public testing::TestWithParam<int32_t> {
 protected:
  const Locale locale_ = byCodePage(GetParam());
  NLS2_Locale* get() const { return locale_.get(); }
};
INSTANTIATE_TEST_SUITE_P(Nls2, EveryCodePage,
                         testing::Values(NLS2_CP_ASCII, NLS2_CP_LATIN1, NLS2_CP_UTF8, NLS2_CP932, NLS2_CP943,
                                         NLS2_CP_EUCJP),
                         [](const auto& each) { return std::to_string(each.param); });

TEST_P(EveryCodePage, ConvertsEveryAsciiCharacterAtEveryPlaceToItself) {
  for (size_t length = 0; length < 70; ++length) {
    std::string bytes;
    std::u16string units;
    for (size_t i = 0; i < length; ++i) {
      bytes += static_cast<char>((i * 37 + length) % 127 + 1);
      units += static_cast<char16_t>((i * 37 + length) % 127 + 1);
    }
    ASSERT_EQ(toUnits(get(), bytes), (Units{units, 0}));
    ASSERT_EQ(fromUnits(get(), units, length + 1), (Bytes{bytes, 0}));
  }
}

TEST_P(EveryCodePage, ConvertsANulLikeAnyCharacter) {
  EXPECT_EQ(toUnits(get(), "a\0b\0"s), (Units{u"a\0b\0"s, 0}));
  EXPECT_EQ(fromUnits(get(), u"a\0b"s), (Bytes{"a\0b"s, 0}));
}

TEST_P(EveryCodePage, TakesAUnitOfZeroAtTheEndForTheTerminator) {
  EXPECT_EQ(fromUnits(get(), u"ab\0"s, 3), (Bytes{"ab", 0}));
  EXPECT_EQ(fromUnits(get(), u"ab\0\0"s, 4), (Bytes{"ab\0"s, 0}));
  EXPECT_EQ(fromUnits(get(), u"\0"s, 1), (Bytes{"", 0}));
}

TEST_P(EveryCodePage, CutsAsciiAtTheCapacity) {
  for (size_t capacity = 0; capacity < 40; ++capacity) {
    const std::string bytes(40, 'x');
    const std::u16string units(40, u'x');
    ASSERT_EQ(toUnits(get(), bytes, capacity), (Units{units.substr(0, capacity), ENOBUFS}));
    if (capacity > 0) {
      ASSERT_EQ(fromUnits(get(), units, capacity), (Bytes{bytes.substr(0, capacity - 1), ENOBUFS}));
    }
  }
}

TEST_P(EveryCodePage, StoresNothingWithoutRoom) {
  int32_t status = -1;
  const unsigned short unit = 'x';
  EXPECT_EQ(NLS2_fromUTF16(get(), &unit, 1, nullptr, 0, &status), 0u);
  EXPECT_EQ(status, ENOBUFS);
}

TEST_P(EveryCodePage, ConvertsNothingToNothing) {
  int32_t status = -1;
  EXPECT_EQ(NLS2_toUTF16(get(), nullptr, 0, nullptr, 0, &status), 0u);
  EXPECT_EQ(status, 0);
  EXPECT_EQ(fromUnits(get(), u"", 1), (Bytes{"", 0}));
}

TEST_P(EveryCodePage, NeedsNoStatus) {
  unsigned short unit = 0;
  EXPECT_EQ(NLS2_toUTF16(get(), "x", 1, &unit, 1, nullptr), 1u);
  char bytes[2];
  EXPECT_EQ(NLS2_fromUTF16(get(), &unit, 1, bytes, sizeof bytes, nullptr), 2u);
}

TEST_P(EveryCodePage, GivesNoMoreUnitsThanThereAreBytes) {
  std::mt19937 random(20240607);
  for (int round = 0; round < 2000; ++round) {
    std::string bytes(random() % 20, '\0');
    for (char& byte : bytes) byte = static_cast<char>(random());
    ASSERT_EQ(toUnits(get(), bytes).status, 0) << round;
  }
}

TEST_P(EveryCodePage, GivesNoMoreBytesThanItPromisesForEachUnit) {
  std::mt19937 random(20240608);
  for (int round = 0; round < 2000; ++round) {
    std::u16string units(random() % 20, u'\0');
    for (char16_t& unit : units) unit = static_cast<char16_t>(random());
    ASSERT_EQ(fromUnits(get(), units).status, 0) << round;
  }
}

TEST_P(EveryCodePage, MakesAQuestionMarkOfALoneSurrogate) {
  EXPECT_EQ(fromUnits(get(), std::u16string{u'a', 0xD800, u'b'}), (Bytes{"a?b", 0}));
  EXPECT_EQ(fromUnits(get(), std::u16string{u'a', 0xDC00, u'b'}), (Bytes{"a?b", 0}));
  EXPECT_EQ(fromUnits(get(), std::u16string{u'a', 0xD800}), (Bytes{"a?", 0}));
  EXPECT_EQ(fromUnits(get(), std::u16string{0xDC00, 0xD800}), (Bytes{"??", 0}));
}

// ---- one byte for each character ---------------------------------------------------------------------------------

class OneByteCodePage : public testing::TestWithParam<int32_t> {};
INSTANTIATE_TEST_SUITE_P(Nls2, OneByteCodePage, testing::Values(NLS2_CP_ASCII, NLS2_CP_LATIN1),
                         [](const auto& each) { return std::to_string(each.param); });

TEST_P(OneByteCodePage, LosesNoByte) {
  const Locale locale = byCodePage(GetParam());
  EXPECT_EQ(toUnits(locale.get(), everyByte()), (Units{everyLatin1Unit(), 0}));
  EXPECT_EQ(fromUnits(locale.get(), everyLatin1Unit()), (Bytes{everyByte(), 0}));
}

TEST_P(OneByteCodePage, MakesQuestionMarksOfWhatItDoesNotHave) {
  const Locale locale = byCodePage(GetParam());
  EXPECT_EQ(fromUnits(locale.get(), u"a\u0100\u20ACz"), (Bytes{"a??z", 0}));
  EXPECT_EQ(fromUnits(locale.get(), u"\U0001F600"), (Bytes{"??", 0}));
}

// ---- UTF-8 -------------------------------------------------------------------------------------------------------

struct Utf8Case {
  const char* bytes;
  std::u16string units;
};

TEST(Utf8, ConvertsTheFirstAndTheLastCharacterOfEachLength) {
  const Locale locale = byCodePage(NLS2_CP_UTF8);
  const Utf8Case kCases[] = {
      {"\x01", {0x01}},
      {"\x7F", {0x7F}},
      {"\xC2\x80", {0x80}},
      {"\xDF\xBF", {0x7FF}},
      {"\xE0\xA0\x80", {0x800}},
      {"\xED\x9F\xBF", {0xD7FF}},
      {"\xEE\x80\x80", {0xE000}},
      {"\xEF\xBF\xBF", {0xFFFF}},
      {"\xF0\x90\x80\x80", {0xD800, 0xDC00}},
      {"\xF0\x9F\x98\x80", {0xD83D, 0xDE00}},
      {"\xF4\x8F\xBF\xBF", {0xDBFF, 0xDFFF}},
  };
  for (const Utf8Case& each : kCases) {
    EXPECT_EQ(toUnits(locale.get(), each.bytes), (Units{each.units, 0}));
    EXPECT_EQ(fromUnits(locale.get(), each.units), (Bytes{each.bytes, 0}));
  }
}

TEST(Utf8, MakesTheUnitOfTheSameValueOfEachByteThatIsNoCharacter) {
  const Locale locale = byCodePage(NLS2_CP_UTF8);
  const Utf8Case kCases[] = {
      {"a\xFFz", {'a', 0xFF, 'z'}},
      {"\x80", {0x80}},
      {"\xC3", {0xC3}},
      {"\xC3z", {0xC3, 'z'}},
      {"\xC0\xAF", {0xC0, 0xAF}},                      // overlong
      {"\xC1\xBF", {0xC1, 0xBF}},                      // overlong
      {"\xE0\x9F\xBF", {0xE0, 0x9F, 0xBF}},            // overlong
      {"\xF0\x8F\xBF\xBF", {0xF0, 0x8F, 0xBF, 0xBF}},  // overlong
      {"\xED\xA0\x80", {0xED, 0xA0, 0x80}},            // a surrogate
      {"\xED\xBF\xBF", {0xED, 0xBF, 0xBF}},            // a surrogate
      {"\xF4\x90\x80\x80", {0xF4, 0x90, 0x80, 0x80}},  // above the last plane
      {"\xF5\x80\x80\x80", {0xF5, 0x80, 0x80, 0x80}},  // above the last plane
      {"\xE2\x82", {0xE2, 0x82}},                      // cut off
      {"\xE2\x82z", {0xE2, 0x82, 'z'}},                // cut off
      {"\xF0\x9F\x98", {0xF0, 0x9F, 0x98}},            // cut off
      {"\xF0\x9F\x98z", {0xF0, 0x9F, 0x98, 'z'}},      // cut off
      {"\xE2\xE2\x82\xAC", {0xE2, 0x20AC}},            // cut off by the next character
      {"ISO: \xE9\xE8.", {'I', 'S', 'O', ':', ' ', 0xE9, 0xE8, '.'}},
  };
  for (const Utf8Case& each : kCases) EXPECT_EQ(toUnits(locale.get(), each.bytes), (Units{each.units, 0}));
}

TEST(Utf8, IsCutBeforeTheFirstCharacterThatDoesNotFit) {
  const Locale locale = byCodePage(NLS2_CP_UTF8);
  EXPECT_EQ(toUnits(locale.get(), "a\xF0\x9F\x98\x80z", 2), (Units{u"a", ENOBUFS}));
  EXPECT_EQ(toUnits(locale.get(), "a\xF0\x9F\x98\x80z", 3), (Units{u"a\U0001F600", ENOBUFS}));
  EXPECT_EQ(fromUnits(locale.get(), u"a\u20ACz", 4), (Bytes{"a", ENOBUFS}));
  EXPECT_EQ(fromUnits(locale.get(), u"a\u20ACz", 5), (Bytes{"a\xE2\x82\xAC", ENOBUFS}));
  EXPECT_EQ(fromUnits(locale.get(), u"a\u20ACz", 6), (Bytes{"a\xE2\x82\xACz", 0}));
  EXPECT_EQ(fromUnits(locale.get(), u"\U0001F600", 4), (Bytes{"", ENOBUFS}));
  EXPECT_EQ(fromUnits(locale.get(), u"\U0001F600", 5), (Bytes{"\xF0\x9F\x98\x80", 0}));
}

TEST(Utf8, InAByteForEachUnitLosesItsTail) {
  // Room for one byte for each unit, the terminator included: what names and trace lines get.
  const Locale locale = byCodePage(NLS2_CP_UTF8);
  EXPECT_EQ(fromUnits(locale.get(), u"\u00E9\0"s, 2), (Bytes{"", ENOBUFS}));
  EXPECT_EQ(fromUnits(locale.get(), u"ab\u00E9\0"s, 4), (Bytes{"ab", ENOBUFS}));
}

/// Any text of valid characters, by the C library.
std::u16string byTheCLibrary(const std::string& utf8) {
  std::u16string units(utf8.size(), u'\0');
  char* in = const_cast<char*>(utf8.data());
  size_t in_left = utf8.size();
  char* out = reinterpret_cast<char*>(units.data());
  size_t out_left = units.size() * 2;
  const iconv_t descriptor = iconv_open("UTF-16LE", "UTF-8");
  EXPECT_EQ(iconv(descriptor, &in, &in_left, &out, &out_left), 0u);
  iconv_close(descriptor);
  units.resize(units.size() - out_left / 2);
  return units;
}

TEST(Utf8, AgreesWithTheCLibraryOnRandomText) {
  const Locale locale = byCodePage(NLS2_CP_UTF8);
  std::mt19937 random(20240609);
  constexpr const char* kPieces[] = {"a", "plain ASCII of some length", "\xC3\xA9", "\xE2\x82\xAC", "\xF0\x9F\x98\x80"};
  for (int round = 0; round < 500; ++round) {
    std::string text;
    for (size_t i = random() % 30; i > 0; --i) text += kPieces[random() % std::size(kPieces)];
    const std::u16string units = byTheCLibrary(text);
    ASSERT_EQ(toUnits(locale.get(), text), (Units{units, 0})) << text;
    ASSERT_EQ(fromUnits(locale.get(), units), (Bytes{text, 0})) << text;
  }
}

TEST(Utf8, FindsACharacterThatIsNotAsciiAtEveryPlace) {
  const Locale locale = byCodePage(NLS2_CP_UTF8);
  for (size_t place = 0; place < 50; ++place) {
    std::string bytes(50, 'x');
    bytes.replace(place, 1, "\xC3\xA9");
    std::u16string units(50, u'x');
    units[place] = 0xE9;
    ASSERT_EQ(toUnits(locale.get(), bytes), (Units{units, 0}));
    ASSERT_EQ(fromUnits(locale.get(), units), (Bytes{bytes, 0}));
  }
}

// ---- Japanese code pages -----------------------------------------------------------------------------------------

struct JapaneseCase {
  int32_t id;
  const char* bytes;
};

constexpr JapaneseCase kNippon[] = {
    {NLS2_CP932, "\x93\xFA\x96\x7B"}, {NLS2_CP943, "\x93\xFA\x96\x7B"}, {NLS2_CP_EUCJP, "\xC6\xFC\xCB\xDC"}};

TEST(JapaneseCodePage, ConvertsBothWays) {
  for (const JapaneseCase& each : kNippon) {
    SCOPED_TRACE(each.id);
    const Locale locale = byCodePage(each.id);
    EXPECT_EQ(toUnits(locale.get(), each.bytes), (Units{u"\u65E5\u672C", 0}));
    EXPECT_EQ(fromUnits(locale.get(), u"\u65E5\u672C"), (Bytes{each.bytes, 0}));
    const std::string mixed = std::string("path/") + each.bytes + "/x";
    EXPECT_EQ(toUnits(locale.get(), mixed), (Units{u"path/\u65E5\u672C/x", 0}));
    EXPECT_EQ(fromUnits(locale.get(), u"path/\u65E5\u672C/x"), (Bytes{mixed, 0}));
  }
}

TEST(JapaneseCodePage, HasHalfWidthKatakana) {
  const struct {
    int32_t id;
    const char* bytes;
  } kCases[] = {{NLS2_CP932, "\xB1"}, {NLS2_CP943, "\xB1"}, {NLS2_CP_EUCJP, "\x8E\xB1"}};
  for (const auto& each : kCases) {
    const Locale locale = byCodePage(each.id);
    EXPECT_EQ(toUnits(locale.get(), each.bytes), (Units{u"\uFF71", 0})) << each.id;
    EXPECT_EQ(fromUnits(locale.get(), u"\uFF71"), (Bytes{each.bytes, 0})) << each.id;
  }
}

TEST(JapaneseCodePage, MakesTheUnitOfTheSameValueOfAByteThatIsNoCharacter) {
  for (const JapaneseCase& each : kNippon) {
    SCOPED_TRACE(each.id);
    const Locale locale = byCodePage(each.id);
    const std::string half(each.bytes, 1);
    const auto unit = static_cast<char16_t>(static_cast<unsigned char>(half[0]));
    EXPECT_EQ(toUnits(locale.get(), half), (Units{std::u16string(1, unit), 0}));
    EXPECT_EQ(toUnits(locale.get(), "x" + half + " y"), (Units{u"x" + std::u16string(1, unit) + u" y", 0}));
    EXPECT_EQ(toUnits(locale.get(), half + '\0'), (Units{std::u16string{unit, u'\0'}, 0}));
  }
}

TEST(JapaneseCodePage, MakesALatin1ByteOrAQuestionMarkOfWhatItDoesNotHave) {
  for (const JapaneseCase& each : kNippon) {
    SCOPED_TRACE(each.id);
    const Locale locale = byCodePage(each.id);
    EXPECT_EQ(fromUnits(locale.get(), u"a\u0E01z"), (Bytes{"a?z", 0}));
    EXPECT_EQ(fromUnits(locale.get(), u"\U0001F600z"), (Bytes{"??z", 0}));
  }
  const Locale locale = byCodePage(NLS2_CP932);
  EXPECT_EQ(fromUnits(locale.get(), u"x\u00E9y"), (Bytes{"x\xE9y", 0}));
}

TEST(JapaneseCodePage, IsCutBeforeTheFirstCharacterThatDoesNotFit) {
  for (const JapaneseCase& each : kNippon) {
    SCOPED_TRACE(each.id);
    const Locale locale = byCodePage(each.id);
    const std::string bytes = each.bytes;
    EXPECT_EQ(fromUnits(locale.get(), u"\u65E5\u672C", 5), (Bytes{bytes, 0}));
    EXPECT_EQ(fromUnits(locale.get(), u"\u65E5\u672C", 4), (Bytes{bytes.substr(0, 2), ENOBUFS}));
    EXPECT_EQ(fromUnits(locale.get(), u"\u65E5\u672C", 2), (Bytes{"", ENOBUFS}));
    EXPECT_EQ(toUnits(locale.get(), bytes, 1), (Units{u"\u65E5", ENOBUFS}));
    EXPECT_EQ(toUnits(locale.get(), bytes.substr(0, 3), 1), (Units{u"\u65E5", ENOBUFS}));
  }
}

}  // namespace
