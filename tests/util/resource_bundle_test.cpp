// Files of key=value lines.
#include "util/resource_bundle.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <string>

#include "tests/support/temporary_directory.h"

using VMQ::ResourceBundle;
using VMQ::ResourceBundleException;
using VMQ::String;

namespace {

using Entries = std::map<std::string, std::string>;

Entries entriesOf(const ResourceBundle& bundle) {
  Entries entries;
  const VMQ::Array<String> keys = bundle.getKeys();
  for (unsigned i = 0; i < keys.getSize(); ++i) entries[keys[i].toNarrow()] = bundle.getValue(keys[i])->toNarrow();
  return entries;
}

class ResourceBundleTest : public testing::Test {
 protected:
  [[nodiscard]] Entries read(const std::string& text) const {
    return entriesOf(ResourceBundle(String(directory_.writeFile("bundle", text).c_str()), '*'));
  }

  TemporaryDirectory directory_;
};

struct Case {
  const char* name;
  std::string text;
  Entries entries;
};

class ResourceBundleTextTest : public ResourceBundleTest, public testing::WithParamInterface<Case> {};

TEST_P(ResourceBundleTextTest, GivesTheseEntries) {
  EXPECT_EQ(read(GetParam().text), GetParam().entries);
}

INSTANTIATE_TEST_SUITE_P(
    All, ResourceBundleTextTest,
    testing::Values(
        Case{"OneEntry", "key=value\n", {{"key", "value"}}},
        Case{"SeveralEntries", "a=1\nb=2\n\nc=3\n", {{"a", "1"}, {"b", "2"}, {"c", "3"}}},
        Case{"BlanksAroundKeyAndValue", " \tkey \t=\t value of it \t\n", {{"key", "value of it"}}},
        Case{"CommentLine", "*a=1\nb=2\n", {{"b", "2"}}},
        Case{"CommentCharacterBehindABlank", " *a=1\n", {{"*a", "1"}}},
        Case{"CommentCharacterInTheMiddle", "a*b=1*2\n", {{"a*b", "1*2"}}},
        Case{"TwoEqualsSigns", "a=b=c\n", {{"a", "b=c"}}},
        Case{"ValueThatEndsWithAnEqualsSign", "a= b =\n", {{"a", "b ="}}}, Case{"EmptyValue", "a=\n", {{"a", ""}}},
        Case{"EmptyKey", "=1\n", {{"", "1"}}}, Case{"EqualsSignAlone", " = \n", {{"", ""}}},
        Case{"LineWithoutAnEqualsSign", "nothing\na=1\n", {{"a", "1"}}},
        Case{"LineOfBlanks", "   \t\na=1\n", {{"a", "1"}}},
        Case{"LastLineWithoutAnEnd", "a=1\nb=2", {{"a", "1"}, {"b", "2"}}},
        Case{"LastLineIsAComment", "a=1\n*b=2", {{"a", "1"}}},
        Case{"CarriageReturnsAndLineFeeds", "a=1\r\nb=2\r\n\r\n*c=3\r\nd=4", {{"a", "1"}, {"b", "2"}, {"d", "4"}}},
        Case{"CarriageReturnInsideALine", "a=1\r2\n", {{"a", "1\r2"}}},
        Case{"CarriageReturnIsNoLineEnd", "a=1\rb=2\n", {{"a", "1\rb=2"}}},
        Case{"CarriageReturnAtTheEndOfTheFile", "a=1\nb\r=2", {{"a", "1"}, {"b", "2"}}},
        Case{"RepeatedKey", "a=1\na=2\n", {{"a", "2"}}},
        Case{"KeysDifferInCase", "a=1\nA=2\n", {{"a", "1"}, {"A", "2"}}}, Case{"EmptyFile", "", {}},
        Case{"LineEndsOnly", "\n\r\n\n", {}},
        Case{"ZeroByteDoesNotHideTheRest", std::string("a=1\0x\nb=2\n", 10), {{"a", "1"}, {"b", "2"}}}),
    [](const auto& test) { return std::string(test.param.name); });

TEST_F(ResourceBundleTest, MissingKeyGivesNull) {
  const ResourceBundle bundle(String(directory_.writeFile("bundle", "a=1").c_str()), '*');
  EXPECT_EQ(bundle.getValue(String("b")), nullptr);
  EXPECT_EQ(bundle.getValue(String("A")), nullptr);
}

TEST_F(ResourceBundleTest, ValueBelongsToTheBundle) {
  const ResourceBundle bundle(String(directory_.writeFile("bundle", "a=1").c_str()), '*');
  EXPECT_EQ(bundle.getValue(String("a")), bundle.getValue(String("a")));
}

TEST_F(ResourceBundleTest, CommentCharacterIsTheCallers) {
  const ResourceBundle bundle(String(directory_.writeFile("bundle", "#a=1\n*b=2\n").c_str()), '#');
  EXPECT_EQ(entriesOf(bundle), (Entries{{"*b", "2"}}));
}

TEST_F(ResourceBundleTest, CopyIsIndependent) {
  auto original = std::make_unique<ResourceBundle>(String(directory_.writeFile("bundle", "a=1\nb=2").c_str()), '*');
  const ResourceBundle copy(*original);
  EXPECT_NE(copy.getValue(String("a")), original->getValue(String("a")));
  original.reset();
  EXPECT_EQ(entriesOf(copy), (Entries{{"a", "1"}, {"b", "2"}}));
}

TEST_F(ResourceBundleTest, MissingFileThrowsItsName) {
  const std::string path = directory_ / "none";
  try {
    const ResourceBundle bundle(String(path.c_str()), '*');
    FAIL() << "nothing thrown";
  } catch (const ResourceBundleException& exception) {
    EXPECT_EQ(exception.getErrorMessage().toNarrow(), "Unable to read file: " + path);
    EXPECT_EQ(ResourceBundleException(exception).getErrorMessage().toNarrow(), "Unable to read file: " + path);
  }
}

TEST_F(ResourceBundleTest, DirectoryThrows) {
  EXPECT_THROW(ResourceBundle(String(directory_.path().c_str()), '*'), ResourceBundleException);
}

TEST(FreeValueTest, NullIsIgnored) {
  VMQ::freeValueFunc(nullptr);
  VMQ::freeValueFunc(new String("deleted"));
}

// What is written line by line is read back, whatever the line ends.
TEST_F(ResourceBundleTest, RandomEntriesAreReadBack) {
  const unsigned seed = std::random_device()();
  SCOPED_TRACE(seed);
  std::mt19937 random(seed);
  const auto word = [&random] {
    std::string text;
    for (unsigned n = 1 + random() % 12; n > 0; --n) text += static_cast<char>('a' + random() % 26);
    return text;
  };
  for (int round = 0; round < 50; ++round) {
    Entries expected;
    std::string text;
    for (unsigned lines = random() % 40; lines > 0; --lines) {
      const std::string key = word();
      const std::string value = word() + (random() % 2 == 0 ? "=" + word() : "");
      expected[key] = value;
      text += key + "=" + value + (random() % 2 == 0 ? "\n" : "\r\n");
      if (random() % 4 == 0) text += "*" + word() + "=" + word() + "\n";
    }
    EXPECT_EQ(read(text), expected);
  }
}

}  // namespace
