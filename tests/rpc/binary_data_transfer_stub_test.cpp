#include "rpc/binary_data_transfer_stub.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "rpc/agent_interface.h"
#include "test_seam.h"
#include "tests/rpc/counted_memory.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// ---- packets, byte by byte -----------------------------------------------------------------------------------------

constexpr rpc__drep littleAscii{rpc__little_endian, rpc__ascii};
constexpr rpc__drep bigAscii{rpc__big_endian, rpc__ascii};
constexpr rpc__drep littleEbcdic{rpc__little_endian, rpc__ebcdic};
constexpr rpc__drep bigEbcdic{rpc__big_endian, rpc__ebcdic};

std::string field(const std::string& text, size_t bytes, char filling = '\0') {
  return text + std::string(bytes - text.size(), filling);
}
std::string bytes(std::initializer_list<int> values) {
  std::string result;
  for (const int value : values) result += static_cast<char>(value);
  return result;
}

/// Two blocks of data with every byte value, the second block not full.
std::string everyByte(size_t count) {
  std::string data;
  for (size_t index = 0; index < count; ++index) data += static_cast<char>(index * 7);
  return data;
}

std::string littlePacket() {
  return field("ignored", 84) + field("dir/A[1]~x", 255, '\0') + bytes({0xEE}) +  //
         bytes({0x78, 0x56, 0x34, 0x12}) +                                        // first integer 0x12345678
         bytes({0xFE, 0xFF, 0xFF, 0xFF}) +                                        // chunk number -2
         bytes({0x01, 0x00, 0x00, 0x00}) +                                        // last block index 1
         bytes({0x03, 0x01}) + bytes({0x02, 0x00}) +                              // counts 259 and 2
         bytes({0x00, 0x10, 0x00, 0x00}) + everyByte(4096) +                      // length 4096
         bytes({0x05, 0x02, 0x00, 0x00}) + field(everyByte(0x205), 4096, 'z');    // length 0x205
}

std::string bigPacket() {
  return field("ignored", 84) + field("dir/A[1]~x", 255, '\0') + bytes({0xEE}) +  //
         bytes({0x12, 0x34, 0x56, 0x78}) +                                        //
         bytes({0xFF, 0xFF, 0xFF, 0xFE}) +                                        //
         bytes({0x00, 0x00, 0x00, 0x01}) +                                        //
         bytes({0x01, 0x03}) + bytes({0x00, 0x02}) +                              //
         bytes({0x00, 0x00, 0x10, 0x00}) + everyByte(4096) +                      //
         bytes({0x00, 0x00, 0x02, 0x05}) + field(everyByte(0x205), 4096, 'z');
}

/// "ignored" and "dir/A[1]~x" in EBCDIC.
std::string inEbcdic(std::string packet) {
  packet.replace(0, 7, bytes({0x89, 0x87, 0x95, 0x96, 0x99, 0x85, 0x84}));
  packet.replace(84, 10, bytes({0x84, 0x89, 0x99, 0x61, 0xC1, 0xAD, 0xF1, 0xBD, 0xA1, 0xA7}));
  return packet;
}

// ---- a manager that remembers --------------------------------------------------------------------------------------

struct Received {
  std::string firstText;
  std::string fileName;
  int32_t firstInteger;
  int32_t chunkNumber;
  int32_t lastBlockIndex;
  std::vector<DataBlock> blocks;
};
std::optional<Received> received;
uint32_t replied = 0;
/// What happens in the manager after it has remembered.
void (*afterwards)() = nullptr;

void remember(rpc__binding*, const char* firstText, const char* fileName, int32_t firstInteger, int32_t chunkNumber,
              int32_t lastBlockIndex, const DataBlock* blocks, uint32_t* status) {
  received = Received{std::string(firstText, 84),
                      std::string(fileName, 255),
                      firstInteger,
                      chunkNumber,
                      lastBlockIndex,
                      std::vector<DataBlock>(blocks, blocks + (lastBlockIndex + 1))};
  *status = replied;
  if (afterwards != nullptr) afterwards();
}
constexpr QOR_Agent_v1_mgr_epv rememberingManager{remember};

/// The outcome of one call of the stub.
struct Outcome {
  uint32_t fault = 0;
  std::string reply;
  bool inOfferedPacket = false;
};

class StubTest : public testing::Test {
 protected:
  StubTest() {
    received.reset();
    replied = 0;
    afterwards = nullptr;
  }

