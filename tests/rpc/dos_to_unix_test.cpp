#include "rpc/dos_to_unix.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <filesystem>
#include <thread>

#include "tests/rpc/transfer_fixture.h"
#include "tests/support/eventually.h"
#include "tests/support/open_files.h"
#include "tests/support/process_resources.h"
#include "tests/support/scratch_file_system.h"
#include "tests/support/system_faults.h"
#include "util/util.h"

namespace {

namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::IsEmpty;

class ConvertDos2UnixTest : public TransferTest {
 protected:
  /// A script with one line, of DOS.
  std::string newScript() const { return directory_.writeFile("depot/script", "line\r\n"); }
  [[nodiscard]] std::string workContents() const { return readWholeFile(work_file_); }
};

std::string onError(int error) {
  return "ERRNO: " + std::to_string(error) + " - " + strerror(error);
}

TEST_F(ConvertDos2UnixTest, DropsCarriageReturnsAndControlZWhereverTheyStand) {
  struct Case {
    std::string before;
    std::string after;
  };
  const Case cases[] = {
      {"", ""},
      {"a\r\nb\r\n\x1A", "a\nb\n"},
      {"a\rb\r\rc", "abc"},
      {"\x1A"
       "a\x1A"
       "b\n",
       "ab\n"},
      {"\r\x1A", ""},
      {"no line end", "no line end"},
      {std::string("\0\xFF\n\t\x19\x1B\x0C\x0E", 8), std::string("\0\xFF\n\t\x19\x1B\x0C\x0E", 8)},
  };
  for (const Case& each : cases) {
    SCOPED_TRACE(each.before);
    const std::string path = directory_.writeFile("depot/file", each.before);
    EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
    EXPECT_EQ(readWholeFile(path), each.after);
    EXPECT_EQ(convertDOS2Unix(path.c_str()), 0) << "once more changes nothing";
    EXPECT_EQ(readWholeFile(path), each.after);
  }
  EXPECT_THAT(trace_.texts(RAS1_ERROR), IsEmpty());
}

TEST_F(ConvertDos2UnixTest, ConvertsLargeFiles) {
  std::string text;
  for (int line = 0; line < 100000; ++line) text += "line " + std::to_string(line) + "\r\n";
  const std::string path = directory_.writeFile("depot/file", text);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  std::erase(text, '\r');
  EXPECT_EQ(readWholeFile(path), text);
}

TEST_F(ConvertDos2UnixTest, GoesThroughAWorkFileInTheHome) {
  const std::string path = newScript();
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "tempfile name: [" + work_file_ + "]"));
  EXPECT_FALSE(fs::exists(work_file_));
  struct stat status;
  ASSERT_EQ(stat(path.c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0770u);
  EXPECT_EQ(status.st_nlink, 1u);
}

TEST_F(ConvertDos2UnixTest, WithoutAHomeTheWorkFileIsInTheCurrentDirectory) {
  const std::string path = newScript();
  home_variable_.put(std::nullopt);
  VMQ::Util::TEST_forgetDirectories();
  fs::current_path(depot_);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  fs::current_path("/");
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "tempfile name: [.vmqtemp]"));
  EXPECT_EQ(readWholeFile(path), "line\n");
  EXPECT_FALSE(fs::exists(depot_ + ".vmqtemp"));
}

TEST_F(ConvertDos2UnixTest, LeavesNoDescriptor) {
  const std::string path = newScript();
  const unsigned before = ProcessResources::now().descriptors;
  (void)convertDOS2Unix(path.c_str());
  (void)convertDOS2Unix("/does/not/exist");
  fs::remove_all(home_ + "/tmp");
  (void)convertDOS2Unix(path.c_str());
  EXPECT_EQ(ProcessResources::now().descriptors, before);
}

