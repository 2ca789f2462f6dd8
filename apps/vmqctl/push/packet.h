#pragma once
// The request packet of BinaryDataTransfer: one piece ("chunk") of a file, as an array of blocks.

#include <sys/uio.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>
#include <vector>

namespace vmqctl {

/// One packet after the other in the same memory, in the byte order of this machine. One thread.
class Packet {
 public:
  static constexpr const char* interfaceId = "d98cf2a5-2fae-4d68-b005-646ff83eed82";
  static constexpr unsigned operation = 0;
  static constexpr std::size_t maximumNameBytes = 255;
  static constexpr std::size_t blockBytes = 4096;
  /// A packet of one block.
  static constexpr std::size_t smallestBytes = 356 + 4 + blockBytes;

  /// Packets of at most so many bytes. REQUIRES: at least smallestBytes.
  explicit Packet(std::size_t maximumBytes);

  /// How many bytes of a file the largest packet holds.
  [[nodiscard]] std::size_t chunkBytes() const { return maximumBlocks_ * blockBytes; }

  /// Begins a packet. The bytes of the file are left for the caller to put into pieces().
  /// REQUIRES: name has at most maximumNameBytes, count is at most chunkBytes().
  void begin(std::string_view name, std::int32_t chunkNumber, std::size_t count);

  /// Where the bytes of the file go, in order; `count` bytes altogether. Valid until the next begin().
  [[nodiscard]] std::span<const iovec> pieces() const { return pieces_; }

  /// The whole packet. Valid until the next begin().
  [[nodiscard]] std::string_view bytes() const { return {memory_.get(), size_}; }

 private:
  const std::size_t maximumBlocks_;
  const std::unique_ptr<char[]> memory_;  // not cleared: small files touch only a little of it
  std::size_t size_ = 0;
  std::vector<iovec> pieces_;
};

}  // namespace vmqctl
