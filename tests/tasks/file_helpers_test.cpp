#include "tasks/file_helpers.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <clocale>
#include <string>
#include <thread>
#include <vector>

#include "test_seam.h"
#include "tests/support/eventually.h"
#include "tests/support/open_files.h"
#include "tests/support/system_faults.h"
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

TEST_F(TaskFiles, FailedCloseAfterReadingIsOnlyTraced) {
  const std::string file = directory.writeFile("f", "text");
  const SystemFault failing(SystemCall::kFclose, EIO);
  EXPECT_EQ(readFile(text(file)).toNarrow(), "text");
  EXPECT_EQ(trace.texts(RAS1_ERROR), std::vector{"Failed to close stream for file " + file});
}

// A pipe holds each of them up while it is open.

TEST_F(TaskFiles, ProgramsDoNotGetAFileThatIsRead) {
  const std::string file = directory / "pipe";
  ASSERT_EQ(mkfifo(file.c_str(), 0600), 0);
  std::thread reading([&] { EXPECT_EQ(readFile(text(file)).toNarrow(), "text"); });
  const int other_end = open(file.c_str(), O_WRONLY | O_CLOEXEC);
  // The reader's is open then, but may not have its number yet.
  EXPECT_TRUE(eventually([&] { return descriptorsOf(file).size() == 2; }));
  const std::vector<int> ends = descriptorsOf(file);
  EXPECT_EQ(ends.size(), 2u);
  for (const int end : ends) EXPECT_TRUE(isClosedOnExec(end));
  EXPECT_EQ(write(other_end, "text", 4), 4);
  close(other_end);
  reading.join();
}

TEST_F(TaskFiles, ProgramsDoNotGetAFileThatIsWritten) {
  const std::string file = directory / "pipe";
  ASSERT_EQ(mkfifo(file.c_str(), 0600), 0);
  const std::string long_text(1 << 20, 'x');  // more than a pipe holds
  std::thread writing([&] { EXPECT_TRUE(writeFile(text(file), text(long_text))); });
  const int other_end = open(file.c_str(), O_RDONLY | O_CLOEXEC);
  char first = 0;
  EXPECT_EQ(read(other_end, &first, 1), 1);
  const std::vector<int> ends = descriptorsOf(file);
  EXPECT_EQ(ends.size(), 2u);
  for (const int end : ends) EXPECT_TRUE(isClosedOnExec(end));
  std::vector<char> rest(long_text.size());
  ssize_t count = 0;
  for (size_t taken = 1; taken < long_text.size() && (count = read(other_end, rest.data(), rest.size())) > 0;)
    taken += static_cast<size_t>(count);
  close(other_end);
  writing.join();
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
