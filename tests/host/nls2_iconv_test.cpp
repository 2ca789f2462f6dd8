// Code sets of the C library that have no number of their own: what a locale gets whose code set is one of them.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "host/src/nls2_converter.h"

namespace {

using vmqhost::Converted;
using vmqhost::Converter;
using vmqhost::newIconvConverter;

std::u16string toUnits(const Converter& converter, const std::string& bytes) {
  std::vector<unsigned short> units(bytes.size());
  const Converted result =
      converter.toUnits(reinterpret_cast<const unsigned char*>(bytes.data()), bytes.size(), units.data(), units.size());
  EXPECT_FALSE(result.cut);
  return {units.begin(), units.begin() + static_cast<ptrdiff_t>(result.stored)};
}

std::string fromUnits(const Converter& converter, const std::u16string& text) {
  const std::vector<unsigned short> units(text.begin(), text.end());
  std::string bytes(units.size() * converter.maximumBytesPerUnit(), '#');
  const Converted result =
      converter.fromUnits(units.data(), units.size(), reinterpret_cast<unsigned char*>(bytes.data()), bytes.size());
  EXPECT_FALSE(result.cut);
  bytes.resize(result.stored);
  return bytes;
}

TEST(NamelessCodePage, ConvertsBothWays) {
  const auto koi8 = newIconvConverter("KOI8-R", 1);
  ASSERT_NE(koi8, nullptr);
  EXPECT_EQ(toUnits(*koi8, "x\xC1\xE1"), u"x\u0430\u0410");
  EXPECT_EQ(fromUnits(*koi8, u"x\u0430\u0410"), "x\xC1\xE1");
}

TEST(NamelessCodePage, WithoutAsciiIsNotTakenForAscii) {
  const auto ebcdic = newIconvConverter("IBM1047", 1);
  ASSERT_NE(ebcdic, nullptr);
  EXPECT_EQ(toUnits(*ebcdic, "\xC1\x81\xF0"), u"Aa0");
  EXPECT_EQ(fromUnits(*ebcdic, u"Aa0"), "\xC1\x81\xF0");
}

TEST(NamelessCodePage, GivesTheLastCharacterThatItHeldBack) {
  const auto big5 = newIconvConverter("BIG5-HKSCS", 2);
  ASSERT_NE(big5, nullptr);
  EXPECT_EQ(fromUnits(*big5, u"\u00CA"), "\x88\x66");  // might have combined with what follows
  EXPECT_EQ(fromUnits(*big5, u"\u00CA\u0304"), "\x88\x62");
}

TEST(NamelessCodePage, ThatTheCLibraryDoesNotKnowIsNone) {
  EXPECT_EQ(newIconvConverter("NO-SUCH-SET", 1), nullptr);
}

}  // namespace
