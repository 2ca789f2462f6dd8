// What goes out for a file, and what is expected to arrive: packets, plans, digests, the line that shows how far it is.

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/push/arrival_digest.h"
#include "apps/vmqctl/push/packet.h"
#include "apps/vmqctl/push/push_plan.h"
#include "apps/vmqctl/push/source_file.h"
#include "apps/vmqctl/push/transfer_line.h"
#include "tests/support/temporary_directory.h"

namespace {

using namespace vmqctl;
using testing::ElementsAre;
using testing::HasSubstr;

// ---- packets ----

std::string zeroes(std::size_t count) {
  return std::string(count, '\0');
}

/// Packets are in the byte order of the machine that the tests run on.
template <typename Integer>
std::string raw(Integer value) {
  return {reinterpret_cast<const char*>(&value), sizeof value};
}

std::string filled(Packet& packet, const std::string& name, std::int32_t chunk, const std::string& data) {
  packet.begin(name, chunk, data.size());
  std::string_view rest = data;
  for (const iovec& piece : packet.pieces()) {
    rest.copy(static_cast<char*>(piece.iov_base), piece.iov_len);
    rest.remove_prefix(piece.iov_len);
  }
  EXPECT_TRUE(rest.empty());
  return std::string(packet.bytes());
}

TEST(PushPacket, OfOneShortBlockIsLaidOutByteByByte) {
  Packet packet(Packet::smallestBytes);
  const std::string expected = zeroes(84) +                    // a text that nobody reads
                               "ux/a.txt" + zeroes(255 - 8) +  // the name
                               zeroes(1) + zeroes(4) +         // alignment, a number that nobody reads
                               raw(std::int32_t{7}) +          // chunk number
                               raw(std::int32_t{0}) +          // last block index
                               raw(std::uint16_t{1}) +         // maximum count
                               raw(std::uint16_t{1}) +         // actual count
                               raw(std::int32_t{3}) + "abc" + zeroes(4093);
  EXPECT_EQ(filled(packet, "ux/a.txt", 7, "abc"), expected);
}

TEST(PushPacket, OfAnEmptyFileHasOneBlockWithoutBytes) {
  Packet packet(Packet::smallestBytes);
  const std::string bytes = filled(packet, "e", 1, "");
  ASSERT_EQ(bytes.size(), 356U + 4100U);
  EXPECT_EQ(bytes.substr(344), raw(std::int32_t{1}) + raw(std::int32_t{0}) + raw(std::uint16_t{1}) +
                                   raw(std::uint16_t{1}) + raw(std::int32_t{0}) + zeroes(4096));
}

TEST(PushPacket, HasAFullLastBlockAtAnExactMultiple) {
  Packet packet(356 + 3 * 4100);
  const std::string data = std::string(4096, 'a') + std::string(4096, 'b');
  EXPECT_EQ(filled(packet, "x", 1, data).substr(348),
            raw(std::int32_t{1}) + raw(std::uint16_t{2}) + raw(std::uint16_t{2}) + raw(std::int32_t{4096}) +
                std::string(4096, 'a') + raw(std::int32_t{4096}) + std::string(4096, 'b'));
}

TEST(PushPacket, BeginsABlockForOneByteMore) {
  Packet packet(356 + 2 * 4100);
  const std::string bytes = filled(packet, "x", 1, std::string(4097, 'a'));
  ASSERT_EQ(bytes.size(), 356U + 2 * 4100U);
  EXPECT_EQ(bytes.substr(356 + 4100), raw(std::int32_t{1}) + "a" + zeroes(4095));
}

TEST(PushPacket, LeavesNothingOfTheOneBefore) {
  Packet packet(356 + 2 * 4100);
  (void)filled(packet, std::string(255, 'n'), 1, std::string(2 * 4096, 'a'));
  Packet fresh(356 + 2 * 4100);
  EXPECT_EQ(filled(packet, "x", 2, "b"), filled(fresh, "x", 2, "b"));
}

TEST(PushPacket, TakesANameThatFillsItsField) {
  Packet packet(Packet::smallestBytes);
  EXPECT_EQ(filled(packet, std::string(255, 'n'), 1, "").substr(84, 256), std::string(255, 'n') + zeroes(1));
}

TEST(PushPacket, HoldsAsManyWholeBlocksAsFit) {
  EXPECT_EQ(Packet(356 + 4100).chunkBytes(), 4096U);
  EXPECT_EQ(Packet(356 + 2 * 4100 - 1).chunkBytes(), 4096U);
  EXPECT_EQ(Packet(356 + 2 * 4100).chunkBytes(), 2 * 4096U);
  EXPECT_EQ(Packet(4194304).chunkBytes(), 1022 * 4096U);
  EXPECT_EQ(Packet(std::size_t{1} << 30).chunkBytes(), 65535 * 4096U);  // what a count of 16 bits can say
}

// ---- plans ----

class PushPlanTest : public testing::Test {
 protected:
  std::vector<std::string> names() const {
    std::vector<std::string> result;
    for (const PlannedFile& file : plan_.files()) result.push_back(file.name);
    return result;
  }
  /// What a refusal says; "" when there is none.
  static std::string refusal(const std::function<void()>& routine) {
    try {
      routine();
    } catch (const Failure& failure) {
      EXPECT_EQ(failure.code(), ExitCode::Usage);
      return failure.what();
    }
    return "";
  }
  std::string refusalOf(const std::string& name, const std::string& folder = "") {
    return refusal([&] { plan_.add(directory_ / name, folder); });
  }

