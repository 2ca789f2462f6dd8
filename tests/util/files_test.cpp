// Small work on files and directories.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <barrier>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <thread>
#include <vector>

#include "test_seam.h"
#include "tests/support/failing_allocation.h"
#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"
#include "util/util.h"

namespace fs = std::filesystem;
using VMQ::String;
using VMQ::Util;

// An allocation that is too large fails, as it does without the sanitizers.
extern "C" [[gnu::visibility("default")]] const char* __asan_default_options();
extern "C" const char* __asan_default_options() {
  return "allocator_may_return_null=1";
}
extern "C" [[gnu::visibility("default")]] const char* __tsan_default_options();
extern "C" const char* __tsan_default_options() {
  return "allocator_may_return_null=1";
}

namespace {

mode_t modeOf(const std::string& path) {
  struct stat status;
  return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777 : 0;
}

// A umask for the length of a test.
class Umask {
 public:
  explicit Umask(mode_t mask) : before_(umask(mask)) {}
  ~Umask() { umask(before_); }
  Umask(const Umask&) = delete;
  Umask& operator=(const Umask&) = delete;

 private:
  const mode_t before_;
};

class FilesTest : public testing::Test {
 protected:
  [[nodiscard]] String in(const std::string& name) const { return String((directory_ / name).c_str()); }
  [[nodiscard]] std::string at(const std::string& name) const { return directory_ / name; }

  TemporaryDirectory directory_;
  TEST_TraceCapture trace_;
};

// ---- pathExists ----------------------------------------------------------------------------------------------------

TEST_F(FilesTest, PathThatExistsIsFound) {
  directory_.writeFile("file", "");
  EXPECT_TRUE(Util::pathExists(in("file")));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Path [" + at("file") + "] exists"));
}

TEST_F(FilesTest, PathThatIsMissingIsNot) {
  EXPECT_FALSE(Util::pathExists(in("none")));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Path [" + at("none") + "] does not exist"));
  EXPECT_FALSE(Util::pathExists(String()));
}

// ---- createDir -----------------------------------------------------------------------------------------------------

class CreateDirTest : public FilesTest {
 protected:
  static int create(std::string path) { return Util::createDir(path.data()); }
};

TEST_F(CreateDirTest, MakesEveryMissingParentWithMode0770) {
  const Umask mask(0);
  fs::create_directory(at("a"));
  EXPECT_EQ(create(at("a/b/c")), 0);
  EXPECT_EQ(modeOf(at("a/b")), 0770u);
  EXPECT_EQ(modeOf(at("a/b/c")), 0770u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Making directory " + at("a/b")));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Making final directory " + at("a/b/c")));
  EXPECT_FALSE(trace_.has(RAS1_DETAIL, "Making directory " + at("a")));
}

TEST_F(CreateDirTest, UmaskAppliesToTheMode) {
  const Umask mask(027);
  EXPECT_EQ(create(at("a/b")), 0);
  EXPECT_EQ(modeOf(at("a")), 0750u);
  EXPECT_EQ(modeOf(at("a/b")), 0750u);
}

TEST_F(CreateDirTest, TrailingAndRepeatedSlashesDoNotMatter) {
  EXPECT_EQ(create("/" + at("a//b/")), 0);
  EXPECT_TRUE(fs::is_directory(at("a/b")));
}

TEST_F(CreateDirTest, RelativePathIsMadeInTheCurrentDirectory) {
  const fs::path before = fs::current_path();
  fs::current_path(directory_.path());
  EXPECT_EQ(create("r/s"), 0);
  fs::current_path(before);
  EXPECT_TRUE(fs::is_directory(at("r/s")));
}

TEST_F(CreateDirTest, DirectoryThatExistsIsASuccess) {
  EXPECT_EQ(create(directory_.path().string()), 0);
  EXPECT_THAT(trace_.texts(RAS1_DETAIL), testing::IsEmpty());
}

TEST_F(CreateDirTest, DirectoryBehindALinkIsASuccess) {
  fs::create_directory(at("real"));
  fs::create_directory_symlink(at("real"), at("link"));
  EXPECT_EQ(create(at("link/a")), 0);
  EXPECT_TRUE(fs::is_directory(at("real/a")));
}

