// Texts that are decimal integers.
#include <gtest/gtest.h>

#include <climits>
#include <string>
#include <vector>

#include "test_seam.h"
#include "util/string.h"

using VMQ::String;

namespace {

struct Number {
  const char* text;
  int value;
};

TEST(StringNumberTest, NumbersAreConvertedToTheirLow32Bits) {
  const Number cases[] = {
      {"", 0},
      {"0", 0},
      {"42", 42},
      {"-42", -42},
      {"+42", 42},
      {"  42", 42},
      {"\t\n-1", -1},
      {"007", 7},
      {"2147483646", 2147483646},
      {"-2147483647", -2147483647},
      {"2147483648", INT_MIN},
      {"-2147483649", INT_MAX},
      {"3000000000", -1294967296},
      {"4294967296", 0},
      {"9223372036854775806", -2},
  };
  for (const Number& c : cases) {
    EXPECT_TRUE(String::isNumber(String(c.text))) << c.text;
    int value = 1;
    EXPECT_TRUE(String::convertToInt(String(c.text), &value)) << c.text;
    EXPECT_EQ(value, c.value) << c.text;
  }
}

TEST(StringNumberTest, LimitsOf64BitsThatWereNotExceededAreNumbers) {
  for (const char* text : {"9223372036854775807", "-9223372036854775808"}) {
    EXPECT_TRUE(String::isNumber(String(text))) << text;
  }
}

TEST(StringNumberTest, TextThatIsNoNumberIsRefusedAndTraced) {
  for (const char* text : {"12 ", "12a", "a", " ", "-", "+", "1.5", "0x10", "1 2", "12\n"}) {
    const TEST_TraceCapture trace;
    EXPECT_FALSE(String::isNumber(String(text))) << text;
    EXPECT_TRUE(trace.texts(RAS1_ERROR).empty()) << text;
    int value = 1;
    EXPECT_FALSE(String::convertToInt(String(text), &value)) << text;
    EXPECT_EQ(value, 0) << text;
    EXPECT_EQ(trace.texts(RAS1_ERROR),
              (std::vector<std::string>{std::string("Can't convert, buffer is not number: ") + text}));
  }
}

TEST(StringNumberTest, NumberThatIsTooLargeOrA32BitLimitIsRefusedAndTraced) {
  for (const char* text : {"2147483647", "-2147483648", " 2147483647", "9223372036854775808", "-9223372036854775809",
                           "100000000000000000000"}) {
    const TEST_TraceCapture trace;
    EXPECT_FALSE(String::isNumber(String(text))) << text;
    EXPECT_TRUE(trace.texts(RAS1_ERROR).empty()) << text;
    int value = 1;
    EXPECT_FALSE(String::convertToInt(String(text), &value)) << text;
    EXPECT_EQ(value, 0) << text;
    EXPECT_EQ(trace.texts(RAS1_ERROR),
              (std::vector<std::string>{std::string("Can't convert, number is too large: ") + text}));
  }
}

TEST(StringNumberTest, LettersBehindTheDigitsCountWhateverTheyAre) {
  String text("12");
  text.append(static_cast<unsigned short>(0x00E9));
  EXPECT_FALSE(String::isNumber(text));
}

}  // namespace
