// Lays out packets.

#include "apps/vmqctl/push/packet.h"

#include <algorithm>
#include <cstring>

namespace vmqctl {
namespace {

// Offsets in the packet. What lies between them is text and a number that nobody reads, and padding: zeroes.
constexpr std::size_t nameAt = 84;
constexpr std::size_t chunkNumberAt = 344;
constexpr std::size_t lastBlockIndexAt = 348;
constexpr std::size_t maximumCountAt = 352;
constexpr std::size_t actualCountAt = 354;
constexpr std::size_t elementsAt = 356;
constexpr std::size_t elementBytes = sizeof(std::int32_t) + Packet::blockBytes;  // a length and the data

static_assert(Packet::smallestBytes == elementsAt + elementBytes);
static_assert(nameAt + Packet::maximumNameBytes < chunkNumberAt);

template <typename Integer>
void put(char* to, Integer value) {
  std::memcpy(to, &value, sizeof value);
}

std::size_t blocksFor(std::size_t packetBytes) {
  return std::min<std::size_t>((packetBytes - elementsAt) / elementBytes, UINT16_MAX);
}

}  // namespace

Packet::Packet(std::size_t maximumBytes)
    : maximumBlocks_(blocksFor(maximumBytes)),
      memory_(std::make_unique_for_overwrite<char[]>(elementsAt + maximumBlocks_ * elementBytes)) {}

void Packet::begin(std::string_view name, std::int32_t chunkNumber, std::size_t count) {
  // A file without bytes is made by one block without bytes.
  const std::size_t blocks = std::max<std::size_t>(1, (count + blockBytes - 1) / blockBytes);
  char* const head = memory_.get();
  std::memset(head, 0, elementsAt);
  name.copy(head + nameAt, maximumNameBytes);
  put(head + chunkNumberAt, chunkNumber);
  put(head + lastBlockIndexAt, static_cast<std::int32_t>(blocks - 1));
  put(head + maximumCountAt, static_cast<std::uint16_t>(blocks));
  put(head + actualCountAt, static_cast<std::uint16_t>(blocks));

  pieces_.clear();
  for (std::size_t block = 0; block < blocks; ++block) {
    char* const element = head + elementsAt + block * elementBytes;
    const std::size_t length = std::min(count - block * blockBytes, blockBytes);
    put(element, static_cast<std::int32_t>(length));
    if (length > 0) pieces_.push_back({element + sizeof(std::int32_t), length});
    // Not what the memory held before.
    std::memset(element + sizeof(std::int32_t) + length, 0, blockBytes - length);
  }
  size_ = elementsAt + blocks * elementBytes;
}

}  // namespace vmqctl