  TemporaryDirectory directory_;
  PushPlan plan_;
};

TEST_F(PushPlanTest, FolderGoesUnderItsOwnNameInTheOrderOfBytes) {
  directory_.writeFile("ux/b/2", "22");
  directory_.writeFile("ux/b/10", "1");
  directory_.writeFile("ux/Z", "");
  directory_.writeFile("ux/a", "aaa");
  directory_.writeFile("ux/b.txt", "");
  plan_.add(directory_ / "ux", "");
  EXPECT_THAT(names(), ElementsAre("ux/Z", "ux/a", "ux/b/10", "ux/b/2", "ux/b.txt"));
  EXPECT_EQ(plan_.files()[3].source, directory_ / "ux/b/2");
  EXPECT_EQ(plan_.files()[3].bytes, 2U);
  EXPECT_EQ(plan_.bytes(), 6U);
}

TEST_F(PushPlanTest, ArgumentsKeepTheirOrderAndGoIntoTheFolder) {
  const std::string b = directory_.writeFile("b", "");
  const std::string a = directory_.writeFile("a", "");
  plan_.add(b, "models");
  plan_.add(a, "models");
  EXPECT_THAT(names(), ElementsAre("models/b", "models/a"));
}

TEST_F(PushPlanTest, FolderHasItsNameHoweverItIsWritten) {
  directory_.writeFile("ux/a", "");
  for (const char* written : {"ux/", "ux/.", "ux//", "./ux", "ux/../ux"}) plan_.add(directory_ / written, "");
  EXPECT_THAT(names(), testing::Each("ux/a"));
  EXPECT_EQ(plan_.files().size(), 5U);
}

TEST_F(PushPlanTest, ContentsGoWithoutTheNameOfTheirFolder) {
  directory_.writeFile("bundle/lib/x", "");
  plan_.addContents(directory_ / "bundle", "ux/06.20");
  EXPECT_THAT(names(), ElementsAre("ux/06.20/lib/x"));
}

TEST_F(PushPlanTest, LinkToAFileIsSentAsThatFile) {
  directory_.writeFile("d/real", "12345");
  std::filesystem::create_symlink("real", directory_ / "d/link");
  plan_.add(directory_ / "d", "");
  EXPECT_THAT(names(), ElementsAre("d/link", "d/real"));
  EXPECT_EQ(plan_.files()[0].bytes, 5U);
}

TEST_F(PushPlanTest, LinkToAFolderIsRefusedInAFolderSoNothingLoops) {
  directory_.writeFile("d/real", "");
  std::filesystem::create_directory_symlink(".", directory_ / "d/loop");
  EXPECT_EQ(refusalOf("d"), directory_ / "d/loop" + " is a link to a folder. Nothing was sent.");
}

TEST_F(PushPlanTest, LinkToAFolderThatIsNamedItselfIsFollowed) {
  directory_.writeFile("d/real", "");
  std::filesystem::create_directory_symlink("d", directory_ / "named");
  plan_.add(directory_ / "named", "");
  EXPECT_THAT(names(), ElementsAre("named/real"));
}

TEST_F(PushPlanTest, LinkThatLeadsNowhereIsRefused) {
  std::filesystem::create_directory(directory_ / "d");
  std::filesystem::create_symlink("gone", directory_ / "d/link");
  EXPECT_EQ(refusalOf("d"),
            directory_ / "d/link" + " is a link that leads nowhere: No such file or directory. Nothing was sent.");
}

TEST_F(PushPlanTest, SpecialFilesAreRefused) {
  directory_.writeFile("d/a", "");
  ASSERT_EQ(mkfifo((directory_ / "d/pipe").c_str(), 0600), 0);
  EXPECT_EQ(refusalOf("d"), directory_ / "d/pipe" + " is neither a file nor a folder. Nothing was sent.");
  EXPECT_EQ(refusalOf("d/pipe"), directory_ / "d/pipe" + " is neither a file nor a folder. Nothing was sent.");
}

TEST_F(PushPlanTest, WhatIsNotThereIsRefused) {
  EXPECT_EQ(refusalOf("gone"), "Cannot read " + directory_ / "gone" + ": No such file or directory. Nothing was sent.");
}

TEST_F(PushPlanTest, RootHasNoName) {
  EXPECT_THAT(refusal([&] { plan_.add("/", ""); }), HasSubstr("/ has no name of its own."));
}

TEST_F(PushPlanTest, NameOf255BytesIsTheLongest) {
  directory_.writeFile("a", "");
  const std::string folder(253, 'f');
  plan_.add(directory_ / "a", folder);
  EXPECT_EQ(plan_.files()[0].name.size(), 255U);
  EXPECT_EQ(refusalOf("a", folder + "f"),
            "The name " + folder + "f/a has 256 bytes; at most 255 can be sent. Nothing was sent.");
}

TEST_F(PushPlanTest, BytesOfANameCountNotItsCharacters) {
  std::string folder;
  for (int i = 0; i < 127; ++i) folder += "\xC3\xA4";  // 254 bytes
  directory_.writeFile("a", "");
  EXPECT_THAT(refusalOf("a", folder), HasSubstr("has 256 bytes"));
}

TEST_F(PushPlanTest, BackslashInANameIsRefused) {
  directory_.writeFile("a\\b", "");
  EXPECT_THAT(refusalOf("a\\b"), HasSubstr("holds a backslash"));
}

TEST_F(PushPlanTest, EmptyFoldersAreToldAndNothingAtAllIsRefused) {
  std::filesystem::create_directories(directory_ / "d/empty");
  plan_.add(directory_ / "d", "");
  EXPECT_THAT(plan_.emptyFolders(), ElementsAre(directory_ / "d/empty"));
  EXPECT_EQ(refusal([&] { plan_.check(); }), "There is no file to send. Nothing was sent.");
}

TEST_F(PushPlanTest, TwoFilesOfOneNameAreRefused) {
  const std::string first = directory_.writeFile("1/a", "");
  const std::string second = directory_.writeFile("2/a", "");
  plan_.add(first, "");
  plan_.add(second, "");
  EXPECT_EQ(refusal([&] { plan_.check(); }), first + " and " + second + " would both become a. Nothing was sent.");
}

TEST_F(PushPlanTest, FileWithTheNameOfAFolderIsRefused) {
  const std::string file = directory_.writeFile("1/a/b", "");
  const std::string inFolder = directory_.writeFile("2/a/b/c/d", "");
  plan_.add(directory_ / "2/a", "");
  plan_.add(directory_ / "1/a", "");
  EXPECT_EQ(refusal([&] { plan_.check(); }), file + " would become the file a/b, and " + inFolder +
                                                 " would be in a folder of that name. Nothing was sent.");
}

TEST_F(PushPlanTest, FileWithTheBeginningOfTheNameOfAFolderIsNot) {
  directory_.writeFile("1/a", "");
  directory_.writeFile("1/ab/c", "");
  plan_.addContents(directory_ / "1", "");
  EXPECT_EQ(refusal([&] { plan_.check(); }), "");
}

TEST_F(PushPlanTest, DestinationOf1024CharactersIsTheLongest) {
  directory_.writeFile("a\xC3\xA4", "");  // two characters
  plan_.add(directory_ / "a\xC3\xA4", "");
  const std::string depot = "/" + std::string(1020, 'd') + "/";
  EXPECT_EQ(refusal([&] { plan_.checkFits(depot, 4096); }), "");
  EXPECT_THAT(refusal([&] { plan_.checkFits("/d" + depot, 4096); }), HasSubstr("has 1026 characters; at most 1024"));
}

TEST_F(PushPlanTest, FileWhoseChunksCannotBeNumberedIsRefused) {
  const std::string big = directory_.writeFile("big", "");
  constexpr std::uint64_t most = std::uint64_t{INT32_MAX} * 2;  // so little that every file system has such files
  ASSERT_EQ(truncate(big.c_str(), static_cast<off_t>(most + 1)), 0);
  plan_.add(big, "");
  EXPECT_THAT(refusal([&] { plan_.checkFits("/d/", 2); }), HasSubstr("more than 2147483647 pieces of 2 bytes"));
  EXPECT_EQ(refusal([&] { plan_.checkFits("/d/", 4); }), "");
}

TEST(PushFolder, IsCleaned) {
  EXPECT_EQ(cleanFolder(""), "");
  EXPECT_EQ(cleanFolder("/"), "");
  EXPECT_EQ(cleanFolder("//a/./b//c/"), "a/b/c");
  EXPECT_EQ(cleanFolder("..a/b.."), "..a/b..");
}

TEST(PushFolder, MayNotLeaveTheDepot) {
  for (const char* folder : {"..", "../a", "a/..", "a/../b"}) {
    EXPECT_THROW((void)cleanFolder(folder), Failure) << folder;
  }
}

TEST(PushChunks, AreCountedAtTheirEdges) {
  EXPECT_EQ(chunksOf(0, 4096), 1U);
  EXPECT_EQ(chunksOf(1, 4096), 1U);
  EXPECT_EQ(chunksOf(4096, 4096), 1U);
  EXPECT_EQ(chunksOf(4097, 4096), 2U);
  EXPECT_EQ(chunksOf(UINT64_MAX, 4096), UINT64_MAX / 4096 + 1);
}

// ---- reading ----

class SourceFileTest : public testing::Test {
 protected:
  static std::string failure(const std::function<void()>& routine) {
    try {
      routine();
    } catch (const Failure& told) {
      return told.what();
    }
    return "";
  }
  void read(SourceFile& source, std::size_t count) {
    buffer_.resize(count);
    const iovec pieces[] = {{buffer_.data(), count / 2}, {buffer_.data() + count / 2, count - count / 2}};
    source.read(pieces);
  }

