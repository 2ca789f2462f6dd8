#include "apps/vmqctl/text.h"

#include <gtest/gtest.h>

namespace {

using vmqctl::Charset;
using vmqctl::displayWidth;
using vmqctl::escaped;
using vmqctl::within;

class Text : public testing::Test {
 protected:
  static void SetUpTestSuite() { vmqctl::useUtf8Characters(); }
};

struct Case {
  std::string text;
  std::string utf8;
  std::string ascii;
};

TEST_F(Text, IsEscapedSoThatItCannotDriveATerminal) {
  using namespace std::string_literals;
  const Case cases[] = {
      {"", "", ""},
      {"plain text ~", "plain text ~", "plain text ~"},
      {"a\nb\tc\rd", "a\\nb\\tc\\rd", "a\\nb\\tc\\rd"},
      {"C:\\n", "C:\\\\n", "C:\\\\n"},  // a backslash that was there is not mistaken for one of ours
      {"\x1b[2J\a\x7f", "\\x1b[2J\\x07\\x7f", "\\x1b[2J\\x07\\x7f"},
      {"a\0b"s, "a\\x00b", "a\\x00b"},
      {"gr\xC3\xBC\xC3\x9F", "gr\xC3\xBC\xC3\x9F", "gr\\u{fc}\\u{df}"},
      {"\xE6\x97\xA5\xF0\x9F\x98\x80", "\xE6\x97\xA5\xF0\x9F\x98\x80", "\\u{65e5}\\u{1f600}"},
      {"\xC2\x9B"
       "2J",
       "\\u{9b}2J", "\\u{9b}2J"},  // CSI as one character
      {"a\xE2\x80\xAE"
       "b",
       "a\\u{202e}b", "a\\u{202e}b"},                                               // turns the direction of writing
      {"a\xE2\x80\x8B\xEF\xBB\xBF", "a\\u{200b}\\u{feff}", "a\\u{200b}\\u{feff}"},  // no width
      {"\xF4\x8F\xBF\xBF", "\\u{10ffff}", "\\u{10ffff}"},
      // Not UTF-8: a lone byte, a cut character, overlong forms, a surrogate, beyond the last character.
      {"\xFF|\x9B", "\\xff|\\x9b", "\\xff|\\x9b"},
      {"\xE6\x97", "\\xe6\\x97", "\\xe6\\x97"},
      {"\xC0\x8A", "\\xc0\\x8a", "\\xc0\\x8a"},
      {"\xE0\x80\x8A", "\\xe0\\x80\\x8a", "\\xe0\\x80\\x8a"},
      {"\xED\xA0\x80", "\\xed\\xa0\\x80", "\\xed\\xa0\\x80"},
      {"\xF4\x90\x80\x80", "\\xf4\\x90\\x80\\x80", "\\xf4\\x90\\x80\\x80"},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(escaped(c.text, Charset::Utf8), c.utf8);
    EXPECT_EQ(escaped(c.text, Charset::Ascii), c.ascii);
  }
}

TEST_F(Text, NoByteButPrintableOnesIsLeftWhateverComesIn) {
  for (int first = 0; first < 256; ++first) {
    for (int second = 0; second < 256; ++second) {
      const std::string text = {static_cast<char>(first), static_cast<char>(second)};
      for (const char c : escaped(text, Charset::Ascii)) ASSERT_TRUE(c >= ' ' && c <= '~') << first << ' ' << second;
      for (const char c : escaped(text, Charset::Utf8)) {
        ASSERT_TRUE((c >= ' ' && c <= '~') || (c & 0x80) != 0) << first << ' ' << second;
      }
    }
  }
}

TEST_F(Text, WidthIsCountedInColumns) {
  EXPECT_EQ(displayWidth(""), 0U);
  EXPECT_EQ(displayWidth("abc"), 3U);
  EXPECT_EQ(displayWidth("gr\xC3\xBC\xC3\x9F"), 4U);
  EXPECT_EQ(displayWidth("\xE6\x97\xA5\xE6\x9C\xAC"), 4U);  // two wide characters
  EXPECT_EQ(displayWidth("e\xCC\x81"), 1U);                 // an accent of its own stands above the letter before
}

TEST_F(Text, IsCutBetweenCharacters) {
  EXPECT_EQ(within("abc", 2).bytes, 2U);
  EXPECT_EQ(within("abc", 9).bytes, 3U);
  EXPECT_EQ(within("\xE6\x97\xA5\xE6\x9C\xAC", 3).bytes, 3U);  // the second would take columns 3 and 4
  EXPECT_EQ(within("\xE6\x97\xA5\xE6\x9C\xAC", 3).columns, 2U);
  EXPECT_EQ(within("e\xCC\x81x", 1).bytes, 3U);  // with its accent
}

}  // namespace