  /// In memory that ends with the packet, so that a sanitizer sees who reads on; not at an aligned address, since that
  /// is where a packet may be in a host's buffer.
  Outcome call(const std::string& packet, const rpc__drep& sender, uint32_t offeredBytes = 64) {
    const auto exact = std::make_unique<unsigned char[]>(packet.size() + 1);
    std::copy(packet.begin(), packet.end(), exact.get() + 1);
    rpc__packet request{exact.get() + 1, static_cast<uint32_t>(packet.size())};
    std::vector<unsigned char> room(offeredBytes, 0xAA);
    rpc__packet offered{room.data(), offeredBytes};
    Outcome outcome;
    try {
      const PFM1_Frame outermost;
      const rpc__reply reply = BinaryDataTransfer_ssr({nullptr, &request, sender, &offered, &rememberingManager});
      outcome.reply.assign(reinterpret_cast<const char*>(reply.packet->body), reply.bytes);
      outcome.inOfferedPacket = reply.packet == &offered;
      if (!outcome.inOfferedPacket) rpc__free_pkt(reply.packet);
    } catch (const PFM1_Fault& fault) {
      outcome.fault = fault.status;
    }
    EXPECT_EQ(PFM1_Thread().innermost, nullptr);
    return outcome;
  }

  CountedMemory memory_;
  TEST_TraceCapture trace_;
};

constexpr uint32_t invalidBound = 0x1c000007;

void expectTheTwoBlocks() {
  ASSERT_TRUE(received);
  EXPECT_EQ(received->firstText, field("ignored", 84));
  EXPECT_EQ(received->fileName, field("dir/A[1]~x", 255));
  EXPECT_EQ(received->firstInteger, 0x12345678);
  EXPECT_EQ(received->chunkNumber, -2);
  EXPECT_EQ(received->lastBlockIndex, 1);
  ASSERT_EQ(received->blocks.size(), 2u);
  EXPECT_EQ(received->blocks[0].length, 4096);
  EXPECT_EQ(std::string(reinterpret_cast<char*>(received->blocks[0].data), 4096), everyByte(4096));
  EXPECT_EQ(received->blocks[1].length, 0x205);
  EXPECT_EQ(std::string(reinterpret_cast<char*>(received->blocks[1].data), 4096), field(everyByte(0x205), 4096, 'z'));
}

// ---- what is in a packet -------------------------------------------------------------------------------------------

TEST_F(StubTest, ReadsLittleEndianPackets) {
  ASSERT_EQ(littlePacket().size(), 356u + 2 * 4100);
  EXPECT_EQ(call(littlePacket(), littleAscii).fault, 0u);
  expectTheTwoBlocks();
}

TEST_F(StubTest, ReadsBigEndianPackets) {
  EXPECT_EQ(call(bigPacket(), bigAscii).fault, 0u);
  expectTheTwoBlocks();
}

TEST_F(StubTest, TranslatesTextButNoData) {
  EXPECT_EQ(call(inEbcdic(littlePacket()), littleEbcdic).fault, 0u);
  expectTheTwoBlocks();
  received.reset();
  EXPECT_EQ(call(inEbcdic(bigPacket()), bigEbcdic).fault, 0u);
  expectTheTwoBlocks();
}

TEST_F(StubTest, NameNeedsNoEnd) {
  std::string packet = littlePacket();
  packet.replace(84, 255, std::string(255, 'n'));
  EXPECT_EQ(call(packet, littleAscii).fault, 0u);
  EXPECT_EQ(received->fileName, std::string(255, 'n'));
}

TEST_F(StubTest, TakesMemoryForTheMaximumCountAndGivesItBack) {
  EXPECT_EQ(call(littlePacket(), littleAscii).fault, 0u);
  EXPECT_THAT(memory_.taken(), ElementsAre(259u * 4100));
  EXPECT_EQ(memory_.held(), 0);
}

/// A packet with these counts and `blocks` whole blocks, little-endian.
std::string packetWith(int last, int maximum, int actual, int blocks) {
  std::string packet = littlePacket().substr(0, 348);
  for (int shift = 0; shift < 32; shift += 8) packet += static_cast<char>(last >> shift & 0xFF);
  for (const int count : {maximum, actual}) packet += bytes({count & 0xFF, count >> 8});
  return packet + std::string(static_cast<size_t>(blocks) * 4100, '\0');
}

TEST_F(StubTest, NoBlocksAtAll) {
  EXPECT_EQ(call(packetWith(-1, 0, 0, 0), littleAscii).fault, 0u);
  ASSERT_TRUE(received);
  EXPECT_EQ(received->lastBlockIndex, -1);
  EXPECT_EQ(call(packetWith(-1, 5, 1, 1), littleAscii).fault, 0u) << "more blocks than are written";
  EXPECT_EQ(memory_.held(), 0);
}

TEST_F(StubTest, WhatStandsBehindTheBlocksIsIgnored) {
  EXPECT_EQ(call(littlePacket() + "more", littleAscii).fault, 0u);
  expectTheTwoBlocks();
}

// ---- the reply -----------------------------------------------------------------------------------------------------

