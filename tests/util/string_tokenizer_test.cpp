// Splitting texts at runs of delimiters.
#include "util/string_tokenizer.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "range_error.h"
#include "test_seam.h"

using VMQ::String;

namespace {

using Tokens = std::vector<std::string>;

/// All tokens, while the count of those to come is looked at.
Tokens tokensOf(StringTokenizer tokenizer) {
  Tokens tokens;
  int expected = tokenizer.countTokens();
  while (tokenizer.hasMoreTokens()) {
    EXPECT_EQ(tokenizer.countTokens(), expected--);
    tokens.push_back(tokenizer.nextToken().toNarrow());
  }
  EXPECT_EQ(expected, 0);
  return tokens;
}

struct Split {
  const char* text;
  const char* delimiters;
  Tokens tokens;
};

TEST(StringTokenizerTest, TokensAreWhatStandsBetweenDelimiters) {
  const Split cases[] = {
      {"a,,b,", ",", {"a", "b"}},
      {"  a b  ", " ", {"a", "b"}},
      {"a=b:c", "=:", {"a", "b", "c"}},
      {"a=b:c", ":=", {"a", "b", "c"}},
      {"abc", ",", {"abc"}},
      {",,,", ",", {}},
      {"", ",", {}},
      {"=:=a:=:", ":=", {"a"}},
      {"one\ttwo\nthree", "\t\n", {"one", "two", "three"}},
  };
  for (const Split& c : cases) {
    EXPECT_EQ(tokensOf(StringTokenizer(String(c.text), String(c.delimiters))), c.tokens) << c.text;
  }
}

TEST(StringTokenizerTest, CountingDoesNotMove) {
  StringTokenizer tokenizer(String("  a b  "), String(" "));
  EXPECT_EQ(tokenizer.countTokens(), 2);
  EXPECT_EQ(tokenizer.countTokens(), 2);
  EXPECT_EQ(tokenizer.nextToken(), "a");
  EXPECT_EQ(tokenizer.countTokens(), 1);
  EXPECT_EQ(tokenizer.nextToken(), "b");
  EXPECT_EQ(tokenizer.countTokens(), 0);
  EXPECT_FALSE(tokenizer.hasMoreTokens());
}

TEST(StringTokenizerTest, EmptyTextHasNoTokens) {
  StringTokenizer tokenizer(String(""), String(","));
  EXPECT_FALSE(tokenizer.hasMoreTokens());
  EXPECT_EQ(tokenizer.countTokens(), 0);
  EXPECT_RANGE_ERROR(tokenizer.nextToken());
}

TEST(StringTokenizerTest, AskingForATokenTooManyIsTracedAndThrows) {
  StringTokenizer tokenizer(String("a,"), String(","));
  EXPECT_EQ(tokenizer.nextToken(), "a");
  const TEST_TraceCapture trace;
  EXPECT_RANGE_ERROR(tokenizer.nextToken());
  EXPECT_EQ(trace.texts(RAS1_ERROR), (Tokens{"IndexOutOfBounds occurred, throwing exception"}));
}

TEST(StringTokenizerTest, ScanningStepsFindTheEdgesOfTokens) {
  StringTokenizer tokenizer(String(",,ab,c"), String(","));
  EXPECT_EQ(tokenizer.skipDelims(0), 2);
  EXPECT_EQ(tokenizer.skipDelims(2), 2);
  EXPECT_EQ(tokenizer.readToken(2), 4);
  EXPECT_EQ(tokenizer.readToken(0), 0);
  EXPECT_EQ(tokenizer.readToken(5), 6);
  EXPECT_EQ(tokenizer.skipDelims(6), 6);
}

TEST(StringTokenizerTest, WithoutDelimitersEveryScanThrows) {
  StringTokenizer tokenizer(String("abc"));
  EXPECT_RANGE_ERROR(tokenizer.hasMoreTokens());
  EXPECT_RANGE_ERROR(tokenizer.countTokens());
  EXPECT_RANGE_ERROR(tokenizer.nextToken());
  EXPECT_RANGE_ERROR(tokenizer.readToken(0));
  StringTokenizer explicitly(String("abc"), String(""));
  EXPECT_RANGE_ERROR(explicitly.hasMoreTokens());
}

TEST(StringTokenizerTest, WithoutDelimitersAndTextThereIsNothingToScan) {
  StringTokenizer tokenizer{String("")};
  EXPECT_FALSE(tokenizer.hasMoreTokens());
  EXPECT_EQ(tokenizer.countTokens(), 0);
}

TEST(StringTokenizerTest, TextIsCopied) {
  String text("a,b");
  StringTokenizer tokenizer(text, String(","));
  text.clear();
  EXPECT_EQ(tokenizer.countTokens(), 2);
}

}  // namespace