TEST_F(ConvertDos2UnixTest, KeepsItsFilesFromPrograms) {
  const std::string path = directory_ / "depot/pipe";
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  std::thread converting([&] { EXPECT_EQ(convertDOS2Unix(path.c_str()), 0); });
  const int source = open(path.c_str(), O_WRONLY | O_CLOEXEC);  // once the other end is open
  EXPECT_TRUE(eventually([&] { return descriptorsOf(work_file_).size() == 1; }));
  EXPECT_EQ(descriptorsOf(path).size(), 2u);
  for (const std::string& name : {path, work_file_})
    for (const int descriptor : descriptorsOf(name)) EXPECT_TRUE(isClosedOnExec(descriptor)) << name;
  EXPECT_EQ(write(source, "line\r\n", 6), 6);
  close(source);
  converting.join();
  EXPECT_EQ(readWholeFile(path), "line\n");
}

// ---- the work file -------------------------------------------------------------------------------------------------

TEST_F(ConvertDos2UnixTest, OldWorkFileIsRemovedNotWrittenTo) {
  const std::string path = newScript();
  const std::string kept = directory_.writeFile("kept", "precious");
  fs::create_hard_link(kept, work_file_);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  EXPECT_EQ(readWholeFile(kept), "precious");
  EXPECT_EQ(readWholeFile(path), "line\n");
}

TEST_F(ConvertDos2UnixTest, LinkInPlaceOfTheWorkFileIsNotFollowed) {
  const std::string path = newScript();
  const std::string kept = directory_.writeFile("kept", "precious");
  fs::create_symlink(kept, work_file_);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  EXPECT_EQ(readWholeFile(kept), "precious");
  EXPECT_EQ(readWholeFile(path), "line\n");
  fs::create_symlink(directory_ / "nowhere", work_file_);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  EXPECT_FALSE(fs::exists(directory_ / "nowhere"));
}

TEST_F(ConvertDos2UnixTest, OldWorkFileThatCannotBeRemovedIsNotWrittenToEither) {
  const std::string path = newScript();
  const std::string kept = directory_.writeFile("kept", "precious");
  for (const bool symbolic : {false, true}) {
    fs::remove(work_file_);
    symbolic ? fs::create_symlink(kept, work_file_) : fs::create_hard_link(kept, work_file_);
    trace_.clear();
    const SystemFault failing(SystemCall::kUnlink, EPERM);
    EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
    EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not open [" + work_file_ + "] for writing."));
    EXPECT_EQ(readWholeFile(kept), "precious");
    EXPECT_EQ(readWholeFile(path), "line\r\n");
  }
}

TEST_F(ConvertDos2UnixTest, WhatCannotBeRemovedIsInTheWay) {
  const std::string path = newScript();
  fs::create_directory(work_file_);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not open [" + work_file_ + "] for writing."));
  EXPECT_EQ(readWholeFile(path), "line\r\n");
}

TEST_F(ConvertDos2UnixTest, DoesNotConvertTheWorkFileItself) {
  const std::string path = directory_.writeFile("home/tmp/.vmqtemp", "line\r\n");
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_EQ(readWholeFile(path), "line\r\n");
}

// ---- failures ------------------------------------------------------------------------------------------------------

TEST_F(ConvertDos2UnixTest, MissingFile) {
  EXPECT_EQ(convertDOS2Unix((depot_ + "none").c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not open [" + depot_ + "none] for reading."));
  EXPECT_FALSE(fs::exists(work_file_));
}

TEST_F(ConvertDos2UnixTest, HomeWithoutADirectoryForTheWorkFile) {
  const std::string path = newScript();
  fs::remove_all(home_ + "/tmp");
  const SystemFault failing(SystemCall::kFclose, EIO);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              ElementsAre("Could not open [" + work_file_ + "] for writing.", "Could not close [" + path + "]."));
  EXPECT_EQ(readWholeFile(path), "line\r\n");
}

TEST_F(ConvertDos2UnixTest, FileThatCannotBeReadStaysAsItWas) {
  fs::create_directory(depot_ + "dir");  // opens, but has no bytes
  EXPECT_EQ(convertDOS2Unix((depot_ + "dir").c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not copy [" + depot_ + "dir] to [" + work_file_ + "]."));
  EXPECT_TRUE(fs::is_directory(depot_ + "dir"));
}

TEST_F(ConvertDos2UnixTest, WorkFileThatCannotBeWrittenLeavesTheFileAsItWas) {
  const std::string text = std::string(100000, 'x') + "\r\n";
  const std::string path = directory_.writeFile("depot/file", text);
  ASSERT_NE(std::signal(SIGXFSZ, SIG_IGN), SIG_ERR);
  rlimit before{};
  ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &before), 0);
  const rlimit small{50000, before.rlim_max};
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
  const int result = convertDOS2Unix(path.c_str());
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &before), 0);
  EXPECT_EQ(result, -1);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Could not copy [" + path + "] to [" + work_file_ + "]."));
  EXPECT_EQ(readWholeFile(path), text);
}

