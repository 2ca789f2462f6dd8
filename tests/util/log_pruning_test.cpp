// The number of trace logs stays bounded.
#include "util/log_pruning.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "fsi1.h"
#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"

namespace fs = std::filesystem;
using VMQ::getFileName;
using VMQ::pruneLogs;

namespace {

// ---- getFileName ---------------------------------------------------------------------------------------------------

TEST(FileNameTest, IsWhatFollowsTheLastSeparator) {
  EXPECT_STREQ(getFileName("/a/b/c.log"), "c.log");
  EXPECT_STREQ(getFileName("a\\b\\c.log"), "c.log");
  EXPECT_STREQ(getFileName("a/b\\c.log"), "c.log");
  EXPECT_STREQ(getFileName("a\\b/c.log"), "c.log");
  EXPECT_STREQ(getFileName("/c"), "c");
}

TEST(FileNameTest, IsThePathItselfWithoutASeparator) {
  const char* const path = "c.log";
  EXPECT_EQ(getFileName(path), path);
}

TEST(FileNameTest, PointsIntoThePath) {
  const char* const path = "/a/c.log";
  EXPECT_EQ(getFileName(path), path + 3);
}

TEST(FileNameTest, IsNullBehindALastSeparator) {
  for (const char* const path : {"/a/b/", "/", "\\", "a\\"}) EXPECT_EQ(getFileName(path), nullptr) << path;
}

// ---- pruneLogs -----------------------------------------------------------------------------------------------------

class LogPruningTest : public testing::Test {
 protected:
  void makeLog(const std::string& name, time_t seconds, long nanoseconds = 0) const {
    const std::string path = directory_.writeFile(name, "");
    const timespec times[2] = {{seconds, nanoseconds}, {seconds, nanoseconds}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, AT_SYMLINK_NOFOLLOW), 0);
  }
  // vmqproc_ras1_0.log is the oldest.
  void makeLogs(int count) const {
    for (int i = 0; i < count; ++i) makeLog("vmqproc_ras1_" + std::to_string(i) + ".log", 1000 + i);
  }
  void prune() const { pruneLogs(directory_.path().c_str(), "vmqproc_ras1", 10); }
  [[nodiscard]] bool exists(const std::string& name) const { return fs::exists(directory_ / name); }
  [[nodiscard]] long files() const {
    return std::distance(fs::directory_iterator(directory_.path()), fs::directory_iterator());
  }

  TemporaryDirectory directory_;
  TEST_TraceCapture trace_;
};

TEST_F(LogPruningTest, NineLogsStay) {
  makeLogs(9);
  prune();
  EXPECT_EQ(files(), 9);
}

TEST_F(LogPruningTest, OfTenTheOldestGoes) {
  makeLogs(10);
  prune();
  EXPECT_EQ(files(), 9);
  EXPECT_FALSE(exists("vmqproc_ras1_0.log"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "deleting file: " + directory_ / "vmqproc_ras1_0.log" + "\n"));
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::IsEmpty());
}

TEST_F(LogPruningTest, AtMostOneGoesEachTime) {
  makeLogs(15);
  prune();
  EXPECT_EQ(files(), 14);
}

TEST_F(LogPruningTest, WithOneNewLogAfterEachCallTheDirectorySettlesAtTen) {
  for (int i = 0; i < 30; ++i) {
    prune();
    makeLog("vmqproc_ras1_" + std::to_string(i) + ".log", 1000 + i);
  }
  EXPECT_EQ(files(), 10);
  EXPECT_FALSE(exists("vmqproc_ras1_19.log"));
  EXPECT_TRUE(exists("vmqproc_ras1_20.log"));
}

TEST_F(LogPruningTest, OnlyThePrefixIsCompared) {
  makeLogs(9);
  makeLog("vmqproc_ras1_old.txt", 5);
  prune();
  EXPECT_FALSE(exists("vmqproc_ras1_old.txt"));
  EXPECT_EQ(files(), 9);
}

TEST_F(LogPruningTest, OtherNamesAreNeitherCountedNorDeleted) {
  makeLogs(9);
  makeLog("VMQPROC_RAS1_1.log", 1);
  makeLog("vmqproc_ras", 1);
  makeLog("my_vmqproc_ras1.log", 1);
  prune();
  EXPECT_EQ(files(), 12);
}

TEST_F(LogPruningTest, DirectoriesAndLinksAreNeitherCountedNorDeleted) {
  makeLogs(9);
  fs::create_directory(directory_ / "vmqproc_ras1_dir");
  fs::create_symlink(directory_ / "vmqproc_ras1_0.log", directory_ / "vmqproc_ras1_link");
  prune();
  EXPECT_EQ(files(), 11);
}

TEST_F(LogPruningTest, AgeIsTheTimeOfTheLastChangeAndNotTheName) {
  makeLogs(10);
  makeLog("vmqproc_ras1_9.log", 7);
  prune();
  EXPECT_FALSE(exists("vmqproc_ras1_9.log"));
}

TEST_F(LogPruningTest, WithinOneSecondTheNanosecondsDecide) {
  for (int i = 0; i < 10; ++i) makeLog("vmqproc_ras1_" + std::to_string(i), 1000, 1000 - i);
  prune();
  EXPECT_FALSE(exists("vmqproc_ras1_9"));
}

TEST_F(LogPruningTest, NothingMatchesAndNothingIsDeletedWhateverIsKept) {
  makeLog("other", 1);
  pruneLogs(directory_.path().c_str(), "vmqproc_ras1", 0);
  EXPECT_EQ(files(), 1);
}

TEST_F(LogPruningTest, MissingDirectoryIsTracedAndIgnored) {
  pruneLogs((directory_ / "none").c_str(), "vmqproc_ras1", 10);
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              testing::ElementsAre("FSI1_NewList error " + std::to_string(FSI1_SYSTEM_ERROR + ENOENT) + "\n"));
}

TEST_F(LogPruningTest, FailingListIsTracedAndIgnored) {
  makeLogs(10);
  const TEST_FailCall failing("FSI1_NewList", 1, 17);
  prune();
  EXPECT_TRUE(failing.happened());
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::ElementsAre("FSI1_NewList error 17\n"));
  EXPECT_EQ(files(), 10);
}

TEST_F(LogPruningTest, FailingFetchIsTracedWhereverItHappensAndWhatWasSeenCounts) {
  for (unsigned n = 1; n <= 11; ++n) {
    makeLogs(10);
    trace_.clear();
    const TEST_FailCall failing("FSI1_FetchList", n, 17);
    prune();
    EXPECT_TRUE(failing.happened());
    EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::ElementsAre("FSI1_FetchList error 17\n"));
    EXPECT_EQ(files(), n == 11 ? 9 : 10) << n;
  }
}

TEST_F(LogPruningTest, FailingCloseIsTracedAndTheLogIsDeletedAllTheSame) {
  makeLogs(10);
  const TEST_FailCall failing("FSI1_DeleteList", 1, 17);
  prune();
  EXPECT_THAT(trace_.texts(RAS1_ERROR), testing::ElementsAre("FSI1_DeleteList error 17\n"));
  EXPECT_EQ(files(), 9);
}

TEST_F(LogPruningTest, NoDescriptorIsLeftOpen) {
  makeLogs(10);
  const ProcessResources before = ProcessResources::now();
  prune();
  EXPECT_EQ(ProcessResources::now(), before);
}

}  // namespace