TEST_F(CreateDirTest, DirectoryMadeBySomebodyElseMeanwhileIsASuccess) {
  constexpr int rounds = 200;
  std::vector<int> failures(2);
  std::barrier start(static_cast<std::ptrdiff_t>(failures.size()));
  std::vector<std::thread> threads;
  for (int& failed : failures) {
    threads.emplace_back([&failed, &start, this] {
      for (int round = 0; round < rounds; ++round) {
        start.arrive_and_wait();
        if (create(at("race" + std::to_string(round)) + "/a/b/c/d") != 0) ++failed;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_THAT(failures, testing::Each(0));
}

TEST_F(CreateDirTest, NothingBesideSlashesIsAFailure) {
  for (const char* const path : {"", "/", "///"}) {
    trace_.clear();
    EXPECT_NE(create(path), 0);
    EXPECT_TRUE(trace_.has(RAS1_ERROR, "Could not create directory " + std::string(path) + ", nothing to create"));
  }
}

TEST_F(CreateDirTest, FileInAParentsPlaceIsAFailure) {
  directory_.writeFile("file", "kept");
  EXPECT_EQ(create(at("file/a/b")), EEXIST);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to make directory " + at("file") + ", return code status"));
  EXPECT_EQ(readWholeFile(at("file")), "kept");
}

TEST_F(CreateDirTest, FileInTheDirectorysPlaceIsAFailure) {
  directory_.writeFile("file", "kept");
  EXPECT_EQ(create(at("file")), EEXIST);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to make directory " + at("file") + ", return code status"));
  EXPECT_EQ(readWholeFile(at("file")), "kept");
}

TEST_F(CreateDirTest, NameThatIsTooLongIsAFailure) {
  EXPECT_EQ(create(at(std::string(300, 'x'))), ENAMETOOLONG);
}

TEST_F(CreateDirTest, PrefixWithoutMemoryIsAFailure) {
  std::string path = directory_.path().string();
  while (path.size() < 3000) path += "/" + std::string(200, 'p');
  const size_t prefix_bytes = path.size() + 1;
  std::string longer = path + "/last";
  {
    const FailingAllocation failing(prefix_bytes);
    EXPECT_EQ(Util::createDir(longer.data()), ENOMEM);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Malloc of " + std::to_string(prefix_bytes) + " bytes failed"));
  EXPECT_FALSE(fs::exists(path));
}

// ---- readFile ------------------------------------------------------------------------------------------------------

class ReadFileTest : public FilesTest {
 protected:
  int read(const std::string& path) {
    char* contents = reinterpret_cast<char*>(this);  // must be overwritten, whatever happens
    const int rc = Util::readFile(path.c_str(), &contents, &size_);
    contents_.reset(contents);
    return rc;
  }

  std::unique_ptr<char, decltype(&std::free)> contents_{nullptr, std::free};
  unsigned long size_ = 99;
};

TEST_F(ReadFileTest, WholeFileIsReadAndTerminated) {
  ASSERT_EQ(read(directory_.writeFile("file", "one\ntwo")), 0);
  EXPECT_STREQ(contents_.get(), "one\ntwo");
  EXPECT_EQ(size_, 7u);
}

TEST_F(ReadFileTest, LargeFileIsReadWhole) {
  const std::string text(1 << 20, 'x');
  ASSERT_EQ(read(directory_.writeFile("file", text)), 0);
  EXPECT_EQ(std::string(contents_.get()), text);
}

TEST_F(ReadFileTest, ZeroBytesInAFileAreRead) {
  ASSERT_EQ(read(directory_.writeFile("file", std::string("a\0b", 3))), 0);
  EXPECT_EQ(std::string(contents_.get(), size_), std::string("a\0b", 3));
  EXPECT_EQ(contents_.get()[3], '\0');
}

TEST_F(ReadFileTest, SizeNeedNotBeAskedFor) {
  char* contents = nullptr;
  ASSERT_EQ(Util::readFile(directory_.writeFile("file", "text").c_str(), &contents), 0);
  EXPECT_STREQ(contents, "text");
  std::free(contents);
}

TEST_F(ReadFileTest, EmptyFileIsASuccessWithoutABuffer) {
  EXPECT_EQ(read(directory_.writeFile("file", "")), 0);
  EXPECT_EQ(contents_, nullptr);
  EXPECT_EQ(size_, 0u);
}

TEST_F(ReadFileTest, MissingFileGivesItsErrorNumberAndNoBuffer) {
  EXPECT_EQ(read(at("none")), ENOENT);
  EXPECT_EQ(contents_, nullptr);
}

TEST_F(ReadFileTest, DirectoryIsRefused) {
  EXPECT_EQ(read(directory_.path().string()), EISDIR);
  EXPECT_EQ(contents_, nullptr);
}

TEST_F(ReadFileTest, StreamWithoutALengthIsRefused) {
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
  EXPECT_EQ(read("/proc/self/fd/" + std::to_string(ends[0])), ESPIPE);
  EXPECT_EQ(contents_, nullptr);
  close(ends[0]);
  close(ends[1]);
}

TEST_F(ReadFileTest, FileThatIsCutOrGrowsMeanwhileIsReadSafely) {
  const std::string path = directory_.writeFile("file", std::string(100000, 'x'));
  std::atomic<bool> stop{false};
  std::thread changer([&] {
    while (!stop) {
      EXPECT_EQ(truncate(path.c_str(), 10), 0);
      EXPECT_EQ(truncate(path.c_str(), 200000), 0);
    }
  });
  for (int round = 0; round < 300; ++round) {
    ASSERT_EQ(read(path), 0);
    if (contents_ != nullptr) {
      ASSERT_LE(std::strlen(contents_.get()), size_);
      ASSERT_LE(size_, 200000u);
      ASSERT_EQ(contents_.get()[size_], '\0');
    }
  }
  stop = true;
  changer.join();
}

TEST_F(ReadFileTest, FileLargerThanTheMemoryIsAFailure) {
  const int descriptor = memfd_create("huge", MFD_CLOEXEC);
  ASSERT_GE(descriptor, 0);
  ASSERT_EQ(ftruncate(descriptor, off_t{1} << 62), 0);
  const std::string path = "/proc/self/fd/" + std::to_string(descriptor);
  EXPECT_EQ(read(path), ENOMEM);
  EXPECT_EQ(contents_, nullptr);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Unable to read file: " + path));
  close(descriptor);
}

TEST_F(ReadFileTest, NoDescriptorIsLeftOpen) {
  const ProcessResources before = ProcessResources::now();
  (void)read(directory_.writeFile("file", "text"));
  (void)read(directory_.writeFile("empty", ""));
  (void)read(directory_.path().string());
  EXPECT_EQ(ProcessResources::now(), before);
}

// ---- deleteFile ----------------------------------------------------------------------------------------------------

TEST_F(FilesTest, DeletedFileIsGone) {
  directory_.writeFile("file", "");
  EXPECT_TRUE(Util::deleteFile(in("file")));
  EXPECT_FALSE(fs::exists(at("file")));
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::IsEmpty());
}

TEST_F(FilesTest, MissingFileCannotBeDeleted) {
  EXPECT_FALSE(Util::deleteFile(in("none")));
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error deleting [" + at("none") + "]: No such file or directory"));
}

TEST_F(FilesTest, DirectoryIsNotDeleted) {
  fs::create_directory(at("dir"));
  EXPECT_FALSE(Util::deleteFile(in("dir")));
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error deleting [" + at("dir") + "]: Is a directory"));
  EXPECT_TRUE(fs::is_directory(at("dir")));
}

// ---- copying -------------------------------------------------------------------------------------------------------

class CopyFileTest : public FilesTest {
 protected:
  CopyFileTest() {
    directory_.writeFile("source", "bytes of it\n");
    fs::create_directory(at("dir"));
  }
};

TEST_F(CopyFileTest, CopyHoldsTheSameBytesWhateverTheirNumber) {
  for (const size_t size : {0u, 1u, 1023u, 1024u, 1025u, 100000u}) {
    std::string bytes(size, '\0');
    for (size_t i = 0; i < size; ++i) bytes[i] = static_cast<char>(i * 7);
    directory_.writeFile("from", bytes);
    EXPECT_EQ(Util::_copyFile(in("from"), in("to")), 0);
    EXPECT_EQ(readWholeFile(at("to")), bytes) << size;
  }
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Source file [" + at("from") + "] destination file [" + at("to") + "]"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Exit with return code (0)"));
}

TEST_F(CopyFileTest, CopyReplacesALongerFile) {
  directory_.writeFile("from", "short");
  directory_.writeFile("to", std::string(5000, 'x'));
  EXPECT_EQ(Util::_copyFile(in("from"), in("to")), 0);
  EXPECT_EQ(readWholeFile(at("to")), "short");
}

TEST_F(CopyFileTest, CopyIntoADirectoryKeepsTheName) {
  for (const char* const directory : {"dir", "dir/"}) {
    fs::remove(at("dir/source"));
    trace_.clear();
    EXPECT_EQ(Util::copyFile(in("source"), in(directory)), 0);
    EXPECT_EQ(readWholeFile(at("dir/source")), readWholeFile(at("source")));
    EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Copying file [" + at("source") + "] to directory [" + at(directory) + "]"));
    EXPECT_TRUE(
        trace_.has(RAS1_DETAIL, "Source file [" + at("source") + "] destination file [" + at("dir/source") + "]"));
    EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Exit with return code (0)"));
  }
}

TEST_F(CopyFileTest, CopyIntoADirectoryMayGetANameOfItsOwn) {
  EXPECT_EQ(Util::copyFile(in("source"), in("dir"), String("other")), 0);
  EXPECT_EQ(readWholeFile(at("dir/other")), readWholeFile(at("source")));
}

TEST_F(CopyFileTest, SourceWithoutADirectoryIsCopiedByItsWholeName) {
  const fs::path before = fs::current_path();
  fs::current_path(directory_.path());
  EXPECT_EQ(Util::copyFile(String("source"), String("dir")), 0);
  fs::current_path(before);
  EXPECT_TRUE(fs::exists(at("dir/source")));
}

TEST_F(CopyFileTest, CopyOntoItselfLeavesTheFileWhole) {
  fs::create_symlink(at("source"), at("link"));
  fs::create_hard_link(at("source"), at("hard"));
  const std::string bytes = readWholeFile(at("source"));
  for (const char* const name : {"source", "link", "hard", "dir/../source"}) {
    EXPECT_EQ(Util::_copyFile(in("source"), in(name)), 0) << name;
    EXPECT_EQ(Util::_copyFile(in(name), in("source")), 0) << name;
    EXPECT_EQ(readWholeFile(at("source")), bytes) << name;
  }
  EXPECT_EQ(Util::copyFile(in("source"), String(directory_.path().c_str())), 0);
  EXPECT_EQ(readWholeFile(at("source")), bytes);
}

TEST_F(CopyFileTest, MissingSourceIsAFailureAndMakesNothing) {
  EXPECT_EQ(Util::copyFile(in("none"), in("dir")), ENOENT);
  EXPECT_TRUE(
      trace_.has(RAS1_ERROR, "Failed to open source file " + at("none") +
                                 " using mode \"rb\", check permissions, error code: No such file or directory"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Exit with return code (" + std::to_string(ENOENT) + ")"));
  EXPECT_TRUE(fs::is_empty(at("dir")));
}

TEST_F(CopyFileTest, DirectoryAsSourceIsAFailureAndMakesNothing) {
  directory_.writeFile("to", "kept");
  EXPECT_EQ(Util::_copyFile(in("dir"), in("to")), EISDIR);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to open source file " + at("dir") +
                                         " using mode \"rb\", check permissions, error code: Is a directory"));
  EXPECT_EQ(readWholeFile(at("to")), "kept");
}

TEST_F(CopyFileTest, SourceThatEndsWithASlashIsAFailure) {
  EXPECT_EQ(Util::copyFile(in("source/"), in("dir")), ENOTDIR);
}

TEST_F(CopyFileTest, DestinationThatCannotBeOpenedIsAFailure) {
  EXPECT_EQ(Util::copyFile(in("source"), in("none")), ENOENT);
  EXPECT_TRUE(
      trace_.has(RAS1_ERROR, "Failed to open destination file " + at("none/source") +
                                 " using mode \"wb\", check permissions, error code: No such file or directory"));
}

TEST_F(CopyFileTest, ReadErrorIsAFailure) {
  EXPECT_EQ(Util::_copyFile(String("/proc/self/mem"), in("to")), EIO);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error reading from file /proc/self/mem, error code: Input/output error"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Exit with return code (" + std::to_string(EIO) + ")"));
}

