#pragma once
// How much memory the packets of all clients take.

#include <cstddef>
#include <mutex>
#include <optional>
#include <string>
#include <utility>

namespace vmqd {

/// Any thread.
class PacketMemory {
 public:
  explicit PacketMemory(size_t maximum_bytes) : maximum_bytes_(maximum_bytes) {}

  /// One packet's part, given back when it goes.
  class Share {
   public:
    Share(PacketMemory& memory, size_t bytes) : memory_(&memory), bytes_(bytes) {}
    Share(const Share&) = delete;
    Share& operator=(const Share&) = delete;
    Share(Share&& other) noexcept : memory_(std::exchange(other.memory_, nullptr)), bytes_(other.bytes_) {}
    Share& operator=(Share&& other) noexcept {
      std::swap(memory_, other.memory_);
      std::swap(bytes_, other.bytes_);
      return *this;
    }
    ~Share() {
      if (memory_ != nullptr) memory_->giveBack(bytes_);
    }

   private:
    PacketMemory* memory_;
    size_t bytes_;
  };

  /// Nothing when there is no room for it now.
  [[nodiscard]] std::optional<Share> take(size_t bytes);

  /// An empty buffer with room for so many bytes: the spare one, or a new one. For who has taken them.
  [[nodiscard]] std::string takeBuffer(size_t bytes);
  /// Keeps one buffer, of 8 MiB at most, for the next packet: pages that are new from the system cost more than what is
  /// done with them.
  void giveBack(std::string buffer);

 private:
  void giveBack(size_t bytes);

  const size_t maximum_bytes_;
  std::mutex mutex_;
  size_t taken_bytes_ = 0;  // guarded by mutex_, like what follows
  std::string spare_;
};

}  // namespace vmqd
