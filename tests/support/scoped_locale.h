#pragma once
// The locale of narrow text for the length of a test.

#include <gtest/gtest.h>

#include <clocale>

#include "util/string.h"

/// Conversions from and to narrow text in a locale while it lives; in the C locale afterwards. For tests of one thread.
class ScopedLocale {
 public:
  explicit ScopedLocale(const char* name) {
    EXPECT_NE(std::setlocale(LC_CTYPE, name), nullptr) << name;
    EXPECT_TRUE(VMQ::String::initialize());
  }
  ~ScopedLocale() {
    std::setlocale(LC_CTYPE, "C");
    VMQ::String::initialize();
  }
  ScopedLocale(const ScopedLocale&) = delete;
  ScopedLocale& operator=(const ScopedLocale&) = delete;
};
