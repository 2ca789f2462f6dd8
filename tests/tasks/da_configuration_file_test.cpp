#include "tasks/da_configuration_file.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <map>
#include <string>

#include "test_seam.h"
#include "tests/support/system_faults.h"
#include "tests/support/temporary_directory.h"

namespace {

namespace fs = std::filesystem;
using VMQ::String;

String text(const std::string& s) {
  return String(s.c_str());
}

// ---- key=value lines -----------------------------------------------------------------------------------------------

using Entries = std::map<std::string, std::string>;

class KeyValueFile : public testing::Test {
 protected:
  /// What the file's lines put into a map that has an entry already.
  static Entries entriesOf(const std::string& path, char comment = '*') {
    VMQ::StrStrMap map;
    map.put("before", "kept");
    populateHashMapFromFile(text(path), comment, map);
    Entries entries;
    const VMQ::Array<String> keys = map.getKeys();
    for (unsigned index = 0; index < keys.getSize(); ++index) {
      String value;
      EXPECT_TRUE(map.get(keys[index], value));
      entries[keys[index].toNarrow()] = value.toNarrow();
    }
    EXPECT_EQ(entries["before"], "kept");
    entries.erase("before");
    return entries;
  }
  [[nodiscard]] Entries read(const std::string& contents, char comment = '*') const {
    return entriesOf(directory.writeFile("file", contents), comment);
  }

  const TemporaryDirectory directory;
  TEST_TraceCapture trace;
};

TEST_F(KeyValueFile, EachLineIsAKeyAndItsValue) {
  EXPECT_EQ(read("a=1\nb=two words\n"), (Entries{{"a", "1"}, {"b", "two words"}}));
}

TEST_F(KeyValueFile, LastLineNeedsNoEnd) {
  EXPECT_EQ(read("a=1\nb=2"), (Entries{{"a", "1"}, {"b", "2"}}));
}

TEST_F(KeyValueFile, LinesAreTrimmedButNotWhatStandsAtTheEqualsSign) {
  EXPECT_EQ(read(" \t a = 1 \t\r\n"), (Entries{{"a ", " 1"}}));
}

TEST_F(KeyValueFile, FirstEqualsSignEndsTheKey) {
  EXPECT_EQ(read("a=b=c\nd==\n"), (Entries{{"a", "b=c"}, {"d", "="}}));
}

TEST_F(KeyValueFile, LineWithoutBothSidesIsNone) {
  EXPECT_EQ(read("key\na=\n=b\n=\n a= \n"), Entries());
}

TEST_F(KeyValueFile, EmptyLinesAndCommentsAreSkipped) {
  EXPECT_EQ(read("\n\n  \n*a=1\n  *b=2\nc=*3\nd*=4\n"), (Entries{{"c", "*3"}, {"d*", "4"}}));
}

TEST_F(KeyValueFile, CommentCharacterIsTheCallers) {
  EXPECT_EQ(read("#a=1\n*b=2\n", '#'), (Entries{{"*b", "2"}}));
}

TEST_F(KeyValueFile, LaterLineOfAKeyCounts) {
  EXPECT_EQ(read("a=1\nA=2\na=3\n"), (Entries{{"a", "3"}, {"A", "2"}}));
}

TEST_F(KeyValueFile, FileThatCannotBeReadAddsNothing) {
  EXPECT_EQ(entriesOf(directory / "missing"), Entries());
  EXPECT_EQ(entriesOf(directory.path().string()), Entries());
  EXPECT_EQ(read(""), Entries());
}

// ---- the list of start-up providers --------------------------------------------------------------------------------

class StartupParms : public testing::Test {
 protected:
  bool change() { return changeDaStartupParms("asfs,SNMP", text(list), "inst1"); }

  const TemporaryDirectory directory;
  const std::string before = "ux|DATAPROVIDER|none|\n\nsee inst1|DATAPROVIDER|asfs|rest\ninst10|DATAPROVIDER|a|\nend";
  const std::string after = "ux|DATAPROVIDER|none|\n\ninst1|DATAPROVIDER|asfs,SNMP|\ninst10|DATAPROVIDER|a|\nend\n";
  const std::string list = directory.writeFile("kumenv", before);
  const std::string copy = list + ".copy";
  TEST_TraceCapture trace;
};

TEST_F(StartupParms, LineOfTheInstanceIsReplacedAndTheOthersStay) {
  EXPECT_TRUE(change());
  EXPECT_EQ(readWholeFile(list), after);
  EXPECT_FALSE(fs::exists(copy));
  EXPECT_TRUE(
      trace.has(RAS1_DETAIL, "Writing startup parms [asfs,SNMP] to config file [" + list + "] instance [inst1]"));
}

TEST_F(StartupParms, MissingOrEmptyListIsAFailure) {
  fs::resize_file(list, 0);
  EXPECT_FALSE(change());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Contents of config file [" + list + "] was empty"));
  fs::remove(list);
  trace.clear();
  EXPECT_FALSE(change());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Contents of config file [" + list + "] was empty"));
  EXPECT_FALSE(fs::exists(copy));
}

TEST_F(StartupParms, CopyThatCannotBeWrittenLeavesTheListAsItWas) {
  fs::create_directory(copy);
  EXPECT_FALSE(change());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to write to file " + list)) << "by its own name, not by the copy's";
  EXPECT_EQ(readWholeFile(list), before);
}

TEST_F(StartupParms, ListThatCannotBeRemovedStaysAndSoDoesTheCopy) {
  const SystemFault failing(SystemCall::kUnlink, EPERM);
  EXPECT_FALSE(change());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to delete file " + list + " error was: Operation not permitted"));
  EXPECT_EQ(readWholeFile(list), before);
  EXPECT_EQ(readWholeFile(copy), after);
}

TEST_F(StartupParms, NewListThatCannotBePutInPlaceIsInTheCopy) {
  // The list has been read and its copy written; the copy is opened for reading and the list cannot be.
  const SystemFault failing(SystemCall::kFopen, EACCES, /*nth=*/4);
  EXPECT_FALSE(change());
  EXPECT_TRUE(failing.happened());
  EXPECT_FALSE(fs::exists(list));
  EXPECT_EQ(readWholeFile(copy), after);
}

TEST_F(StartupParms, ModeThatCannotBeKeptIsOnlyTraced) {
  ASSERT_EQ(chmod(list.c_str(), 0640), 0);
  const SystemFault failing(SystemCall::kChmod, EPERM);
  EXPECT_TRUE(change());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to set permissions on file [" + list + "] to [416]"));  // 0640
  EXPECT_EQ(readWholeFile(list), after);
  EXPECT_FALSE(fs::exists(copy));
}

TEST_F(StartupParms, CopyThatCannotBeRemovedIsNoFailure) {
  const SystemFault failing(SystemCall::kUnlink, EPERM, /*nth=*/2);
  EXPECT_TRUE(change());
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to delete file " + copy + " error was: Operation not permitted"));
  EXPECT_EQ(readWholeFile(list), after);
}

}  // namespace