TEST_F(ConvertDos2UnixTest, FailedCloseOfEitherFileLeavesTheFileAsItWas) {
  const std::string path = newScript();
  {
    const SystemFault failing(SystemCall::kFclose, EIO);
    EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
    EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not close [" + path + "]."));
  }
  trace_.clear();
  {
    const SystemFault failing(SystemCall::kFclose, EIO, 2);
    EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
    EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not close [" + work_file_ + "]."));
  }
  EXPECT_EQ(readWholeFile(path), "line\r\n");
}

TEST_F(ConvertDos2UnixTest, FailedPermissionsLeaveTheFileAsItWasAndTheWorkFile) {
  const std::string path = newScript();
  const SystemFault failing(SystemCall::kChmod, EPERM);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Failed to set permissions on file [" + work_file_ + "] to [504]"));
  EXPECT_EQ(readWholeFile(path), "line\r\n");
  EXPECT_EQ(workContents(), "line\n");
}

TEST_F(ConvertDos2UnixTest, FileThatCannotBeRemovedStaysAsItWas) {
  const std::string path = newScript();
  const SystemFault failing(SystemCall::kUnlink, EPERM, /*nth=*/2);  // the first is that of an old work file
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Failed to unlink file [" + path + "]. " + onError(EPERM)));
  EXPECT_EQ(readWholeFile(path), "line\r\n");
}

TEST_F(ConvertDos2UnixTest, AfterAFailedLinkTheContentsAreInTheWorkFileOnly) {
  const std::string path = newScript();
  const SystemFault failing(SystemCall::kLink, EMLINK);
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              ElementsAre("Failed to link file [" + work_file_ + "] to [" + path + "]. " + onError(EMLINK)));
  EXPECT_FALSE(fs::exists(path));
  EXPECT_EQ(workContents(), "line\n");
}

TEST_F(ConvertDos2UnixTest, FileOnAnotherFileSystemCannotBeLinked) {
  if (!canMount()) GTEST_SKIP() << "needs a file system of its own";
  const ScratchFileSystem scratch(directory_ / "scratch", 64);
  const std::string path = directory_.writeFile("scratch/file", "line\r\n");
  EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              ElementsAre("Failed to link file [" + work_file_ + "] to [" + path + "]. " + onError(EXDEV)));
  EXPECT_EQ(workContents(), "line\n");
}

TEST_F(ConvertDos2UnixTest, WorkFileThatCannotBeRemovedIsAFailureOfAConvertedFile) {
  const std::string path = newScript();
  {
    const SystemFault failing(SystemCall::kUnlink, EPERM, /*nth=*/3);
    EXPECT_EQ(convertDOS2Unix(path.c_str()), -1);
  }
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              ElementsAre("Failed to unlink temp file [" + work_file_ + "]. " + onError(EPERM)));
  EXPECT_EQ(readWholeFile(path), "line\n");
  // The work file is now another name of the converted file: the next conversion must not empty it.
  EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
  EXPECT_EQ(readWholeFile(path), "line\n");
}

TEST_F(ConvertDos2UnixTest, OneAtATime) {
  const auto convertMany = [this](const std::string& name, const std::string& line) {
    std::string text;
    for (int count = 0; count < 2000; ++count) text += line + "\r\n";
    for (int round = 0; round < 25; ++round) {
      const std::string path = directory_.writeFile("depot/" + name, text);
      EXPECT_EQ(convertDOS2Unix(path.c_str()), 0);
    }
    std::erase(text, '\r');
    EXPECT_EQ(readWholeFile(depot_ + name), text);
  };
  std::thread one(convertMany, "one", "first");
  std::thread two(convertMany, "two", "second");
  one.join();
  two.join();
  EXPECT_THAT(trace_.texts(RAS1_ERROR), IsEmpty());
}

}  // namespace