TEST_F(CopyFileTest, FullDiskIsAFailureOfTheWrite) {
  directory_.writeFile("large", std::string(100000, 'x'));
  EXPECT_EQ(Util::_copyFile(in("large"), String("/dev/full")), ENOSPC);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error writing to file /dev/full, error code: No space left on device"));
}

TEST_F(CopyFileTest, FullDiskThatShowsAtTheCloseIsAFailureToo) {
  EXPECT_EQ(Util::_copyFile(in("source"), String("/dev/full")), ENOSPC);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to close stream for file /dev/full, error code: No space left on device"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Exit with return code (" + std::to_string(ENOSPC) + ")"));
}

TEST_F(CopyFileTest, NoDescriptorIsLeftOpen) {
  const ProcessResources before = ProcessResources::now();
  (void)Util::_copyFile(in("source"), in("to"));
  (void)Util::_copyFile(in("source"), in("source"));
  (void)Util::_copyFile(in("source"), in("none/to"));
  (void)Util::_copyFile(in("dir"), in("to"));
  (void)Util::_copyFile(String("/proc/self/mem"), in("to"));
  (void)Util::_copyFile(in("source"), String("/dev/full"));
  EXPECT_EQ(ProcessResources::now(), before);
}

// ---- fso_test ------------------------------------------------------------------------------------------------------

