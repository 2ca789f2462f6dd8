// When a column satisfies a predicate.

#include <gtest/gtest.h>

#include <climits>
#include <string>

#include "bxira.h"

namespace {

using namespace std::string_literals;

constexpr _IntfOper kOperators[] = {INTF_EQ, INTF_NE, INTF_LT, INTF_LE, INTF_GT, INTF_GE};

/// Which operators hold when the column is less, equal or greater.
constexpr bool kHolds[][6] = {
    // EQ    NE    LT     LE     GT     GE
    {false, true, true, true, false, false},
    {true, false, false, true, false, true},
    {false, true, false, false, true, true},
};

struct TextCase {
  std::string column;
  const char* value;
  int order;  // of the column against the value
};

TEST(CharacterColumn, ComparesBlankPaddedWithTheValue) {
  const TextCase kCases[] = {
      {"START   ", "START", 0},     {"START   ", "START   ", 0},  {"START   ", "STOP", -1},
      {"STOP    ", "START", 1},     {"        ", "", 0},          {"x       ", "", 1},
      {"ab      ", "abc", -1},      {"abc     ", "ab", 1},        {"start   ", "START", 1},
      {" START  ", "START", -1},    {"12345678", "12345678", 0},  {"12345678", "123456789", 0},  // cut at the width
      {"12345678", "1234567", 1},   {"a\x09      ", "a", -1},      // a control byte is below the padding
      {"\xC3\xA9      ", "z", 1},                                  // bytes are unsigned
      {"z       ", "\xC3\xA9", -1}, {"ab\0\0\0\0\0\0"s, "ab", 0},  // zero bytes at the end are padding
      {"\0\0\0\0\0\0\0\0"s, "", 0},                                // a column that nobody filled in
      {"ab  \0\0\0\0"s, "ab", 0},   {"a\0b     "s, "a", -1},       // but not in between
  };
  for (const TextCase& each : kCases) {
    SCOPED_TRACE(each.column + " against " + each.value);
    for (size_t i = 0; i < std::size(kOperators); ++i) {
      const unsigned held =
          bxira::IsException(kOperators[i], each.column.data(), static_cast<unsigned>(each.column.size()), each.value);
      EXPECT_EQ(held != 0, kHolds[each.order + 1][i]) << "operator " << kOperators[i];
    }
  }
}

TEST(CharacterColumn, AlwaysEqualsALongParameterThatItHoldsTheBeginningOf) {
  const std::string parameter(3072 + 500, 'x');
  const std::string column = parameter.substr(0, 3072);
  EXPECT_NE(bxira::IsException(INTF_EQ, column.data(), 3072, parameter.c_str()), 0u);
}

TEST(CharacterColumn, IsNotReadBeyondItsWidth) {
  const std::string column = "abcdefgh";
  EXPECT_NE(bxira::IsException(INTF_EQ, column.data(), 3, "abc"), 0u);
  EXPECT_NE(bxira::IsException(INTF_EQ, column.data(), 0, "anything"), 0u);
}

TEST(CharacterColumn, SatisfiesNothingWithoutTextValueOrOperator) {
  EXPECT_EQ(bxira::IsException(INTF_NE, nullptr, 4, "x"), 0u);
  EXPECT_EQ(bxira::IsException(INTF_NE, "abcd", 4, nullptr), 0u);
  EXPECT_EQ(bxira::IsException(static_cast<_IntfOper>(0), "abcd", 4, "abcd"), 0u);
  EXPECT_EQ(bxira::IsException(static_cast<_IntfOper>(7), "abcd", 4, "abcd"), 0u);
}

struct IntegerCase {
  int32_t column;
  const char* value;
  int order;
};

TEST(IntegerColumn, ComparesWithAValueInDecimalText) {
  constexpr IntegerCase kCases[] = {
      {0, "0", 0},
      {0, "-0", 0},
      {0, "00", 0},
      {1001, "1001", 0},
      {5, "10", -1},
      {10, "5", 1},
      {-1, "0", -1},
      {-5, "-10", 1},
      {7, "007", 0},
      {1, "2", -1},
      {INT_MAX, "2147483647", 0},
      {INT_MIN, "-2147483648", 0},
      {INT_MIN, "2147483647", -1},
  };
  for (const IntegerCase& each : kCases) {
    SCOPED_TRACE(std::to_string(each.column) + " against " + each.value);
    for (size_t i = 0; i < std::size(kOperators); ++i) {
      EXPECT_EQ(bxira::IsException(kOperators[i], each.column, each.value) != 0, kHolds[each.order + 1][i])
          << "operator " << kOperators[i];
    }
  }
}

TEST(IntegerColumn, SatisfiesNothingWhenTheValueIsNoNumber) {
  for (const char* const value : {"", " ", "x", "1x", "x1", "1 ", " 1", "+1", "--1", "1.0", "0x1", "1,000",
                                  "2147483648", "-2147483649", "99999999999999999999"}) {
    for (const _IntfOper oper : kOperators) EXPECT_EQ(bxira::IsException(oper, 1, value), 0u) << value;
  }
  EXPECT_EQ(bxira::IsException(INTF_NE, 1, nullptr), 0u);
}

}  // namespace
