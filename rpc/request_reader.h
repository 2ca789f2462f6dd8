#pragma once
// Takes the values out of a request packet, one after the other.

#include <cstddef>
#include <cstdint>

#include "rpc.h"

namespace VMQ {

/// Reads in the order of the packet, converting from the sender's representation. Raises rpc__fault_invalid_bound when
/// the packet ends before a value does. REQUIRES: rpc__marshalling is initialised, and a PFM1 frame.
class RequestReader {
 public:
  RequestReader(const rpc__packet& packet, const rpc__drep& sender);

  /// Skips to the next multiple of `bytes` from the packet's start.
  void align(size_t bytes);
  /// Characters, translated when the sender's are others.
  void takeText(char* text, size_t length);
  int32_t takeInt32();
  uint16_t takeUint16();
  /// Bytes as they are: nothing is converted. They stay in the packet.
  const unsigned char* take(size_t bytes);

  /// What has not been taken yet.
  [[nodiscard]] size_t remaining() const { return size_ - position_; }
  /// True when the sender writes as this machine does.
  [[nodiscard]] bool isLocal() const { return !swap_ && !translate_; }

 private:
  const unsigned char* const body_;
  const size_t size_;
  size_t position_ = 0;
  const bool swap_;
  const bool translate_;
};

}  // namespace VMQ
