// What a shell reads as itself.
#include "util/shell_word.h"

#include <gtest/gtest.h>

#include <string>

using VMQ::isPlainShellWord;
using VMQ::String;

namespace {

TEST(ShellWordTest, PathsAndNamesArePlain) {
  for (const char* const text : {"", "a", "/opt/agent-1.2_3/depot", "C:x,y@z+%=", "/opt/\xC3\xA9t\xC3\xA9/"}) {
    EXPECT_TRUE(isPlainShellWord(String(text))) << text;
  }
}

TEST(ShellWordTest, EveryWhiteSpaceAndControlCharacterIsFound) {
  for (int c = 1; c <= 0x20; ++c) {
    EXPECT_FALSE(isPlainShellWord(String((std::string("a") + static_cast<char>(c) + "b").c_str()))) << c;
  }
  EXPECT_FALSE(isPlainShellWord(String("\x7F")));
}

TEST(ShellWordTest, EveryMetacharacterIsFoundAnywhere) {
  for (const char c : std::string("|&;<>()$`\\\"'*?[]{}!^#~")) {
    const std::string text(1, c);
    EXPECT_FALSE(isPlainShellWord(String(text.c_str()))) << c;
    EXPECT_FALSE(isPlainShellWord(String(("ab" + text).c_str()))) << c;
    EXPECT_FALSE(isPlainShellWord(String(("a" + text + "b").c_str()))) << c;
  }
}

}  // namespace
