#pragma once
// Expecting a range error, and reading what it says.

#include <gmock/gmock.h>

#include <string>

#include "util/index_out_of_bounds_exception.h"

/// The text of the IndexOutOfBoundsException that the call throws; empty when it throws none.
template <class Call>
std::string rangeErrorOf(Call call) {
  try {
    call();
  } catch (const VMQ::IndexOutOfBoundsException& error) {
    return error.getText();
  }
  return "";
}

/// The call throws the range error of a text, not of the array behind it.
#define EXPECT_RANGE_ERROR(...) \
  EXPECT_THAT(rangeErrorOf([&] { (void)(__VA_ARGS__); }), testing::EndsWith(", file: vmqstr"))