TEST_F(StubTest, RepliesWithTheStatusInTheOfferedPacket) {
  replied = 0x01020304;
  for (const rpc__drep& sender : {littleAscii, bigEbcdic}) {
    const std::string packet = sender == littleAscii ? littlePacket() : bigPacket();
    const Outcome outcome = call(packet, sender, /*offeredBytes=*/4);
    EXPECT_TRUE(outcome.inOfferedPacket);
    uint32_t status;
    ASSERT_EQ(outcome.reply.size(), sizeof status);
    memcpy(&status, outcome.reply.data(), sizeof status);
    EXPECT_EQ(status, 0x01020304u) << "in this machine's representation";
  }
}

TEST_F(StubTest, RepliesInANewPacketWhenTheOfferedOneIsTooSmall) {
  replied = 6;
  for (const uint32_t room : {0u, 3u}) {
    const Outcome outcome = call(littlePacket(), littleAscii, room);
    EXPECT_FALSE(outcome.inOfferedPacket);
    EXPECT_EQ(outcome.reply, std::string("\6\0\0\0", 4)) << "of this little-endian machine";
  }
}

// ---- faults --------------------------------------------------------------------------------------------------------

TEST_F(StubTest, PacketThatEndsTooEarlyIsAFaultWhereverItEnds) {
  const std::string little = littlePacket();
  const std::string big = bigPacket();
  for (size_t size = 0; size < little.size(); ++size) {
    ASSERT_EQ(call(little.substr(0, size), littleAscii).fault, invalidBound) << size;
    ASSERT_EQ(call(big.substr(0, size), bigAscii).fault, invalidBound) << size;
  }
  EXPECT_FALSE(received);
  EXPECT_THAT(memory_.taken(), IsEmpty());
}

TEST_F(StubTest, CountsThatLieAreAFaultBeforeAnyMemoryIsTaken) {
  struct Case {
    const char* what;
    int last, maximum, actual, blocks;
  };
  const Case cases[] = {
      {"more actual than maximum", 0, 1, 2, 2},          {"more actual than maximum, which is none", 0, 0, 1, 1},
      {"last block behind the actual ones", 2, 5, 2, 5}, {"last block behind none", 0, 5, 0, 5},
      {"last block far behind", INT32_MAX, 2, 2, 2},     {"fewer blocks than are told", 0, 65535, 65535, 1},
      {"one block less than is told", 1, 2, 2, 1},
  };
  for (const Case& each : cases) {
    SCOPED_TRACE(each.what);
    EXPECT_EQ(call(packetWith(each.last, each.maximum, each.actual, each.blocks), littleAscii).fault, invalidBound);
  }
  EXPECT_FALSE(received);
  EXPECT_THAT(memory_.taken(), IsEmpty());
  EXPECT_TRUE(trace_.has(
      RAS1_ERROR, "A packet is refused: maximum count 1, actual count 2, last block index 0, 8200 bytes of blocks"));
}

TEST_F(StubTest, WithoutMarshallingDataThePacketIsNotRead) {
  const TEST_FailCall failing("BSS1_InitializeOnce", 1, EAGAIN);
  EXPECT_EQ(call(littlePacket(), littleAscii).fault, uint32_t{rpc__fault_unspecified});
  EXPECT_FALSE(received);
  EXPECT_THAT(memory_.taken(), IsEmpty());
}

TEST_F(StubTest, WithoutMemoryForTheBlocks) {
  const TEST_FailCall failing("rpc__malloc", 1, 0);
  EXPECT_EQ(call(littlePacket(), littleAscii).fault, uint32_t{rpc__fault_no_memory});
  EXPECT_FALSE(received);
}

TEST_F(StubTest, WithoutMemoryForTheReply) {
  const TEST_FailCall failing("rpc__alloc_pkt", 1, 0);
  EXPECT_EQ(call(littlePacket(), littleAscii, /*offeredBytes=*/0).fault, uint32_t{rpc__fault_no_memory});
  EXPECT_TRUE(received);
  EXPECT_EQ(memory_.held(), 0);
}

TEST_F(StubTest, FaultOfTheManagerGivesTheBlocksBackAndIsPassedOn) {
  afterwards = [] { PFM1__Raise(0x1c00beef); };
  EXPECT_EQ(call(littlePacket(), littleAscii).fault, 0x1c00beefu);
  EXPECT_EQ(memory_.taken().size(), 1u);
  EXPECT_EQ(memory_.held(), 0);
}

TEST_F(StubTest, ExceptionOfTheManagerGivesTheBlocksBack) {
  afterwards = [] { throw std::runtime_error("unexpected"); };
  EXPECT_THROW((void)call(littlePacket(), littleAscii), std::runtime_error);
  EXPECT_EQ(memory_.held(), 0);
  EXPECT_EQ(PFM1_Thread().innermost, nullptr);
}

}  // namespace
