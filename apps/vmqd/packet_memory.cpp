// How much memory the packets of all clients take.

#include "apps/vmqd/packet_memory.h"

namespace vmqd {
namespace {

constexpr size_t largestSpareBytes = size_t{8} * 1024 * 1024;

}  // namespace

std::optional<PacketMemory::Share> PacketMemory::take(size_t bytes) {
  const std::lock_guard held(mutex_);
  if (bytes > maximum_bytes_ - taken_bytes_) return std::nullopt;
  taken_bytes_ += bytes;
  return Share(*this, bytes);
}

std::string PacketMemory::takeBuffer(size_t bytes) {
  std::string buffer;
  {
    const std::lock_guard held(mutex_);
    buffer.swap(spare_);
  }
  if (buffer.capacity() < bytes) buffer = std::string();  // before there are two of them
  buffer.reserve(bytes);
  return buffer;
}

void PacketMemory::giveBack(std::string buffer) {
  if (buffer.capacity() > largestSpareBytes) return;
  buffer.clear();
  const std::lock_guard held(mutex_);
  if (buffer.capacity() > spare_.capacity()) spare_.swap(buffer);
}

void PacketMemory::giveBack(size_t bytes) {
  const std::lock_guard held(mutex_);
  taken_bytes_ -= bytes;
}

}  // namespace vmqd
