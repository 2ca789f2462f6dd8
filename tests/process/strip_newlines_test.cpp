#include <gmock/gmock.h>

#include <string>

#include "test_seam.h"
#include "util/util.h"

namespace {

using VMQ::String;
using VMQ::Util;

TEST(StripNewlineCharsFromOutput, KeepsTheFirstLine) {
  const std::pair<const char*, const char*> cases[] = {
      {"abc", "abc"},        {"abc\n", "abc"}, {"abc\r\ndef", "abc"}, {"abc\ndef\r\n", "abc"},
      {"abc\rdef\n", "abc"}, {"\nabc", ""},    {"a b\n\n", "a b"},
  };
  for (const auto& [text, line] : cases) {
    String output(text);
    Util::stripNewlineCharsFromOutput(output);
    EXPECT_EQ(output, line) << testing::PrintToString(text);
  }
}

TEST(StripNewlineCharsFromOutput, TracesBothLengths) {
  const TEST_TraceCapture traces;
  String output("abc\r\ndef");
  Util::stripNewlineCharsFromOutput(output);
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "before length = 8"));
  EXPECT_TRUE(traces.has(RAS1_DETAIL, "after length = 3"));
}

TEST(StripNewlineCharsFromOutput, ThrowsWhenThereIsNoFirstLine) {
  for (const char* text : {"", "\r", "\r\nabc"}) {
    String output(text);
    EXPECT_THROW(Util::stripNewlineCharsFromOutput(output), VMQ::IndexOutOfBoundsException)
        << testing::PrintToString(text);
  }
}

}  // namespace
