#include "fuzz/transfer_model.h"

#include <cstring>

#include "fuzz/support.h"

namespace fuzz {
namespace {

constexpr size_t textBytes = 84;
constexpr size_t nameBytes = 255;
constexpr size_t integersAt = 340;
constexpr size_t countsAt = 352;
constexpr size_t blocksAt = 356;
constexpr size_t blockBytes = 4100;

/// REQUIRES: the packet is as long as that.
uint32_t numberAt(size_t position, size_t bytes) {
  uint32_t value = 0;
  for (size_t index = 0; index < bytes; ++index) {
    const size_t at = transfer.sender.integers == rpc__big_endian ? index : bytes - 1 - index;
    value = value << 8 | static_cast<unsigned char>(transfer.packet[position + at]);
  }
  return value;
}

void requireText(const char* text, size_t position, size_t bytes) {
  for (size_t index = 0; index < bytes; ++index) {
    const char sent = transfer.packet[position + index];
    const char local = transfer.sender.characters == rpc__ascii
                           ? sent
                           : static_cast<char>(rpc__marshalling.ascii_from_ebcdic[static_cast<unsigned char>(sent)]);
    require(text[index] == local, "the text is that of the packet");
  }
}

void check(rpc__binding*, const char* firstText, const char* fileName, int32_t firstInteger, int32_t chunkNumber,
           int32_t lastBlockIndex, const DataBlock* blocks, uint32_t* status) {
  transfer.called = true;
  require(expectsCall(), "the manager is called only for packets that hold what they say");
  requireText(firstText, 0, textBytes);
  requireText(fileName, textBytes, nameBytes);
  require(static_cast<uint32_t>(firstInteger) == numberAt(integersAt, 4), "the first integer is that of the packet");
  require(static_cast<uint32_t>(chunkNumber) == numberAt(integersAt + 4, 4), "so is the chunk number");
  require(static_cast<uint32_t>(lastBlockIndex) == numberAt(integersAt + 8, 4), "and the last block index");
  for (int32_t index = 0; index <= lastBlockIndex; ++index) {
    const size_t position = blocksAt + static_cast<size_t>(index) * blockBytes;
    require(static_cast<uint32_t>(blocks[index].length) == numberAt(position, 4), "so is the length of a block");
    require(std::memcmp(blocks[index].data, transfer.packet.data() + position + 4, sizeof blocks[index].data) == 0,
            "the bytes of a block are untouched");
  }
  if (transfer.managerFault != 0) PFM1__Raise(transfer.managerFault);
  *status = transfer.status;
}

bool holdsWhatItSays() {
  if (transfer.packet.size() < blocksAt) return false;
  const auto last = static_cast<int32_t>(numberAt(integersAt + 8, 4));
  const auto maximum = numberAt(countsAt, 2);
  const auto actual = static_cast<int32_t>(numberAt(countsAt + 2, 2));
  return static_cast<uint32_t>(actual) <= maximum && last < actual &&
         blocksAt + static_cast<size_t>(actual) * blockBytes <= transfer.packet.size();
}

bool fitsMemory() {
  return numberAt(countsAt, 2) * blockBytes <= memoryForCalls;
}

}  // namespace

TransferModel transfer;
const QOR_Agent_v1_mgr_epv checkingManager{check};

bool expectsCall() {
  return holdsWhatItSays() && fitsMemory();
}

uint32_t expectedFault() {
  if (!holdsWhatItSays()) return rpc__fault_invalid_bound;
  return fitsMemory() ? transfer.managerFault : uint32_t{rpc__fault_no_memory};
}

}  // namespace fuzz
