#include "rpc/binary_data_transfer.h"

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
#include "tests/support/failing_allocation.h"
#include "tests/support/open_files.h"
#include "tests/support/process_resources.h"
#include "tests/support/scratch_file_system.h"
#include "tests/support/system_faults.h"
#include "util/util.h"

namespace {

namespace fs = std::filesystem;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

using BinaryDataTransferTest = TransferTest;

// ---- what is stored ------------------------------------------------------------------------------------------------

TEST_F(BinaryDataTransferTest, StoresTheBlocksInOrderUnderTheDepot) {
  EXPECT_EQ(transfer("file.bin", 1, {"one ", std::string("\0\xFF\r\x1A", 4), " two"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file.bin"), std::string("one \0\xFF\r\x1A two", 12));
}

TEST_F(BinaryDataTransferTest, StoresFullBlocks) {
  const std::string full(4096, 'x');
  EXPECT_EQ(transfer("file", 1, {full, full, "end"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), full + full + "end");
}

TEST_F(BinaryDataTransferTest, StoresManyBlocksOfAnyLengths) {
  std::vector<std::string> texts;
  std::string whole;
  for (size_t block = 0; block < 2500; ++block) {
    texts.emplace_back(block % 3 == 0 ? 4096 : block * 7 % 4097, static_cast<char>(block));
    if (block % 1024 < 3) texts.back().clear();
    whole += texts.back();
  }
  EXPECT_EQ(transfer("file", 1, texts), 0u);
  EXPECT_EQ(transfer("file", 2, texts), 0u);
  EXPECT_TRUE(readWholeFile(depot_ + "file") == whole + whole);
}

TEST_F(BinaryDataTransferTest, AppendsLaterChunksInTheOrderOfTheirArrival) {
  EXPECT_EQ(transfer("file", 1, {"a"}), 0u);
  EXPECT_EQ(transfer("file", 7, {"b"}), 0u);
  EXPECT_EQ(transfer("file", 2, {"c"}), 0u);
  EXPECT_EQ(transfer("file", 0, {"d"}), 0u);
  EXPECT_EQ(transfer("file", -1, {"e"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "abcde");
}

TEST_F(BinaryDataTransferTest, ReplacesAnExistingFileWithTheFirstChunk) {
  directory_.writeFile("depot/file", "long old contents");
  fs::create_hard_link(depot_ + "file", directory_ / "other name");
  EXPECT_EQ(transfer("file", 1, {"new"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "new");
  EXPECT_EQ(readWholeFile(directory_ / "other name"), "long old contents") << "it is another file now";
}

TEST_F(BinaryDataTransferTest, MakesAMissingFileWithALaterChunk) {
  EXPECT_EQ(transfer("file", 2, {"second"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "second");
}

TEST_F(BinaryDataTransferTest, LastBlockIndexAloneSaysHowManyBlocksAreWritten) {
  EXPECT_EQ(transfer("file", 1, blocksOf({"a", "b", "c"}), 1), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "ab");
  EXPECT_EQ(transfer("file", 1, blocksOf({"a", "b", "c"}), 0), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "a");
}

TEST_F(BinaryDataTransferTest, NegativeLastBlockIndexWritesNothing) {
  EXPECT_EQ(transfer("file", 1, {}, -1), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "");
  EXPECT_EQ(transfer("file", 2, blocksOf({"a"}), INT32_MIN), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "");
}

TEST_F(BinaryDataTransferTest, EmptyBlocksWriteNothing) {
  EXPECT_EQ(transfer("file", 1, {"", "a", ""}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "a");
  EXPECT_EQ(transfer("empty", 1, {""}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "empty"), "");
}

TEST_F(BinaryDataTransferTest, FilesAreForOwnerAndGroup) {
  const mode_t before = umask(077);
  EXPECT_EQ(transfer("file", 1, {"a"}), 0u);
  umask(before);
  struct stat status;
  ASSERT_EQ(stat((depot_ + "file").c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0770u);
}

TEST_F(BinaryDataTransferTest, TracesItsSteps) {
  EXPECT_EQ(transfer("/dir\\file", 1, {"a"}), 0u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Destination path name is: dir/file"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Failed to unlink file [" + depot_ +
                                          "dir/file]. File must not exist or we dont have perms to unlink it"));
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Opened file " + depot_ + "dir/file for appending using mode wb"));
  EXPECT_EQ(transfer("dir/file", 2, {"b"}), 0u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Opened file " + depot_ + "dir/file for appending using mode a+b"));
  EXPECT_THAT(trace_.texts(RAS1_ERROR), IsEmpty());
}

TEST_F(BinaryDataTransferTest, LeavesNoDescriptor) {
  const ProcessResources before = ProcessResources::now();
  for (int chunk = 1; chunk <= 100; ++chunk) ASSERT_EQ(transfer("x.mdl", chunk, {"a\r\n"}), 0u);
  EXPECT_EQ(ProcessResources::now(), before);
}

// ---- names ---------------------------------------------------------------------------------------------------------

TEST_F(BinaryDataTransferTest, BackslashesSeparateLikeSlashes) {
  EXPECT_EQ(transfer("dir\\sub\\install.sh", 1, {"a\r\nb\r\n"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "dir/sub/install.sh"), "a\nb\n");
}

TEST_F(BinaryDataTransferTest, OneLeadingSlashIsDropped) {
  EXPECT_EQ(transfer("/file", 1, {"a"}), 0u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Opened file " + depot_ + "file for appending using mode wb"));
  EXPECT_EQ(transfer("\\other", 1, {"a"}), 0u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Opened file " + depot_ + "other for appending using mode wb"));
}

TEST_F(BinaryDataTransferTest, OfTwoLeadingSlashesOneStays) {
  EXPECT_EQ(transfer("//file", 1, {"a"}), 0u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Opened file " + depot_ + "/file for appending using mode wb"));
  EXPECT_EQ(readWholeFile(depot_ + "file"), "a");
}

TEST_F(BinaryDataTransferTest, DoubledSlashesInsideStay) {
  EXPECT_EQ(transfer("a//b///c", 1, {"a"}), 0u);
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Opened file " + depot_ + "a//b///c for appending using mode wb"));
  EXPECT_EQ(readWholeFile(depot_ + "a/b/c"), "a");
}

TEST_F(BinaryDataTransferTest, NamesMayHaveAnyOtherByte) {
  const std::string name = "caf\xC3\xA9 \xFF'\"$(x)\n.txt";
  EXPECT_EQ(transfer(name, 1, {"a"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + name), "a");
}

TEST_F(BinaryDataTransferTest, NameOf255BytesNeedsNoEnd) {
  const std::string name = std::string(127, 'd') + "/" + std::string(127, 'f');
  ASSERT_EQ(name.size(), 255u);
  EXPECT_EQ(transfer(name, 1, {"a"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + name), "a");
}

TEST_F(BinaryDataTransferTest, ParentComponentIsRefusedBeforeAnyDirectoryIsMade) {
  for (const char* const name :
       {"..", "../x", "a/../x", "a/..", "new/../../x", "\\..\\x", "//../x", "a\\..", "new/.."}) {
    SCOPED_TRACE(name);
    EXPECT_EQ(transfer(name, 1, {"a"}), 4u);
  }
  EXPECT_TRUE(fs::is_empty(depot_));
  EXPECT_FALSE(fs::exists(directory_ / "x"));
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "File name [a/../x] is refused: \"..\" leads out of its directory"));
}

TEST_F(BinaryDataTransferTest, DotsThatAreNoParentComponentAreFine) {
  for (const char* const name : {"...", "..a", "a..", "a..b/c", ".hidden", "./x", "..b/x"}) {
    SCOPED_TRACE(name);
    EXPECT_EQ(transfer(name, 1, {"a"}), 0u);
    EXPECT_EQ(readWholeFile(depot_ + name), "a");
  }
}

TEST_F(BinaryDataTransferTest, NameOfADirectoryCannotBeOpened) {
  fs::create_directory(depot_ + "dir");
  for (const char* const name : {"", "/", "dir", "dir/", "."}) {
    SCOPED_TRACE(name);
    EXPECT_EQ(transfer(name, 1, {"a"}), 4u);
  }
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to open file " + depot_ + "dir using mode \"wb\", check permissions"));
}

// Who waits for the other end of a pipe would hold up every conversion.
TEST_F(BinaryDataTransferTest, WhatIsNoFileCannotBeOpened) {
  ASSERT_EQ(mkfifo((depot_ + "pipe.mdl").c_str(), 0600), 0);
  EXPECT_EQ(transfer("pipe.mdl", 2, {"a"}), 4u);
  fs::create_symlink("/dev/null", depot_ + "null");
  EXPECT_EQ(transfer("null", 2, {"a"}), 4u);
  EXPECT_THAT(trace_.texts(RAS1_ERROR),
              ElementsAre("Failed to open file " + depot_ + "pipe.mdl using mode \"a+b\", check permissions",
                          "Failed to open file " + depot_ + "null using mode \"a+b\", check permissions"));
}

// ---- where it goes -------------------------------------------------------------------------------------------------

TEST_F(BinaryDataTransferTest, MakesTheDirectoriesThatTheNameCallsFor) {
  const mode_t before = umask(0);
  EXPECT_EQ(transfer("a/b/c/file", 1, {"a"}), 0u);
  umask(before);
  struct stat status;
  ASSERT_EQ(stat((depot_ + "a/b").c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0770u);
}

TEST_F(BinaryDataTransferTest, WithoutADepotHasAStatusOfItsOwn) {
  home_variable_.put(std::nullopt);
  depot_variable_.put(std::nullopt);
  VMQ::Util::TEST_forgetDirectories();
  EXPECT_EQ(transfer("file", 1, {"a"}), 1u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "No useable Agent Depot dir"));
}

TEST_F(BinaryDataTransferTest, WithoutADepotOfItsOwnStoresInTheHome) {
  depot_variable_.put(std::nullopt);
  VMQ::Util::TEST_forgetDirectories();
  EXPECT_EQ(transfer("file", 1, {"a"}), 0u);
  EXPECT_EQ(readWholeFile(home_ + "/file"), "a");
}

TEST_F(BinaryDataTransferTest, FileInTheWayOfADirectory) {
  directory_.writeFile("depot/parent", "a file");
  EXPECT_EQ(transfer("parent/file", 1, {"a"}), 4u) << "the parent exists, but is none";
  EXPECT_TRUE(
      trace_.has(RAS1_ERROR, "Failed to open file " + depot_ + "parent/file using mode \"wb\", check permissions"));
  EXPECT_EQ(transfer("parent/sub/file", 2, {"a"}), 6u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Could not create destination directory " + depot_ + "parent/sub"));
  EXPECT_EQ(readWholeFile(depot_ + "parent"), "a file");
}

/// A depot whose paths for names of `nameLength` have `pathLength` characters.
std::string deepDepot(const std::string& start, size_t pathLength, size_t nameLength) {
  std::string path = start;
  const size_t length = pathLength - nameLength;  // with the "/" at its end
  while (path.size() + 201 < length) path += std::string(199, 'd') + "/";
  path += std::string(length - path.size() - 1, 'e') + "/";
  return path;
}

TEST_F(BinaryDataTransferTest, PathOf1024CharactersIsAccepted) {
  moveDepot(deepDepot(depot_, 1024, 40));
  const std::string name(40, 'f');
  ASSERT_EQ((depot_ + name).size(), 1024u);
  EXPECT_EQ(transfer(name, 1, {"a"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + name), "a");
}

TEST_F(BinaryDataTransferTest, PathOf1025CharactersIsTooLongOnceItsDirectoryIsMade) {
  moveDepot(deepDepot(depot_, 1025, 40));
  const std::string name = "new/" + std::string(36, 'f');
  ASSERT_EQ((depot_ + name).size(), 1025u);
  EXPECT_EQ(transfer(name, 1, {"a"}), 3u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Destination path name too long, max is 1023 characters"));
  EXPECT_TRUE(fs::is_directory(depot_ + "new"));
  EXPECT_FALSE(fs::exists(depot_ + name));
}

TEST_F(BinaryDataTransferTest, ReadOnlyFileSystem) {
  if (!canMount()) GTEST_SKIP() << "needs a file system of its own";
  const ScratchFileSystem scratch(directory_ / "scratch", 64);
  scratch.makeReadOnly();
  moveDepot(directory_ / "scratch");
  EXPECT_EQ(transfer("file", 1, {"a"}), 4u);
  EXPECT_EQ(transfer("file", 2, {"a"}), 4u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Failed to open file " + depot_ + "file using mode \"a+b\", check permissions"));
  EXPECT_EQ(transfer("dir/file", 1, {"a"}), 6u);
}

// ---- what can go wrong while it is written -------------------------------------------------------------------------

TEST_F(BinaryDataTransferTest, FullFileSystemIsAFailureThatKeepsWhatWasWritten) {
  if (!canMount()) GTEST_SKIP() << "needs a file system of its own";
  const ScratchFileSystem scratch(directory_ / "scratch", 64);
  moveDepot(directory_ / "scratch");
  const std::vector<std::string> tooMuch(20, std::string(4096, 'x'));
  EXPECT_EQ(transfer("file", 1, tooMuch), 5u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error writing chunk 16, error number was 1"));
  EXPECT_EQ(fs::file_size(depot_ + "file"), 64u * 1024);
}

TEST_F(BinaryDataTransferTest, PartThatTheSystemDidNotTakeIsWrittenAfterIt) {
  for (const int chunk : {1, 2}) {
    const SystemFault writesHalf(SystemCall::kWritevShort, EIO);
    EXPECT_EQ(transfer("file", chunk, {"abcdef", "", "gh", "i"}), 0u);
    EXPECT_TRUE(writesHalf.happened());
  }
  EXPECT_EQ(readWholeFile(depot_ + "file"), "abcdefghiabcdefghi");
}

TEST_F(BinaryDataTransferTest, BlockThatOnlyBeginsToFitIsTheOneThatFails) {
  if (!canMount()) GTEST_SKIP() << "needs a file system of its own";
  const ScratchFileSystem scratch(directory_ / "scratch", 8);
  moveDepot(directory_ / "scratch");
  const std::string a(3000, 'a'), b(3000, 'b'), c(3000, 'c');
  EXPECT_EQ(transfer("file", 1, {a, "", b, "", c, "more"}), 5u);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error writing chunk 4, error number was 1"));
  EXPECT_EQ(readWholeFile(depot_ + "file"), a + b + c.substr(0, 8192 - 6000));
}

TEST_F(BinaryDataTransferTest, FailedWriteLeavesTheFileOpenButNotForPrograms) {
  if (!canMount()) GTEST_SKIP() << "needs a file system of its own";
  const ScratchFileSystem scratch(directory_ / "scratch", 4);
  moveDepot(directory_ / "scratch");
  for (const int chunk : {1, 2}) {
    const std::string name = "file" + std::to_string(chunk);
    EXPECT_EQ(transfer(name, chunk, {std::string(4096, 'x'), "y"}), 5u);
    const std::vector<int> descriptors = descriptorsOf(depot_ + name);
    ASSERT_EQ(descriptors.size(), 1u);
    EXPECT_TRUE(isClosedOnExec(descriptors[0]));
  }
}

TEST_F(BinaryDataTransferTest, BlocksThatCannotBeWrittenTogetherAreWrittenOneByOne) {
  for (const int chunk : {1, 2}) {
    const SystemFault failing(SystemCall::kWritev, EIO);
    EXPECT_EQ(transfer("file", chunk, {"one", "", "two"}), 0u);
    EXPECT_TRUE(failing.happened());
  }
  EXPECT_EQ(readWholeFile(depot_ + "file"), "onetwoonetwo");
  EXPECT_THAT(trace_.texts(RAS1_ERROR), IsEmpty());
}

TEST_F(BinaryDataTransferTest, BlockThatCannotBeWrittenFailsAndLeavesTheFileOpenButNotForPrograms) {
  for (const int chunk : {1, 2}) {
    SCOPED_TRACE(chunk);
    trace_.clear();
    const std::string name = "file" + std::to_string(chunk);
    {
      const SystemFault together(SystemCall::kWritev, ENOSPC);
      const SystemFault alone(SystemCall::kFwrite, ENOSPC);
      EXPECT_EQ(transfer(name, chunk, {"one", "two"}), 5u);
      EXPECT_TRUE(together.happened());
    }
    EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Error writing chunk 0, error number was 1"));
    EXPECT_EQ(readWholeFile(depot_ + name), "");
    const std::vector<int> descriptors = descriptorsOf(depot_ + name);
    ASSERT_EQ(descriptors.size(), 1u);
    EXPECT_TRUE(isClosedOnExec(descriptors[0]));
    EXPECT_EQ(transfer(name, chunk, {"one", "two"}), 0u) << "the next try";
    EXPECT_EQ(readWholeFile(depot_ + name), "onetwo");
  }
}

TEST_F(BinaryDataTransferTest, BlockOfAnImpossibleLengthIsNotWrittenAndTheFileIsClosed) {
  const unsigned before = ProcessResources::now().descriptors;
  for (const int32_t length : {-1, INT32_MIN, 4097, INT32_MAX}) {
    SCOPED_TRACE(length);
    std::vector<DataBlock> blocks = blocksOf({"good", "bad", "good"});
    blocks[1].length = length;
    EXPECT_EQ(transfer("file", 1, blocks, 2), 5u);
    EXPECT_EQ(readWholeFile(depot_ + "file"), "good");
    EXPECT_TRUE(trace_.has(RAS1_ERROR, "Block 1 has an impossible length of " + std::to_string(length) + " bytes"));
  }
  EXPECT_EQ(ProcessResources::now().descriptors, before);
}

TEST_F(BinaryDataTransferTest, FailedCloseIsAFailure) {
  const SystemFault failing(SystemCall::kFclose, EIO);
  EXPECT_EQ(transfer("x.mdl", 1, {"a"}), 5u);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not close [" + depot_ + "x.mdl]."));
}

TEST_F(BinaryDataTransferTest, FailedPermissionsAreOnlyTraced) {
  const SystemFault failing(SystemCall::kChmod, EPERM);
  EXPECT_EQ(transfer("file", 1, {"a"}), 0u);
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Failed to set permissions on file [" + depot_ + "file] to [504]"));
}

TEST_F(BinaryDataTransferTest, FileThatCannotBeRemovedIsEmptied) {
  directory_.writeFile("depot/file", "old contents");
  const SystemFault failing(SystemCall::kUnlink, EPERM);
  EXPECT_EQ(transfer("file", 1, {"new"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "new");
  EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Failed to unlink file [" + depot_ +
                                          "file]. File must not exist or we dont have perms to unlink it"));
}

TEST_F(BinaryDataTransferTest, ExceptionIsAStatus) {
  moveDepot(deepDepot(depot_, 1010, 10));
  ASSERT_EQ(transfer("0123456789", 1, {"a"}), 0u);
  const std::vector<DataBlock> blocks = blocksOf({"a"});
  trace_.clear();  // keeps its room, so that the first memory of this size is that of a path
  const FailingAllocation failing(2000);
  EXPECT_EQ(transfer("0123456789", 1, blocks, 0), 4u);
  EXPECT_TRUE(failing.happened());
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Exception while storing a chunk: std::bad_alloc"));
}

// ---- conversion ----------------------------------------------------------------------------------------------------

TEST_F(BinaryDataTransferTest, ConvertsWhatItIsInterestedIn) {
  for (const char* const name :
       {"install.sh", "myinstall.sh.txt", "DeployLnk.sh", "x.mdl", "a.mdl/b", "install.sh/b"}) {
    SCOPED_TRACE(name);
    if (std::string(name) == "install.sh/b") fs::remove(depot_ + "install.sh");
    EXPECT_EQ(transfer(name, 1, {"1\r\n\x1A"}), 0u);
    EXPECT_EQ(readWholeFile(depot_ + name), "1\n");
    EXPECT_TRUE(trace_.has(RAS1_DETAIL, "Its a file we're interested in: " + depot_ + name));
  }
}

TEST_F(BinaryDataTransferTest, ConvertsEachFileOnce) {
  EXPECT_EQ(transfer("install.sh.mdl", 1, {"a\r"}), 0u);
  EXPECT_EQ(transfer("DeployLnk.sh.mdl", 1, {"a\r"}), 0u);
  const auto details = trace_.texts(RAS1_DETAIL);
  EXPECT_EQ(std::count(details.begin(), details.end(), "tempfile name: [" + work_file_ + "]"), 2);
}

TEST_F(BinaryDataTransferTest, LeavesOtherFilesAsTheyCome) {
  for (const char* const name : {"Install.sh", "install.SH", "DeployLnk", "x.MDL", "mdl"}) {
    SCOPED_TRACE(name);
    EXPECT_EQ(transfer(name, 1, {"1\r\n\x1A"}), 0u);
    EXPECT_EQ(readWholeFile(depot_ + name), "1\r\n\x1A");
  }
}

TEST_F(BinaryDataTransferTest, NameOfTheDepotCountsToo) {
  moveDepot(directory_ / "my.mdl.depot");
  EXPECT_EQ(transfer("file", 1, {"1\r\n"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "file"), "1\n");
}

TEST_F(BinaryDataTransferTest, ConvertsAfterEachChunk) {
  EXPECT_EQ(transfer("install.sh", 1, {"a\r"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "install.sh"), "a");
  EXPECT_EQ(transfer("install.sh", 2, {"\nb\r\n"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "install.sh"), "a\nb\n");
}

TEST_F(BinaryDataTransferTest, FailedConversionIsNotTold) {
  fs::remove_all(home_ + "/tmp");
  EXPECT_EQ(transfer("install.sh", 1, {"a\r\n"}), 0u);
  EXPECT_EQ(readWholeFile(depot_ + "install.sh"), "a\r\n");
  EXPECT_THAT(trace_.texts(RAS1_ERROR), ElementsAre("Could not open [" + work_file_ + "] for writing."));
}

// ---- several at a time ---------------------------------------------------------------------------------------------

/// Pushes a file of its own in many chunks.
void push(const std::string& name, char letter, int chunks) {
  for (int chunk = 1; chunk <= chunks; ++chunk) {
    ASSERT_EQ(transfer(name, chunk, {std::string(100, letter) + "\r\n", std::string(4096, letter)}), 0u);
  }
}

std::string repeated(const std::string& text, int times) {
  std::string all;
  while (times-- > 0) all += text;
  return all;
}

TEST_F(BinaryDataTransferTest, StoresTwoFilesAtATime) {
  std::thread one(push, "new/dir/one", 'a', 200);
  std::thread two(push, "new/dir/two", 'b', 200);
  one.join();
  two.join();
  EXPECT_EQ(readWholeFile(depot_ + "new/dir/one"),
            repeated(std::string(100, 'a') + "\r\n" + std::string(4096, 'a'), 200));
  EXPECT_EQ(readWholeFile(depot_ + "new/dir/two"),
            repeated(std::string(100, 'b') + "\r\n" + std::string(4096, 'b'), 200));
}

TEST_F(BinaryDataTransferTest, ConvertsTwoFilesAtATime) {
  std::thread one(push, "one/install.sh", 'a', 30);
  std::thread two(push, "two/install.sh", 'b', 30);
  one.join();
  two.join();
  EXPECT_EQ(readWholeFile(depot_ + "one/install.sh"),
            repeated(std::string(100, 'a') + "\n" + std::string(4096, 'a'), 30));
  EXPECT_EQ(readWholeFile(depot_ + "two/install.sh"),
            repeated(std::string(100, 'b') + "\n" + std::string(4096, 'b'), 30));
}

}  // namespace