class FsoTest : public FilesTest {
 protected:
  FsoTest() {
    directory_.writeFile("file", "");
    fs::create_directory(at("dir"));
  }
  static int test(std::string path) { return Util::fso_test(path.data()); }
};

TEST_F(FsoTest, DirectoryIsZero) {
  EXPECT_EQ(test(at("dir")), 0);
}

TEST_F(FsoTest, AnythingElseThatExistsIsOne) {
  EXPECT_EQ(test(at("file")), 1);
  EXPECT_EQ(test("/dev/null"), 1);
}

TEST_F(FsoTest, MissingPathIsTwo) {
  EXPECT_EQ(test(at("none")), 2);
  EXPECT_EQ(test(""), 2);
}

TEST_F(FsoTest, QuotesAroundThePathAndSeparatorsBehindItAreStripped) {
  EXPECT_EQ(test("\"" + at("dir") + "\""), 0);
  EXPECT_EQ(test("\"\"" + at("dir") + "//\"\""), 0);
  EXPECT_EQ(test(at("dir") + "\\\\"), 0);
  EXPECT_EQ(test(at("dir") + "\\//"), 0);
  EXPECT_EQ(test(at("file") + "/"), 1);
}

TEST_F(FsoTest, SlashesAreStrippedBeforeBackslashesOnly) {
  EXPECT_EQ(test(at("file") + "/\\"), 2);  // the slash stays, and no file is a directory
}

TEST_F(FsoTest, StrippingHappensInPlace) {
  std::string path = "\"" + at("dir") + "/\\\"";
  (void)Util::fso_test(path.data());
  EXPECT_STREQ(path.c_str(), ("\"" + at("dir") + "/").c_str());
}

TEST_F(FsoTest, RootAloneIsStrippedAway) {
  EXPECT_EQ(test("/"), 2);
}

}  // namespace
