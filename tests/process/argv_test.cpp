#include "process/argv.h"

#include <gmock/gmock.h>

#include <cerrno>
#include <clocale>
#include <memory>
#include <string>
#include <vector>

#include "test_seam.h"

namespace {

using testing::ElementsAre;
using VMQ::String;
using Words = std::vector<std::string>;

Words wordsOf(char** argv) {
  Words words;
  for (char** word = argv; *word != nullptr; ++word) words.emplace_back(*word);
  return words;
}

Words split(const std::string& line) {
  const String command(line.c_str());
  char** argv = nullptr;
  const char count = VMQ::MakeArgv(&command, &argv);
  const Words words = wordsOf(argv);
  EXPECT_EQ(count, static_cast<char>(words.size())) << line;
  VMQ::freeArgv(argv);
  return words;
}

struct Case {
  const char* line;
  Words words;
};

TEST(MakeArgv, SplitsAtBlanksOutsideQuotes) {
  const Case cases[] = {
      {"a", {"a"}},
      {"a b", {"a", "b"}},
      {"a   b", {"a", "b"}},
      {"a\tb", {"a\tb"}},  // only blanks separate
      {"a \"b c\"", {"a", "b c"}},
      {"a 'b c' d", {"a", "b c", "d"}},
      {"a \"b c", {"a", "b c"}},           // never closed
      {"a \"b' c", {"a", "b", "c"}},       // either kind closes what the other has opened
      {"a \\\"b c", {"a", "\\\"b", "c"}},  // escaped: no quote, and the backslash stays
      {"a \"b \\\" c\"", {"a", "b \\\" c"}},
      {"/bin/sh -c \"exit 3\"", {"/bin/sh", "-c", "exit 3"}},
  };
  for (const Case& c : cases) EXPECT_EQ(split(c.line), c.words) << c.line;
}

TEST(MakeArgv, KeepsTheConsequencesOfItsRules) {
  const Case cases[] = {
      {"", {""}},
      {"  ", {""}},
      {" a", {""}},              // a first blank ends an empty first word, and only one is counted
      {"a b ", {"a", "b", ""}},  // a last blank begins an empty word
      {"ab\"cd\"", {"ab"}},      // a quote inside a word ends it, and its rest is not taken
      {"\"a b\" c", {"", "a b"}},
      {"a \"\"", {"a", ""}},
      {"a \"\" b", {"a", "b", ""}},
      {"sh -c \"echo 'x y'\"", {"sh", "-c", "echo ", "x"}},
  };
  for (const Case& c : cases) EXPECT_EQ(split(c.line), c.words) << c.line;
}

TEST(MakeArgv, CountAbove127DoesNotFitButTheListIsComplete) {
  for (const size_t count : {size_t{127}, size_t{128}, size_t{255}, size_t{256}, size_t{1000}}) {
    std::string line = "w";
    for (size_t i = 1; i < count; ++i) line += " w";
    EXPECT_EQ(split(line).size(), count);
  }
}

TEST(MakeArgv, NullArgumentIsRefusedWithEinval) {
  const TEST_TraceCapture traces;
  const String command("a b");
  char** argv = nullptr;
  errno = 0;
  EXPECT_EQ(VMQ::MakeArgv(nullptr, &argv), static_cast<char>(-1));
  EXPECT_EQ(errno, EINVAL);
  EXPECT_EQ(argv, nullptr);
  errno = 0;
  EXPECT_EQ(VMQ::MakeArgv(&command, nullptr), static_cast<char>(-1));
  EXPECT_EQ(errno, EINVAL);
  const std::string line = "Error occurred. ERRNO:22 Invalid argument";
  EXPECT_THAT(traces.texts(RAS1_ERROR), ElementsAre(line, line));
}

TEST(MakeArgv, CharactersOfSeveralBytesArriveWhole) {
  const std::string before = setlocale(LC_CTYPE, nullptr);
  ASSERT_NE(setlocale(LC_CTYPE, "C.UTF-8"), nullptr);
  ASSERT_TRUE(String::initialize());
  const std::string word = "\xC3\xA9\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80";
  EXPECT_EQ(split("a " + word + " z"), (Words{"a", word, "z"}));
  setlocale(LC_CTYPE, before.c_str());
  String::initialize();
}

TEST(FreeArgv, IgnoresNull) {
  VMQ::freeArgv(nullptr);
}

}  // namespace
