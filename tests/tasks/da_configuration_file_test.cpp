#include "tasks/da_configuration_file.h"

#include <gtest/gtest.h>

#include <string>

#include "tests/support/temporary_directory.h"
#include "util/str_str_map.h"

namespace {

using VMQ::String;
using VMQ::StrStrMap;

class KeysAndValues : public testing::Test {
 protected:
  void read(const std::string& text) {
    populateHashMapFromFile(String(directory_.writeFile("um.config", text).c_str()), '*', map_);
  }
  /// "(none)" for a key that is not there.
  [[nodiscard]] std::string valueOf(const char* key) const {
    String value;
    return map_.get(key, value) ? value.toNarrow() : "(none)";
  }

  const TemporaryDirectory directory_;
  StrStrMap map_;
};

TEST_F(KeysAndValues, StandBeforeAndBehindTheFirstEqualsSign) {
  read("A=1\nB=x=y\nC==");
  EXPECT_EQ(map_.getKeys().getSize(), 3u);
  EXPECT_EQ(valueOf("A"), "1");
  EXPECT_EQ(valueOf("B"), "x=y");
  EXPECT_EQ(valueOf("C"), "=");
}

TEST_F(KeysAndValues, LinesAreTrimmedButNotWhatStandsAroundTheEqualsSign) {
  read("  A=1 \t\r\nB = 2\n");
  EXPECT_EQ(valueOf("A"), "1");
  EXPECT_EQ(valueOf("B "), " 2");
}

TEST_F(KeysAndValues, LinesWithoutBothAreSkipped) {
  read("no equals sign\n=value\nkey=\n=\n\n   \n* comment=1\n  * comment=2\nA=1\n");
  EXPECT_EQ(map_.getKeys().getSize(), 1u);
  EXPECT_EQ(valueOf("A"), "1");
}

TEST_F(KeysAndValues, CommentCharacterBehindTheBeginningIsText) {
  read("A=1 * 2\n");
  EXPECT_EQ(valueOf("A"), "1 * 2");
}

}  // namespace
