#include "tasks/file_helpers.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <clocale>
#include <string>

#include "test_seam.h"
#include "tests/support/temporary_directory.h"

namespace {

using VMQ::String;

String text(const std::string& s) {
  return String(s.c_str());
}

/// UTF-8 as the code page of every conversion while it lives.
class Utf8CodePage {
 public:
  Utf8CodePage() {
    EXPECT_NE(setlocale(LC_CTYPE, "C.UTF-8"), nullptr);
    EXPECT_TRUE(String::initialize());
  }
  ~Utf8CodePage() {
    setlocale(LC_CTYPE, "C");
    String::initialize();
  }
};

class TaskFiles : public testing::Test {
 protected:
  TemporaryDirectory directory;
  TEST_TraceCapture trace;
};

TEST_F(TaskFiles, ReadsAWholeFile) {
  const std::string contents = std::string(5000, 'x') + "\nlast";
  EXPECT_EQ(readFile(text(directory.writeFile("f", contents))).toNarrow(), contents);
}

TEST_F(TaskFiles, ReadsAFileOfExactlyOneBlock) {
  const std::string contents(1024, 'b');
  EXPECT_EQ(readFile(text(directory.writeFile("f", contents))).toNarrow(), contents);
}

TEST_F(TaskFiles, CharacterAcrossTwoBlocksStaysWhole) {
  const Utf8CodePage utf8;
  const std::string contents = std::string(1023, 'a') + "\xC3\xA9" + "z";
  EXPECT_EQ(readFile(text(directory.writeFile("f", contents))).length(), 1025u);
}

TEST_F(TaskFiles, MissingFileReadsAsEmpty) {
  EXPECT_EQ(readFile(text(directory / "missing")).length(), 0u);
  EXPECT_TRUE(trace.has(RAS1_ERROR,
                        "Failed to open file " + (directory / "missing") + " using mode \"rb\", check permissions"));
}

TEST_F(TaskFiles, EmptyFileReadsAsEmpty) {
  EXPECT_EQ(readFile(text(directory.writeFile("f", ""))).length(), 0u);
  EXPECT_TRUE(trace.texts(RAS1_ERROR).empty());
}

TEST_F(TaskFiles, DirectoryReadsAsEmptyWithAnError) {
  EXPECT_EQ(readFile(text(directory.path().string())).length(), 0u);
  EXPECT_TRUE(trace.hasPrefix(RAS1_ERROR, "Error reading from file " + directory.path().string() + ", error is "));
}

TEST_F(TaskFiles, WritesAndReplacesAWholeText) {
  const std::string file = directory.writeFile("f", "much longer than before");
  EXPECT_TRUE(writeFile(text(file), "short\n"));
  EXPECT_EQ(readWholeFile(file), "short\n");
}

TEST_F(TaskFiles, WritesCharactersOfSeveralBytesWithoutLosingTheTail) {
  const Utf8CodePage utf8;
  const std::string contents = "\xC3\xA9\xE2\x82\xAC tail";
  EXPECT_TRUE(writeFile(text(directory / "f"), text(contents)));
  EXPECT_EQ(readWholeFile(directory / "f"), contents);
}

TEST_F(TaskFiles, EmptyTextMakesAnEmptyFile) {
  EXPECT_TRUE(writeFile(text(directory / "f"), ""));
  EXPECT_EQ(readWholeFile(directory / "f"), "");
}

TEST_F(TaskFiles, UnwritableFileIsToldWithTheOtherMode) {
  const std::string file = directory / "no/such/f";
  EXPECT_FALSE(writeFile(text(file), "x"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to open file " + file + " using mode \"rb\", check permissions"));
}

TEST_F(TaskFiles, FullDeviceFailsTheWriting) {
  EXPECT_FALSE(writeFile("/dev/full", text(std::string(100000, 'x'))));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Error writing to file /dev/full, error code: No space left on device"));
}

TEST_F(TaskFiles, FullDeviceFailsTheClosing) {
  EXPECT_FALSE(writeFile("/dev/full", "x"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Failed to close stream for file /dev/full"));
}

TEST_F(TaskFiles, DeletesAFile) {
  const std::string file = directory.writeFile("f", "x");
  EXPECT_TRUE(deleteFile(text(file)));
  EXPECT_TRUE(trace.has(RAS1_DETAIL, "Successfully deleted file " + file));
  EXPECT_FALSE(std::filesystem::exists(file));
}

TEST_F(TaskFiles, DeletingAMissingFileFails) {
  EXPECT_FALSE(deleteFile(text(directory / "missing")));
  EXPECT_TRUE(trace.has(RAS1_ERROR,
                        "Failed to delete file " + (directory / "missing") + " error was: No such file or directory"));
}

TEST_F(TaskFiles, DirectoryOfAPath) {
  String part("unchanged");
  EXPECT_TRUE(getDirectoryFromPath("a/b/c", part));
  EXPECT_EQ(part.toNarrow(), "a/b");
}

TEST_F(TaskFiles, PathWithoutADirectoryLeavesTheOutputAlone) {
  for (const char* path : {"/etc", "name", ""}) {
    String part("unchanged");
    EXPECT_FALSE(getDirectoryFromPath(path, part)) << path;
    EXPECT_EQ(part.toNarrow(), "unchanged");
    EXPECT_TRUE(trace.has(RAS1_ERROR, std::string("Directory [") + path + "] cannot be parsed, no dir separator"));
  }
}

TEST_F(TaskFiles, FilenameOfAPath) {
  EXPECT_EQ(getFilenameFromPath("a/b/c").toNarrow(), "c");
  EXPECT_EQ(getFilenameFromPath("/etc").toNarrow(), "/etc");
  EXPECT_EQ(getFilenameFromPath("a/b/").toNarrow(), "");
  EXPECT_EQ(getFilenameFromPath("name").toNarrow(), "name");
}

}  // namespace