  TemporaryDirectory directory_;
  const std::string path_ = directory_.writeFile("f", "0123456789");
  std::string buffer_;
};

TEST_F(SourceFileTest, IsReadInOrder) {
  SourceFile source(path_);
  EXPECT_EQ(source.bytes(), 10U);
  read(source, 7);
  EXPECT_EQ(buffer_, "0123456");
  read(source, 3);
  EXPECT_EQ(buffer_, "789");
  source.checkUnchanged();
}

TEST_F(SourceFileTest, ShrinkingIsNoticed) {
  SourceFile source(path_);
  std::filesystem::resize_file(path_, 5);
  EXPECT_EQ(failure([&] { read(source, 10); }), path_ + " has shrunk while it was read.");
}

TEST_F(SourceFileTest, GrowingIsNoticed) {
  SourceFile source(path_);
  read(source, 10);
  std::ofstream(path_, std::ios::app) << "more";
  EXPECT_EQ(failure([&] { source.checkUnchanged(); }), path_ + " has changed while it was read.");
}

TEST_F(SourceFileTest, WritingInPlaceIsNoticed) {
  std::filesystem::last_write_time(path_, std::filesystem::file_time_type::clock::now() - std::chrono::hours(1));
  SourceFile source(path_);
  read(source, 10);
  std::ofstream(path_, std::ios::in) << "X";
  EXPECT_EQ(failure([&] { source.checkUnchanged(); }), path_ + " has changed while it was read.");
}

TEST_F(SourceFileTest, OnlyRegularFilesAreOpenedAndPipesDoNotBlock) {
  const std::string pipe = directory_ / "pipe";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  EXPECT_EQ(failure([&] { SourceFile source(pipe); }), pipe + " is no regular file any more.");
  EXPECT_EQ(failure([&] { SourceFile source(directory_ / "gone"); }),
            "Cannot open " + directory_ / "gone" + ": No such file or directory.");
}

// ---- what arrives ----

std::string sha256Of(const std::vector<std::string>& pieces, bool converted, std::uint64_t bytes) {
  ArrivalDigest digest(converted);
  for (const std::string& piece : pieces) digest.add(piece);
  EXPECT_EQ(digest.bytes(), bytes);
  return digest.sha256();
}

TEST(ArrivalDigest, IsTheSha256OfWhatIsSent) {
  EXPECT_EQ(sha256Of({}, false, 0), "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855");
  EXPECT_EQ(sha256Of({"a", "bc"}, false, 3), "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad");
}

TEST(ArrivalDigest, LeavesOutWhatTheConversionDrops) {
  const std::string expected = sha256Of({"line\nnext"}, false, 9);
  EXPECT_EQ(sha256Of({"\rli\rne\r", "\n\x1anext\x1a"}, true, 9), expected);
  EXPECT_EQ(sha256Of({"line\nnext"}, true, 9), expected);
  EXPECT_NE(sha256Of({"line\r\nnext"}, false, 10), expected);
}

TEST(ArrivalDigest, ConvertedAreScriptsOfInstallersAndModels) {
  for (const char* path : {"/d/install.sh", "/d/my_install.sh.bak", "/d/DeployLnk.sh", "/d/x.mdl", "/d.mdl/x"}) {
    EXPECT_TRUE(isConverted(path)) << path;
  }
  for (const char* path : {"/d/Install.sh", "/d/install.SH", "/d/deploylnk.sh", "/d/mdl", "/d/x.MDL"}) {
    EXPECT_FALSE(isConverted(path)) << path;
  }
}

// ---- the line ----

TEST(TransferLine, TellsHowFarHowFastAndHowLong) {
  TransferState state;
  state.bytesDone = 512 * 1024 * 1024;
  state.bytesTotal = 1024 * 1024 * 1024;
  state.fileNumber = 3;
  state.files = 12;
  state.name = "ux/a.bin";
  state.lasted = std::chrono::seconds(4);
  EXPECT_EQ(transferLine(state),
            " 50 % [##########----------] 512 MiB of 1.0 GiB, 128 MiB/s, 0:04 left, file 3 of 12: ux/a.bin");
}

TEST(TransferLine, HasNoRateAtTheBeginning) {
  TransferState state;
  state.bytesTotal = 10;
  state.name = "a";
  state.lasted = std::chrono::seconds(4);
  EXPECT_EQ(transferLine(state), "  0 % [--------------------] 0 bytes of 10 bytes, file 1 of 1: a");
}

TEST(TransferLine, CountsFilesWhenTheyAreAllEmptyAndNeverExceedsTheWhole) {
  TransferState state;
  state.fileNumber = 2;
  state.files = 4;
  EXPECT_THAT(transferLine(state), testing::StartsWith(" 25 % [#####---------------] 0 bytes of 0 bytes,"));
  state.bytesDone = 20;
  state.bytesTotal = 10;  // a file has grown since it was counted
  EXPECT_THAT(transferLine(state), testing::StartsWith("100 % [####################] "));
}

TEST(TransferLine, SaysWhenAFileIsOnlyCompared) {
  TransferState state;
  state.bytesDone = 10;
  state.bytesTotal = 10;
  state.fileNumber = 3;
  state.files = 12;
  state.name = "ux/a.bin";
  state.verifying = true;
  EXPECT_EQ(transferLine(state), "verifying ux/a.bin, file 3 of 12");
}

TEST(TransferLine, LongTimesHaveHours) {
  TransferState state;
  state.bytesDone = 1;
  state.bytesTotal = 3723 + 1;
  state.lasted = std::chrono::seconds(1);
  EXPECT_THAT(transferLine(state), HasSubstr(", 1 byte/s, 1:02:03 left,"));
}

TEST(TransferLine, BytesAreShort) {
  EXPECT_EQ(inBytes(0), "0 bytes");
  EXPECT_EQ(inBytes(1), "1 byte");
  EXPECT_EQ(inBytes(1023), "1023 bytes");
  EXPECT_EQ(inBytes(1024), "1.0 KiB");
  EXPECT_EQ(inBytes(10 * 1024), "10 KiB");
  EXPECT_EQ(inBytes(1023 * 1024), "1023 KiB");
  EXPECT_EQ(inBytes(1024 * 1024 - 1), "1.0 MiB");
  EXPECT_EQ(inBytes(UINT64_MAX), "16 EiB");
}

}  // namespace
