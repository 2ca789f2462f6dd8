#pragma once
// Splits a text at runs of delimiter characters.

#include "util/string.h"

/// Takes tokens from a copy of a text, one after the other. Delimiters in a row separate once, those at the ends not at
/// all, so no token is empty. Not thread-safe.
class StringTokenizer {
 public:
  /// Each unit of `delims` is a delimiter.
  StringTokenizer(VMQ::String str, VMQ::String delims);
  /// Without delimiters: every call on a text that is not empty throws IndexOutOfBoundsException.
  explicit StringTokenizer(VMQ::String str);

  bool hasMoreTokens();
  /// How many tokens are still to come.
  int countTokens();
  /// REQUIRES: hasMoreTokens(). Otherwise IndexOutOfBoundsException is thrown.
  VMQ::String nextToken();

  /// The first position at or after `i` that is not a delimiter's, or the length.
  int skipDelims(int i);
  /// The first position at or after `i` that is a delimiter's, or the length.
  int readToken(int i);

 private:
  [[nodiscard]] bool isInside(int i) const { return static_cast<unsigned int>(i) < str_.length(); }
  [[nodiscard]] bool isDelimiter(int i) const {
    return delims_.find(str_[static_cast<unsigned int>(i)], 0u) != VMQ::String::NPOS;
  }

  VMQ::String str_;
  VMQ::String delims_;
  int pos_ = 0;
};
