// How much memory the packets of all clients take.

#include "apps/vmqd/packet_memory.h"

namespace vmqd {

std::optional<PacketMemory::Share> PacketMemory::take(size_t bytes) {
  const std::lock_guard held(mutex_);
  if (bytes > maximum_bytes_ - taken_bytes_) return std::nullopt;
  taken_bytes_ += bytes;
  return Share(*this, bytes);
}

void PacketMemory::giveBack(size_t bytes) {
  const std::lock_guard held(mutex_);
  taken_bytes_ -= bytes;
}

}  // namespace vmqd
